#include "host/repository/unfinished.h"

#include "host/changes/staging.h"
#include "host/failure.h"
#include "host/text/characters.h"
#include "host/text/json_text.h"

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

Array arrayOf(SettledFiles const& files)
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

SettledFiles filesOf(Object const& document)
{
    SettledFiles files;
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

Object documentOf(CommitUnderWay const& work)
{
    Array contents;
    for (NewContent const& content : work.contents) {
        Object object;
        object[L"url"] = jsonText(content.url);
        object[L"digest"] = jsonText(content.digest);
        object[L"size"] = content.size;
        contents.emplace_back(std::move(object));
    }
    Object document;
    document[L"document"] = jsonText(work.document);
    document[L"contents"] = std::move(contents);
    document[L"files"] = arrayOf(work.files);
    return document;
}

Object documentOf(CheckoutUnderWay const& work)
{
    Object document;
    document[L"target"] = jsonText(work.target);
    document[L"branch"] = jsonText(work.branch);
    document[L"written"] = work.isWritten;
    Array begun;
    for (OdString const& target : work.begun) {
        begun.emplace_back(jsonText(target));
    }
    document[L"begun"] = std::move(begun);
    document[L"files"] = arrayOf(work.files);
    return document;
}

CommitUnderWay commitOf(Object const& document)
{
    CommitUnderWay work;
    work.document = textOf(document, L"document");
    for (Value const& element : common::getArrayValue(document, L"contents", L"")) {
        Object const& content = element.get_object();
        work.contents.push_back(
            {textOf(content, L"url"), textOf(content, L"digest"), common::getUInt64Value(content, L"size", L"")});
    }
    work.files = filesOf(document);
    return work;
}

CheckoutUnderWay moveOf(Object const& document)
{
    CheckoutUnderWay work{
        textOf(document, L"target"), textOf(document, L"branch"), common::getBoolValue(document, L"written", L"")};
    if (common::hasKey(document, L"begun")) {
        for (Value const& element : common::getArrayValue(document, L"begun", L"")) {
            std::wstring const& target = element.get_string();
            work.begun.push_back(withoutPairs(OdString(target.c_str(), target.size())));
        }
    }
    if (common::hasKey(document, L"files")) { // Earlier versions of tav did not note them.
        work.files = filesOf(document);
    }
    return work;
}

} // namespace

Unfinished unfinishedOf(LocalDatabase const& database)
{
    OdString const text = database.unfinished();
    if (text.isEmpty()) {
        return {};
    }
    try {
        Value document;
        kutils::json::read_string(document, text);
        Object const& object = document.get_object();
        if (common::hasKey(object, L"target")) {
            return moveOf(object);
        }
        return commitOf(object);
    } catch (std::exception const&) {
        throw Failure(
            "What an interrupted command noted in '" + database.path() + "' cannot be read.",
            "Put a copy of that file from a backup in its place.");
    }
}

void settle(SettledFiles const& files, common::State& state)
{
    std::vector<common::StagedFile> settled;
    for (auto const& [path, record] : files) {
        settled.emplace_back(path, common::FileChange::modified);
        if (record) {
            state.index.insert_or_assign(path, *record);
        } else {
            state.index.erase(path);
        }
    }
    unstage(settled, state);
}

void note(Unfinished const& work, LocalDatabase& database)
{
    Object document;
    if (auto const* const commit = std::get_if<CommitUnderWay>(&work)) {
        document = documentOf(*commit);
    } else if (auto const* const move = std::get_if<CheckoutUnderWay>(&work)) {
        document = documentOf(*move);
    } else {
        database.setUnfinished(OdString::kEmpty);
        return;
    }
    database.setUnfinished(compactText(std::move(document)));
}

} // namespace tav
