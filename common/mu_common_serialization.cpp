#include "common/mu_common_serialization.h"

#include "common/mu_common_json.h"
#include "common/mu_common_json_keys.h"
#include "common/mu_common_translate.h"

#include "json/json_reader.h"

#include <cmath>
#include <limits>
#include <string>
#include <utility>

namespace common {

using kutils::json::Array;
using kutils::json::Object;
using kutils::json::Value;
using kutils::json::Value_type;

namespace {

// Never destroyed, as those that documents share.
OdString const& s_author = *new OdString(L"author");
OdString const& s_date = *new OdString(L"date");
OdString const& s_message = *new OdString(L"message");
OdString const& s_files = *new OdString(L"files");
OdString const& s_commitNo = *new OdString(L"commitNo");
OdString const& s_commits = *new OdString(L"commits");
OdString const& s_refType = *new OdString(L"refType");
OdString const& s_name = *new OdString(L"name");
OdString const& s_id = *new OdString(L"id");
OdString const& s_repository = *new OdString(L"repository");
OdString const& s_commandVersion = *new OdString(L"commandVersion");

std::wstring wide(OdString const& text)
{
    return std::wstring(text.c_str(), text.getLength());
}

OdString stringOf(Object const& object, OdString const& key)
{
    return getStringValue(object, key, OdString::kEmpty);
}

ErrorMessage jsonErrorMessage(OdString const& what, OdString const& key)
{
    return ErrorMessage(translate(L"Could not parse %ls, missing \"%ls\""), what.c_str(), key.c_str());
}

/// Text that is no JSON leaves a null value, which then fails for its type.
Value parse(OdString const& text, Value_type expected)
{
    Value value;
    static_cast<void>(kutils::json::read_string(value, text));
    checkType(value, expected, OdString::kEmpty, OdString::kEmpty);
    return value;
}

template <class T>
T take(Expected<T>& expected)
{
    return std::move(expected).visit(GetRValueOrThrow<T>{});
}

/// Truncates toward zero. What does not fit becomes the nearest number that does; what is no number becomes 0.
std::int64_t toSeconds(double date)
{
    constexpr double kLimit = 9223372036854775808.0; // 2^63
    if (std::isnan(date)) {
        return 0;
    }
    if (date >= kLimit) {
        return std::numeric_limits<std::int64_t>::max();
    }
    return date < -kLimit ? std::numeric_limits<std::int64_t>::min() : static_cast<std::int64_t>(date);
}

Object commitFile(OdString const& path, OdString const& storagePath, OdString const& previousPath)
{
    Object object;
    object[wide(json::s_path)] = wide(path);
    object[wide(json::s_storage_path)] = wide(storagePath);
    if (!previousPath.isEmpty() && previousPath != path) {
        object[wide(json::s_previous_path)] = wide(previousPath);
    }
    return object;
}

OdString textOf(EType type)
{
    switch (type) {
    case EType::branch: return json::s_ref_branch_type;
    case EType::tag: return json::s_ref_tag_type;
    }
    return L"Unsupported reftype";
}

Object serializeReference(Reference const& reference)
{
    Object object;
    object[wide(s_refType)] = wide(textOf(reference.type));
    object[wide(json::s_ref_name)] = wide(reference.name);
    object[wide(json::s_commitHash)] = wide(reference.commitHash);
    return object;
}

OdString currentTime()
{
    OdString text;
    OdTimeStamp(OdTimeStamp::kInitUniversalTime).strftime(L"%Y-%m-%dT%H:%M:%SZ", text);
    return text;
}

} // namespace

Reference::Reference(
    OdString const& referenceName, OdString const& hash, EType kind, boost::optional<Annotation> const& note)
    : name(referenceName)
    , commitHash(hash)
    , type(kind)
    , annotation(note)
{
}

ParentInfo::ParentInfo(std::vector<OdString> const& hashes) : parents(hashes) {}

Commit::Commit(
    Annotation const& note, std::vector<ReceivedFile> receivedFiles, std::vector<OdString> const& parentHashes,
    OdString const& commitHash, int number)
    : annotation(note)
    , files(std::move(receivedFiles))
    , parents(parentHashes)
    , hash(commitHash)
    , commitNo(number)
{
}

Expected<EType> toType(OdString const& text)
{
    if (text == json::s_ref_branch_type) {
        return EType::branch;
    }
    if (text == json::s_ref_tag_type) {
        return EType::tag;
    }
    return ErrorMessage(L"Unsupported type: %ls", text.c_str());
}

Expected<Reference> deserializeReference(Object const& object)
{
    if (hasKey(object, json::s_annotation)) {
        Value const& annotation = getValue(object, json::s_annotation, OdString::kEmpty);
        if (annotation.type() == Value_type::object) {
            // Read for its types only: a received reference is never annotated.
            static_cast<void>(deserializeAnnotation(annotation.get_object()));
        }
    }
    if (!hasKey(object, json::s_commitHash)) {
        return ErrorMessage(translate(L"No commitHash found in reference."));
    }
    if (!hasKey(object, json::s_ref_name)) {
        return ErrorMessage(translate(L"No name found in reference."));
    }
    if (!hasKey(object, s_refType)) {
        return ErrorMessage(translate(L"No reference type found in reference."));
    }
    Expected<EType> const type = toType(stringOf(object, s_refType));
    if (!type.hasValue()) {
        return type.error();
    }
    OdString const name = stringOf(object, json::s_ref_name);
    return Reference(name, stringOf(object, json::s_commitHash), type.value());
}

Expected<std::vector<Reference>> deserializeReferences(OdString const& text)
{
    Value const document = parse(text, Value_type::array);
    return convertElements<Reference>(document.get_array(), deserializeReference);
}

Expected<RepoData> deserializeRepoData(Object const& object)
{
    if (!hasKey(object, s_name)) {
        return jsonErrorMessage(L"repo data", s_name);
    }
    if (!hasKey(object, s_id)) {
        return jsonErrorMessage(L"repo data", s_id);
    }
    OdString const name = stringOf(object, s_name);
    return RepoData{name, stringOf(object, s_id), OdString()};
}

Expected<RepoData> deserializeRepoData(OdString const& text)
{
    Value const document = parse(text, Value_type::object);
    return deserializeRepoData(document.get_object());
}

Expected<std::vector<RepoData>> deserializeRepoDatas(OdString const& text)
{
    Value const document = parse(text, Value_type::array);
    return convertElements<RepoData>(
        document.get_array(), [](Object const& object) { return deserializeRepoData(object); });
}

Expected<Annotation> deserializeAnnotation(Object const& object)
{
    if (!hasKey(object, s_author)) {
        return jsonErrorMessage(L"annotation", s_author);
    }
    Annotation annotation;
    if (hasKey(object, s_message)) {
        annotation.message = stringOf(object, s_message);
    }
    if (!hasKey(object, s_date)) {
        return jsonErrorMessage(L"annotation", s_date);
    }
    annotation.date.setPackedValue(toSeconds(getDoubleValue(object, s_date, OdString::kEmpty)));
    annotation.author = stringOf(object, s_author);
    return annotation;
}

Object serializeAnnotation(OdString const& author, OdString const& date, OdString const& message)
{
    Object object;
    object[wide(s_author)] = wide(author);
    object[wide(s_date)] = wide(date);
    object[wide(s_message)] = wide(message);
    return object;
}

Expected<std::vector<OdString>> deserializeParentHashes(Array const& array)
{
    std::vector<OdString> hashes;
    hashes.reserve(array.size());
    for (Value const& element : array) {
        if (element.type() != Value_type::string) {
            return ErrorMessage(
                translate(L"Could not parse parent hash, %ls type found."), toString(element.type()).c_str());
        }
        hashes.push_back(getStringValue(element));
    }
    return hashes;
}

Expected<ReceivedFile> deserializeRepoFile(Object const& object, std::vector<OdString> const& parentHashes)
{
    if (!hasKey(object, json::s_storage_path)) {
        return jsonErrorMessage(L"repo file", json::s_storage_path);
    }
    if (!hasKey(object, json::s_path)) {
        return jsonErrorMessage(L"repo file", json::s_path);
    }
    OdString const path = stringOf(object, json::s_path);
    VersionedFile current{path, stringOf(object, json::s_storage_path)};
    auto const previousPath = object.find(wide(json::s_previous_path));
    if (previousPath == object.end() || previousPath->second.type() == Value_type::null) {
        return ReceivedFile(std::move(current));
    }
    // The in-place construction empties both owners, deliberately: received files carry neither.
    return Expected<ReceivedFile>(
        std::in_place, std::move(current), std::make_unique<File>(File{getStringValue(previousPath->second)}),
        std::make_unique<ParentInfo>(parentHashes));
}

Expected<Commit> deserializeCommit(Object const& object)
{
    Expected<Annotation> const annotation =
        deserializeAnnotation(getObjectValue(object, json::s_annotation, OdString::kEmpty));
    if (!annotation.hasValue()) {
        return annotation.error();
    }
    Expected<std::vector<OdString>> parents(std::in_place);
    if (hasKey(object, json::s_parents)) {
        parents = deserializeParentHashes(getArrayValue(object, json::s_parents, OdString::kEmpty));
        if (!parents.hasValue()) {
            return parents.error();
        }
    }
    Expected<std::vector<ReceivedFile>> files =
        convertElements<ReceivedFile>(getArrayValue(object, s_files, OdString::kEmpty), [&](Object const& file) {
            return deserializeRepoFile(file, parents.value());
        });
    if (!files.hasValue()) {
        return files.error();
    }
    if (!hasKey(object, json::s_hash)) {
        return jsonErrorMessage(L"commit", json::s_hash);
    }
    if (!hasKey(object, s_commitNo)) {
        return jsonErrorMessage(L"commit", s_commitNo);
    }
    OdString const hash = stringOf(object, json::s_hash);
    int const commitNo = getIntValue(object, s_commitNo, OdString::kEmpty);
    return Commit(annotation.value(), take(files), parents.value(), hash, commitNo);
}

Object serializeCommit(
    std::vector<RepoFile> const& files, OdString const& author, OdString const& message, OdString const& hash,
    std::vector<OdString> const& parentHashes)
{
    Object object;
    object[wide(json::s_annotation)] = serializeAnnotation(author, currentTime(), message);
    object[wide(json::s_hash)] = wide(hash);
    Array fileObjects;
    fileObjects.reserve(files.size());
    for (RepoFile const& file : files) {
        fileObjects.emplace_back(
            commitFile(file.path, file.storagePath, file.base ? file.base->path : OdString::kEmpty));
    }
    object[wide(s_files)] = std::move(fileObjects);
    Array parents;
    parents.reserve(parentHashes.size());
    for (OdString const& parent : parentHashes) {
        parents.emplace_back(wide(parent));
    }
    object[wide(json::s_parents)] = std::move(parents);
    return object;
}

Value serializeCommitInfo(CommitInfo const& info)
{
    Array commits;
    commits.emplace_back(serializeCommit(info.files, info.author, info.message, info.hash, info.parents));
    Array references;
    references.reserve(info.references.size());
    for (Reference const& reference : info.references) {
        references.emplace_back(serializeReference(reference));
    }
    Object document;
    document[wide(s_commits)] = std::move(commits);
    document[wide(json::s_references)] = std::move(references);
    return Value(std::move(document));
}

Expected<FetchData> deserializeFetchData(Object const& object)
{
    if (!hasKey(object, s_repository)) {
        return jsonErrorMessage(L"fetch data", s_repository);
    }
    Expected<RepoData> const repository = deserializeRepoData(getObjectValue(object, s_repository, OdString::kEmpty));
    if (!repository.hasValue()) {
        return repository.error();
    }
    FetchData data{repository.value(), {}, {}};
    bool const hasCommits = hasKey(object, s_commits);
    if (!hasKey(object, json::s_references)) {
        if (hasCommits) {
            return jsonErrorMessage(L"fetch data", json::s_references);
        }
        return data;
    }
    auto references =
        convertElements<Reference>(getArrayValue(object, json::s_references, OdString::kEmpty), deserializeReference);
    if (!references.hasValue()) {
        return references.error();
    }
    data.references = take(references);
    if (hasCommits) {
        auto commits = convertElements<Commit>(getArrayValue(object, s_commits, OdString::kEmpty), deserializeCommit);
        if (!commits.hasValue()) {
            return commits.error();
        }
        data.commits = take(commits);
    }
    return data;
}

Expected<CommitNumberPair> deserializeCommitNumber(Object const& object)
{
    if (!hasKey(object, json::s_hash)) {
        return jsonErrorMessage(L"commit number", json::s_hash);
    }
    if (!hasKey(object, s_commitNo)) {
        return jsonErrorMessage(L"commit number", s_commitNo);
    }
    OdString const hash = stringOf(object, json::s_hash);
    return CommitNumberPair{hash, getIntValue(object, s_commitNo, OdString::kEmpty)};
}

Expected<std::vector<CommitNumberPair>> deserializeCommitNumbers(Array const& array)
{
    return convertElements<CommitNumberPair>(array, deserializeCommitNumber);
}

Expected<OdString> deserializeInitData(Object const& object)
{
    if (!hasKey(object, s_id)) {
        return jsonErrorMessage(L"init data", s_id);
    }
    return stringOf(object, s_id);
}

Expected<OdString> deserializeServerVersion(OdString const& text)
{
    Value const document = parse(text, Value_type::object);
    if (!hasKey(document.get_object(), s_commandVersion)) {
        return jsonErrorMessage(L"server version", s_commandVersion);
    }
    return stringOf(document.get_object(), s_commandVersion);
}

} // namespace common
