/// Reading a state file as it is described, without regard to time and memory: what the library's reader is compared
/// with.
#pragma once

#include "common/mu_common_json.h"
#include "common/mu_common_json_keys.h"
#include "common/mu_common_state.h"

#include "json/json_reader.h"

#include <map>
#include <utility>
#include <vector>

namespace plain {

using common::IndexData;
using common::StagedFile;
using common::State;
using kutils::json::Object;
using kutils::json::Value;
using kutils::json::Value_type;

template <class T>
T valueOf(Expected<T> converted)
{
    if (!converted.hasValue()) {
        throw OdError(converted.error().message);
    }
    return std::move(converted).value();
}

inline Expected<StagedFile> stagedFile(Object const& object)
{
    common::FileChange const change =
        valueOf(common::toFileChange(common::getStringValue(object, L"file_change", L"")));
    return StagedFile(common::getStringValue(object, common::json::s_path, L""), change);
}

inline std::pair<OdString, OdString> rename(Object object)
{
    OdString const newPath = common::getStringValue(object, common::json::s_new_name, L"");
    return {newPath, common::getStringValue(object, common::json::s_previous_name, L"")};
}

inline std::pair<OdString, IndexData> indexRecord(Object object)
{
    Object const& data = common::getObjectValue(object, L"data", L"");
    OdString const path = common::getStringValue(object, L"path", L"");
    auto const lastChecked = static_cast<std::uint64_t>(common::getInt64Value(data, L"last_checked", L""));
    return {path, IndexData{lastChecked, common::getBoolValue(data, L"modified", L"")}};
}

inline void readHead(Object const& root, State& state)
{
    if (!common::hasKey(root, common::json::s_head)) {
        throw OdError(L"State does not contain HEAD.");
    }
    Object const& head = common::getObjectValue(root, common::json::s_head, L"");
    if (!common::hasKey(head, common::json::s_reference)) {
        throw OdError(L"HEAD does not point to a branch");
    }
    state.head = common::getStringValue(head, common::json::s_reference, L"");
    if (common::hasKey(head, common::json::s_commit)) {
        state.headCommit = common::getUInt64Value(head, common::json::s_head, L"");
    }
}

/// The state of the document `text`; throws `OdError` with the message that loading it must end with.
inline State readState(OdString const& text)
{
    Value document;
    if (!kutils::json::read_string(document, text)) {
        throw OdError(L"Unable to parse json, please check if syntax is valid");
    }
    common::checkType(document, Value_type::object, L"", L"");
    Object const& root = document.get_object();
    State state;
    readHead(root, state);
    if (common::hasKey(root, L"staged_files")) {
        state.stagedFiles =
            valueOf(common::fromJsonVector(common::getArrayValue(root, L"staged_files", L""), stagedFile));
    }
    if (common::hasKey(root, L"renames")) {
        state.renames = valueOf(common::fromJsonMap(common::getArrayValue(root, L"renames", L""), rename));
    }
    if (common::hasKey(root, L"index")) {
        state.index = valueOf(common::fromJsonMap(common::getArrayValue(root, L"index", L""), indexRecord));
    }
    return state;
}

} // namespace plain
