#include "common/mu_common_state_document.h"

#include "common/mu_common_document.h"
#include "common/mu_common_json.h"
#include "common/mu_common_json_keys.h"
#include "common/mu_common_translate.h"

#include "json/json_parser.h"
#include "json/json_writer.h"

#include <string>
#include <string_view>
#include <utility>

namespace common {

using Generator = kutils::json::detail::Generator<kutils::json::Value, std::wostringstream>;
using kutils::json::Array;
using kutils::json::Object;
using kutils::json::Value;
using kutils::json::Value_type;

namespace {

// Never destroyed: documents are also written at the very end of the process.
OdString const& s_staged_file_change = *new OdString(L"file_change");
OdString const& s_index_map = *new OdString(L"index");
OdString const& s_index_map_path = *new OdString(L"path");
OdString const& s_index_map_data = *new OdString(L"data");
OdString const& s_index_map_last_checked = *new OdString(L"last_checked");
OdString const& s_index_map_modified = *new OdString(L"modified");

std::wstring wide(OdString const& text)
{
    return std::wstring(text.c_str(), text.getLength());
}

OdString toOdString(std::wstring const& text)
{
    return OdString(text.c_str(), text.size());
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

Object serializeHead(State const& state)
{
    Object head;
    head[wide(json::s_reference)] = wide(state.head);
    if (state.headCommit) {
        head[wide(json::s_commit)] = *state.headCommit;
    }
    return head;
}

std::wstring_view view(OdString const& text)
{
    return {text.c_str(), text.getLength()};
}

void writeIndex(std::map<OdString, IndexData> const& index, Generator& out)
{
    out.begin_array();
    for (auto const& [path, data] : index) {
        out.element();
        out.begin_object();
        out.key(view(s_index_map_data));
        out.begin_object();
        out.key(view(s_index_map_last_checked));
        out.value(data.lastChecked);
        out.key(view(s_index_map_modified));
        out.value(data.modified);
        out.end();
        out.key(view(s_index_map_path));
        out.value(view(path));
        out.end();
    }
    out.end();
}

// The members in the order of their names.
void writeState(State const& state, Array stagedFiles, Generator& out)
{
    out.begin_object();
    out.key(view(json::s_head));
    out.value(serializeHead(state));
    if (!state.index.empty()) {
        out.key(view(s_index_map));
        writeIndex(state.index, out);
    }
    if (!state.renames.empty()) {
        out.key(view(json::s_renames));
        out.value(toJson(state.renames, serializeRename));
    }
    if (!stagedFiles.empty()) {
        out.key(view(json::s_staged_files));
        out.value(std::move(stagedFiles));
    }
    out.end();
}

/// About how long the text of `state` will be, as if nothing had to be escaped.
std::size_t expectedLength(State const& state)
{
    constexpr std::size_t kAroundRecord = 200; // and around a rename or a staged file, less
    std::size_t length = kAroundRecord * (state.index.size() + state.renames.size() + state.stagedFiles.size());
    for (auto const& [path, data] : state.index) {
        length += path.getLength();
    }
    for (auto const& [path, previous] : state.renames) {
        length += path.getLength() + previous.getLength();
    }
    for (StagedFile const& file : state.stagedFiles) {
        length += file.path.getLength();
    }
    return length;
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

std::pair<OdString, IndexData> deserializeIndexEntry(Object const& object)
{
    Object const& record = getObjectValue(object, s_index_map_data, OdString::kEmpty);
    OdString path = getStringValue(object, s_index_map_path, OdString::kEmpty);
    IndexData data;
    // Written unsigned, read signed: beyond 63 bits the number is a negative one on its way, and its bits come back.
    data.lastChecked = static_cast<std::uint64_t>(getInt64Value(record, s_index_map_last_checked, OdString::kEmpty));
    data.modified = getBoolValue(record, s_index_map_modified, OdString::kEmpty);
    return {std::move(path), data};
}

using kutils::json::detail::Token_kind;
using Tokens = kutils::json::detail::Element_sink::Tokens;

bool isNext(Tokens& tokens, Token_kind kind)
{
    return tokens.nextToken().kind == kind;
}

bool isMemberNext(Tokens& tokens, OdString const& key)
{
    auto const& token = tokens.nextToken();
    return token.kind == Token_kind::string && token.text == view(key) && isNext(tokens, Token_kind::colon);
}

bool readLastChecked(Tokens& tokens, IndexData& data)
{
    auto const& token = tokens.nextToken();
    data.lastChecked = token.number;
    return token.kind == Token_kind::unsigned_integer || token.kind == Token_kind::signed_integer;
}

bool readModified(Tokens& tokens, IndexData& data)
{
    Token_kind const kind = tokens.nextToken().kind;
    data.modified = kind == Token_kind::true_value;
    return data.modified || kind == Token_kind::false_value;
}

bool readPath(Tokens& tokens, OdString& path)
{
    auto const& token = tokens.nextToken();
    path = toOdString(token.text);
    return token.kind == Token_kind::string;
}

/// Makes the index while the document is read: there are as many records as files in the working folder, and all of
/// them as values at one time would need four times the memory and most of the time.
class IndexReader final : public kutils::json::detail::Element_sink {
public:
    bool begin(std::wstring const& key) override
    {
        if (key != wide(s_index_map)) {
            return false;
        }
        index_.clear();
        error_ = std::nullopt;
        return true;
    }

    /// A record as it is written, its members in order.
    bool take(Tokens& tokens) override
    {
        IndexData data;
        OdString path;
        bool const isUsual = isMemberNext(tokens, s_index_map_data) && isNext(tokens, Token_kind::open_object) &&
                             isMemberNext(tokens, s_index_map_last_checked) && readLastChecked(tokens, data) &&
                             isNext(tokens, Token_kind::comma) && isMemberNext(tokens, s_index_map_modified) &&
                             readModified(tokens, data) && isNext(tokens, Token_kind::close_object) &&
                             isNext(tokens, Token_kind::comma) && isMemberNext(tokens, s_index_map_path) &&
                             readPath(tokens, path) && isNext(tokens, Token_kind::close_object);
        if (isUsual) {
            add(std::move(path), data);
        }
        return isUsual;
    }

    void take(Value element) override
    {
        try {
            if (element.type() != Value_type::object) {
                fail(composeMessage(element, Value_type::object, L"parsing json map."));
            } else {
                auto [path, data] = deserializeIndexEntry(element.get_object());
                add(std::move(path), data);
            }
        } catch (OdError const& error) {
            fail(ErrorMessage(error.description()));
        }
    }

    /// The index, or what is wrong with the first record that is not as it should be.
    Expected<std::map<OdString, IndexData>> result()
    {
        if (error_) {
            return *error_;
        }
        return std::move(index_);
    }

private:
    /// Of several records of one path the first counts. Written ones are in ascending order, so the end is the hint.
    void add(OdString path, IndexData data) { index_.emplace_hint(index_.end(), std::move(path), data); }

    void fail(ErrorMessage error)
    {
        if (!error_) {
            error_ = std::move(error);
        }
    }

    std::map<OdString, IndexData> index_;
    std::optional<ErrorMessage> error_;
};

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

/// `index` has got the elements of the member of that name.
Expected<State> deserializeState(Object& root, IndexReader& index)
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
        getArrayValue(root, s_index_map, OdString::kEmpty);
        error = take(index.result(), state.index);
    }
    if (error) {
        return *error;
    }
    return state;
}

} // namespace

Expected<State> readState(OdString const& path)
{
    IndexReader index;
    Value document = readDocument(path, index);
    return deserializeState(document.get_object(), index);
}

/// The index is most of a large state: its text is written straight from it, without a value between the two.
Expected<std::wstring> textOf(State const& state)
{
    Expected<Array> stagedFiles = toJson(state.stagedFiles, serializeStagedFile);
    if (!stagedFiles.hasValue()) {
        return stagedFiles.error();
    }
    return kutils::json::detail::write_pieces(expectedLength(state), true, [&](Generator& out) {
        writeState(state, std::move(stagedFiles).visit(GetRValueOrThrow<Array>{}), out);
    });
}

} // namespace common
