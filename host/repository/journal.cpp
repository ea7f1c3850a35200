#include "host/repository/journal.h"

#include "host/errors/failure.h"
#include "host/repository/lock.h"
#include "host/text/characters.h"
#include "host/text/json_text.h"
#include "host/text/utf8.h"

#include "common/mu_common_json.h"
#include "json/json_reader.h"

#include <string>

namespace tav {

namespace {

using kutils::json::Array;
using kutils::json::Object;
using kutils::json::Value;

OdString textOf(Object const& object, OdString const& key)
{
    return withoutPairs(common::getStringValue(object, key, OdString::kEmpty));
}

Array arrayOf(IndexUpdates const& files)
{
    Array array;
    for (auto const& [path, record] : files) {
        Object object;
        object[L"path"] = jsonText(path);
        if (record) {
            object[L"time"] = record->lastChecked;
            object[L"modified"] = record->modified;
        }
        array.emplace_back(std::move(object));
    }
    return array;
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

Object documentOf(PendingCommit const& pending)
{
    Array contents;
    for (NewContent const& content : pending.contents) {
        Object object;
        object[L"url"] = jsonText(content.url);
        object[L"digest"] = jsonText(fromUtf8(hexOf(content.digest)));
        object[L"size"] = content.size;
        contents.emplace_back(std::move(object));
    }
    Object document;
    document[L"document"] = jsonText(pending.document);
    document[L"contents"] = std::move(contents);
    document[L"files"] = arrayOf(pending.files);
    return document;
}

Object documentOf(PendingCheckout const& pending)
{
    Object document;
    document[L"target"] = jsonText(pending.target);
    document[L"branch"] = jsonText(pending.branch);
    document[L"written"] = pending.isWritten;
    Array begun;
    for (OdString const& target : pending.begun) {
        begun.emplace_back(jsonText(target));
    }
    document[L"begun"] = std::move(begun);
    document[L"files"] = arrayOf(pending.files);
    return document;
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

std::string commandOf(PendingCheckout const& checkout, LocalDatabase const& database)
{
    auto const branch = database.commits().reference(checkout.branch);
    bool const isBranch = branch && branch->commitHash == checkout.target;
    auto const commit = database.commits().find(checkout.target);
    return isBranch ? "tav switch " + checkout.branch.ansi_str()
                    : "tav checkout " + (commit ? std::to_string(commit->number) : checkout.target.ansi_str());
}

} // namespace

PendingOperation readJournal(LocalDatabase const& database)
{
    OdString const text = database.journal();
    if (text.isEmpty()) {
        return {};
    }
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
            "What an interrupted command noted in '" + database.path() + "' cannot be read.",
            "Put a copy of that file from a backup in its place.");
    }
}

void writeJournal(PendingCommit const& commit, LocalDatabase& database)
{
    database.setJournal(compactText(documentOf(commit)));
}

void writeJournal(PendingCheckout const& checkout, LocalDatabase& database)
{
    database.setJournal(compactText(documentOf(checkout)));
}

void clearJournal(LocalDatabase& database)
{
    database.setJournal(OdString::kEmpty);
}

std::string describe(PendingCheckout const& checkout, LocalDatabase const& database)
{
    return "'" + commandOf(checkout, database) + "' was interrupted: the working folder holds files of two commits.";
}

std::string pendingNotice(common::RootPath const& root, LocalDatabase const& database)
{
    OdString const journal = database.journal();
    if (journal.isEmpty()) {
        return {};
    }
    if (std::string const holder = lockHolder(root); !holder.empty()) {
        return holder + ", is changing the repository.";
    }
    if (database.journal() != journal) { // It has ended meanwhile.
        return {};
    }
    PendingOperation const pending = readJournal(database);
    if (std::holds_alternative<PendingCommit>(pending)) {
        return "A commit was interrupted. The next command that changes something completes it.";
    }
    auto const* const checkout = std::get_if<PendingCheckout>(&pending);
    return checkout && !checkout->isWritten ? describe(*checkout, database) + " Run it again to complete it."
                                            : std::string();
}

} // namespace tav
