#include "common/mu_common_document.h"

#include "common/mu_common_json.h"
#include "common/mu_common_translate.h"

#include "platform/ut/TextFile.h"
#include "platform/ut/text.h"
#include "json/json_parser.h"
#include "json/json_reader.h"
#include "json/json_writer.h"

#include <string>

namespace common {

namespace {

void check(bool isRead, kutils::json::Value const& document)
{
    if (!isRead) {
        throw OdError(translate(L"Unable to parse json, please check if syntax is valid"));
    }
    checkType(document, kutils::json::Value_type::object, OdString::kEmpty, OdString::kEmpty);
}

} // namespace

kutils::json::Value readDocument(OdString const& path)
{
    kutils::json::Value document;
    check(kutils::json::read_string(document, ut::readEntireFile(path)), document);
    return document;
}

kutils::json::Value readDocument(OdString const& path, kutils::json::detail::Element_sink& sink)
{
    kutils::json::Value document;
    check(kutils::json::detail::read_string(document, ut::readEntireFile(path), sink), document);
    return document;
}

WriteOutcome writeDocument(OdString const& path, kutils::json::Value const& document)
{
    return writeText(path, kutils::json::write_string(document, true));
}

WriteOutcome writeText(OdString const& path, std::wstring const& text)
{
    ut::TextFile file(path);
    file.addLine(OdString(text.c_str(), text.size()));
    if (!file.write()) {
        return ErrorMessage(translate(L"Error writing to file '%ls'"), path.c_str());
    }
    return WriteOutcome(std::in_place);
}

} // namespace common
