#include "host/repository/earlier_journal.h"

#include "host/errors/failure.h"
#include "host/text/characters.h"

#include "common/mu_common_json.h"
#include "json/json_reader.h"

#include <exception>

namespace tav {

namespace {

using kutils::json::Object;
using kutils::json::Value;

OdString textOf(Object const& object, OdString const& key)
{
    return withoutPairs(common::getStringValue(object, key, OdString::kEmpty));
}

IndexUpdates filesOf(Object const& document)
{
    IndexUpdates files;
    for (Value const& element : common::getArrayValue(document, L"files", L"")) {
        Object const& file = element.get_object();
        std::optional<common::IndexData> record;
        if (common::hasKey(file, L"time")) {
            record = {common::getUInt64Value(file, L"time", L""), common::getBoolValue(file, L"modified", L"")};
        }
        files.emplace(textOf(file, L"path"), record);
    }
    return files;
}

PendingCommit commitOf(Object const& document)
{
    PendingCommit pending;
    pending.document = textOf(document, L"document");
    for (Value const& element : common::getArrayValue(document, L"contents", L"")) {
        Object const& content = element.get_object();
        pending.contents.push_back(
            {textOf(content, L"url"), digestFromHex(textOf(content, L"digest").ansi_str()).value(),
             common::getUInt64Value(content, L"size", L"")});
    }
    pending.files = filesOf(document);
    return pending;
}

PendingCheckout checkoutOf(Object const& document)
{
    PendingCheckout pending{
        textOf(document, L"target"), textOf(document, L"branch"), common::getBoolValue(document, L"written", L"")};
    if (common::hasKey(document, L"begun")) {
        for (Value const& element : common::getArrayValue(document, L"begun", L"")) {
            std::wstring const& target = element.get_string();
            pending.begun.push_back(withoutPairs(OdString(target.c_str(), target.size())));
        }
    }
    if (common::hasKey(document, L"files")) { // Earlier versions of tav did not write them.
        pending.files = filesOf(document);
    }
    return pending;
}

} // namespace

PendingOperation readEarlierJournal(OdString const& text, std::string const& database)
{
    try {
        Value document;
        kutils::json::read_string(document, text);
        Object const& object = document.get_object();
        if (common::hasKey(object, L"target")) {
            return checkoutOf(object);
        }
        return commitOf(object);
    } catch (std::exception const&) {
        throw Failure(
            "What an interrupted command noted in '" + database + "' cannot be read.",
            "Put a copy of that file from a backup in its place.");
    }
}

} // namespace tav
