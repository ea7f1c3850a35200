#include "common/mu_common_state.h"

#include "common/mu_common_document.h"
#include "common/mu_common_json.h"
#include "common/mu_common_json_keys.h"
#include "common/mu_common_translate.h"

#include <string>
#include <utility>

namespace common {

using kutils::json::Array;
using kutils::json::Object;
using kutils::json::Value;
using kutils::json::Value_type;

namespace {

OdString const s_staged_file_change = L"file_change";
OdString const s_index_map = L"index";
OdString const s_index_map_path = L"path";
OdString const s_index_map_data = L"data";
OdString const s_index_map_last_checked = L"last_checked";
OdString const s_index_map_modified = L"modified";

std::wstring wide(OdString const& text)
{
    return std::wstring(text.c_str(), text.getLength());
}

Expected<Object> serializeStagedFile(StagedFile const& file)
{
    Expected<OdString> const change = toString(file.change);
    if (!change.hasValue()) {
        return change.error();
    }
    Object object;
    object[wide(json::s_path)] = wide(file.path);
    object[wide(s_staged_file_change)] = wide(change.value());
    return object;
}

Object serializeRename(OdString const& newPath, OdString const& previousPath)
{
    Object object;
    object[wide(json::s_new_name)] = wide(newPath);
    object[wide(json::s_previous_name)] = wide(previousPath);
    return object;
}

Object serializeIndexEntry(OdString const& path, IndexData const& data)
{
    Object record;
    record[wide(s_index_map_last_checked)] = data.lastChecked;
    record[wide(s_index_map_modified)] = data.modified;
    Object object;
    object[wide(s_index_map_path)] = wide(path);
    object[wide(s_index_map_data)] = std::move(record);
    return object;
}

Object serializeHead(State const& state)
{
    Object head;
    head[wide(json::s_reference)] = wide(state.head);
    if (state.headCommit) {
        head[wide(json::s_commit)] = *state.headCommit;
    }
    return head;
}

Expected<Value> serializeState(State const& state)
{
    Object root;
    root[wide(json::s_head)] = serializeHead(state);
    if (!state.stagedFiles.empty()) {
        Expected<Array> stagedFiles = toJson(state.stagedFiles, serializeStagedFile);
        if (!stagedFiles.hasValue()) {
            return stagedFiles.error();
        }
        root[wide(json::s_staged_files)] = std::move(stagedFiles).visit(GetRValueOrThrow<Array>{});
    }
    if (!state.renames.empty()) {
        root[wide(json::s_renames)] = toJson(state.renames, serializeRename);
    }
    if (!state.index.empty()) {
        root[wide(s_index_map)] = toJson(state.index, serializeIndexEntry);
    }
    return Value(std::move(root));
}

Expected<StagedFile> deserializeStagedFile(Object const& object)
{
    Expected<FileChange> const change = toFileChange(getStringValue(object, s_staged_file_change, OdString::kEmpty));
    if (!change.hasValue()) {
        return change.error();
    }
    return StagedFile(getStringValue(object, json::s_path, OdString::kEmpty), change.value());
}

std::pair<OdString, OdString> deserializeRename(Object object)
{
    OdString newPath = getStringValue(object, json::s_new_name, OdString::kEmpty);
    return {std::move(newPath), getStringValue(object, json::s_previous_name, OdString::kEmpty)};
}

std::pair<OdString, IndexData> deserializeIndexEntry(Object object)
{
    Object const& record = getObjectValue(object, s_index_map_data, OdString::kEmpty);
    OdString path = getStringValue(object, s_index_map_path, OdString::kEmpty);
    IndexData data;
    // Written unsigned, read signed: beyond 63 bits the number is a negative one on its way, and its bits come back.
    data.lastChecked = static_cast<std::uint64_t>(getInt64Value(record, s_index_map_last_checked, OdString::kEmpty));
    data.modified = getBoolValue(record, s_index_map_modified, OdString::kEmpty);
    return {std::move(path), data};
}

/// The member's array, taken out of the object: a state of a large repository is not copied on its way.
Array takeArray(Object& object, OdString const& key)
{
    checkType(getValue(object, key, OdString::kEmpty), Value_type::array, OdString::kEmpty, key);
    return std::move(object.find(wide(key))->second.get_array());
}

/// Puts the converted member into `target`; gives the error when there is one.
template <class T>
std::optional<ErrorMessage> take(Expected<T> converted, T& target)
{
    if (!converted.hasValue()) {
        return converted.error();
    }
    target = std::move(converted).visit(GetRValueOrThrow<T>{});
    return std::nullopt;
}

std::optional<ErrorMessage> deserializeHead(Object const& root, State& state)
{
    if (!hasKey(root, json::s_head)) {
        return ErrorMessage(translate(L"State does not contain HEAD."));
    }
    Object const& head = getObjectValue(root, json::s_head, OdString::kEmpty);
    if (!hasKey(head, json::s_reference)) {
        return ErrorMessage(translate(L"HEAD does not point to a branch"));
    }
    state.head = getStringValue(head, json::s_reference, OdString::kEmpty);
    if (hasKey(head, json::s_commit)) {
        // Looked up under another name than it is written with, deliberately: such a document is refused.
        state.headCommit = getUInt64Value(head, json::s_head, OdString::kEmpty);
    }
    return std::nullopt;
}

Expected<State> deserializeState(Object& root)
{
    State state;
    std::optional<ErrorMessage> error = deserializeHead(root, state);
    if (!error && hasKey(root, json::s_staged_files)) {
        error = take(fromJsonVector(takeArray(root, json::s_staged_files), deserializeStagedFile), state.stagedFiles);
    }
    if (!error && hasKey(root, json::s_renames)) {
        error = take(fromJsonMap(takeArray(root, json::s_renames), deserializeRename), state.renames);
    }
    if (!error && hasKey(root, s_index_map)) {
        error = take(fromJsonMap(takeArray(root, s_index_map), deserializeIndexEntry), state.index);
    }
    if (error) {
        return *error;
    }
    return state;
}

} // namespace

Cache::Cache(RootPath const& root, State state, IoInterface const& io)
    : dirty_(false)
    , state_(std::move(state))
    , stateFile_(root.statePath())
    , io_(&io)
{
}

Cache::Cache(RootPath const& root, IoInterface const& io) : dirty_(true), stateFile_(root.statePath()), io_(&io) {}

Cache::~Cache()
{
    if (dirty_) {
        io_->report(save());
    }
}

Expected<std::shared_ptr<Cache>> Cache::get(RootPath const& root, IoInterface const& io)
{
    ut::FileName const file(root.statePath());
    if (!file.exists(ut::FileName::kAnyKind)) {
        return ErrorMessage(translate(L"No state file found at %ls"), file.getFullPath().c_str());
    }
    try {
        Value document = readDocument(file.getFullPath());
        Expected<State> state = deserializeState(document.get_object());
        if (!state.hasValue()) {
            return state.error();
        }
        return std::make_shared<Cache>(root, std::move(state).visit(GetRValueOrThrow<State>{}), io);
    } catch (OdError const& error) {
        return ErrorMessage(error.description());
    }
}

void Cache::create(RootPath const& root, IoInterface const& io)
{
    if (!ut::FileName(root.statePath()).exists(ut::FileName::kAnyKind)) {
        Cache const fresh(root, io);
    }
}

State& Cache::write()
{
    dirty_ = true;
    return state_;
}

Transaction Cache::getTransaction()
{
    return Transaction(*this);
}

WriteOutcome Cache::save() const
{
    try {
        Expected<Value> const document = serializeState(state_);
        return document.hasValue() ? writeDocument(stateFile_.getFullPath(), document.value())
                                   : WriteOutcome(document.error());
    } catch (...) {
        return ErrorMessage(translate(L"An unexpected error occurred while deserializing the state file."));
    }
}

Transaction::Transaction(Cache& cache) : cache_(cache), snapshot_(cache.state_) {}

Transaction::~Transaction()
{
    if (!committed_) {
        cache_.dirty_ = true;
        std::swap(cache_.state_, snapshot_);
    }
}

std::uint64_t modifyTime(OdString const& path, RootPath const& root)
{
    ut::DateTime modification;
    ut::FileName(root.pathTo(path)).getTimes(nullptr, &modification, nullptr);
    return static_cast<std::uint64_t>(modification.getTicks());
}

void updateIndex(OdString const& path, Cache& cache, RootPath const& root)
{
    std::uint64_t const time = modifyTime(path, root);
    cache.write().index[path] = IndexData{time, false};
}

void updateIndex(Cache& cache, RootPath const& root)
{
    for (StagedFile const& file : cache.read().stagedFiles) {
        if (file.change == FileChange::removed) {
            removeIndex(file.path, cache);
        } else {
            updateIndex(file.path, cache, root);
        }
    }
}

void removeIndex(OdString const& path, Cache& cache)
{
    cache.write().index.erase(path);
}

std::map<OdString, IndexData>::iterator
openForWrite(std::map<OdString, IndexData>::const_iterator const& position, Cache& cache)
{
    return cache.write().index.erase(position, position); // Erases nothing: the standard way to lift the const.
}

} // namespace common
