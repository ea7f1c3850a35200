#include "common/mu_common_document.h"

#include "common/mu_common_json.h"
#include "common/mu_common_translate.h"

#include "platform/ut/TextFile.h"
#include "platform/ut/text.h"
#include "json/json_reader.h"
#include "json/json_writer.h"

#include <string>

namespace common {

namespace {

OdString textOf(kutils::json::Value const& document)
{
    std::wstring const text = kutils::json::write_string(document, true);
    return OdString(text.c_str(), text.size());
}

} // namespace

kutils::json::Value readDocument(OdString const& path)
{
    kutils::json::Value document;
    if (!kutils::json::read_string(document, ut::readEntireFile(path))) {
        throw OdError(translate(L"Unable to parse json, please check if syntax is valid"));
    }
    checkType(document, kutils::json::Value_type::object, OdString::kEmpty, OdString::kEmpty);
    return document;
}

WriteOutcome writeDocument(OdString const& path, kutils::json::Value const& document)
{
    ut::TextFile file(path);
    file.create();
    file.addLine(textOf(document));
    if (!file.write()) {
        return ErrorMessage(translate(L"Error writing to file '%ls'"), path.c_str());
    }
    return WriteOutcome(std::in_place);
}

} // namespace common
