#include "host/protocol/commit_document.h"

#include "host/errors/failure.h"
#include "host/history/commit_hash.h"
#include "host/protocol/document.h"
#include "host/protocol/members.h"
#include "host/text/characters.h"
#include "host/text/json_text.h"

#include "common/mu_common_json_keys.h"
#include "platform/sdk/OdTimeStamp.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <memory>
#include <utility>

namespace tav {

namespace {

namespace keys = common::json;

constexpr std::size_t kHashLength = 64;
constexpr wchar_t const* kExpected = L"expected";
constexpr std::size_t kLongestName = 255;

bool isDigit(wchar_t c)
{
    return c >= L'0' && c <= L'9';
}

bool isHex(wchar_t c)
{
    return isDigit(c) || (c >= L'a' && c <= L'f') || (c >= L'A' && c <= L'F');
}

template <class Predicate>
bool all(OdString const& text, Predicate const& predicate)
{
    wchar_t const* const begin = text.c_str();
    return std::all_of(begin, begin + text.getLength(), predicate);
}

bool contains(OdString const& text, wchar_t const* part)
{
    return std::wstring_view(text.c_str(), text.getLength()).find(part) != std::wstring_view::npos;
}

bool beginsWith(OdString const& text, OdString const& beginning)
{
    return text.getLength() >= beginning.getLength() &&
           std::equal(beginning.c_str(), beginning.c_str() + beginning.getLength(), text.c_str());
}

bool isEdge(OdString const& name, wchar_t c)
{
    return name.getAt(0) == c || name.getAt(name.getLength() - 1) == c;
}

/// What is wrong with a name that people read; null when nothing is.
char const* faultOfName(OdString const& name)
{
    if (name.isEmpty()) {
        return "is empty";
    }
    if (name.ansi_str().size() > kLongestName) {
        return "is longer than 255 bytes";
    }
    if (!all(name, [](wchar_t c) { return !isControl(c); })) {
        return "holds a control character";
    }
    if (!isSound(name)) {
        return "holds half a character";
    }
    return isEdge(name, L' ') ? "begins or ends with a blank" : nullptr;
}

char const* faultOfReferenceName(OdString const& name)
{
    if (char const* const fault = faultOfName(name)) {
        return fault;
    }
    if (name.getAt(0) == L'-') {
        return "begins with a dash";
    }
    if (isEdge(name, L'/')) {
        return "begins or ends with a slash";
    }
    if (contains(name, L"..")) {
        return "holds two dots in a row";
    }
    if (all(name, isDigit)) {
        return "could be taken for the number of a commit";
    }
    return name.getLength() == kHashLength && all(name, isHex) ? "could be taken for the hash of a commit" : nullptr;
}

std::int64_t readDate(Part const& part)
{
    auto const seconds = secondsOf(part.text());
    if (!seconds) {
        part.refuse("must be a time such as '2024-03-05T14:07:09Z'");
    }
    return *seconds;
}

FileRecord readFile(Part const& part)
{
    FileRecord file;
    file.path = readPath(part.member(keys::s_path.c_str()));
    file.url = readUrl(part.member(keys::s_storage_path.c_str()));
    if (auto const previous = part.optionalMember(keys::s_previous_path.c_str())) {
        OdString const path = readPath(*previous);
        file.previousPath = path == file.path ? OdString() : path;
    }
    return file;
}

/// Sorts '/' before every other character, so that the content of a folder follows the folder at once.
bool isBeforeInTree(FileRecord const* a, FileRecord const* b)
{
    auto const rank = [](wchar_t c) { return c == L'/' ? L'\0' : c; };
    return std::lexicographical_compare(
        a->path.c_str(), a->path.c_str() + a->path.getLength(), b->path.c_str(), b->path.c_str() + b->path.getLength(),
        [rank](wchar_t c, wchar_t d) { return rank(c) < rank(d); });
}

void checkTree(Part const& part, std::vector<FileRecord> const& files)
{
    std::vector<FileRecord const*> sorted;
    sorted.reserve(files.size());
    for (FileRecord const& file : files) {
        sorted.push_back(&file);
    }
    std::sort(sorted.begin(), sorted.end(), isBeforeInTree);
    for (std::size_t i = 1; i < sorted.size(); ++i) {
        OdString const& before = sorted[i - 1]->path;
        if (before == sorted[i]->path) {
            part.refuse("must not hold the path " + quoted(before) + " twice");
        }
        if (beginsWith(sorted[i]->path, before + L"/")) {
            part.refuse("must not hold " + quoted(before) + " both as a file and as a folder");
        }
    }
}

std::vector<FileRecord> readFiles(Part const& part)
{
    std::vector<FileRecord> files;
    std::size_t const count = part.size();
    files.reserve(count);
    for (std::size_t i = 0; i < count; ++i) {
        files.push_back(readFile(part[i]));
    }
    checkTree(part, files);
    return files;
}

CommitRecord readCommit(Part const& part)
{
    CommitRecord commit;
    commit.hash = readHash(part.member(keys::s_hash.c_str()));
    Part const annotation = part.member(keys::s_annotation.c_str());
    commit.author = annotation.member(L"author").soundText();
    commit.message = annotation.member(L"message").soundText();
    commit.date = readDate(annotation.member(L"date"));
    commit.parents = readParents(part.member(keys::s_parents.c_str()));
    if (std::count(commit.parents.begin(), commit.parents.end(), commit.hash) > 0) {
        part.refuse("must not be its own parent");
    }
    return commit;
}

common::EType readType(Part const& part)
{
    auto const type = common::toType(part.text());
    if (!type.hasValue()) {
        part.refuse("must be 'branch' or 'tag'");
    }
    return type.value();
}

OdString readReferenceName(Part const& part)
{
    OdString name = part.text();
    if (char const* const fault = faultOfReferenceName(name)) {
        part.refuse(fault);
    }
    return name;
}

/// An empty text, or a hash.
std::optional<OdString> readExpected(Part const& part)
{
    auto const expected = part.optionalMember(kExpected);
    if (!expected || expected->text().isEmpty()) {
        return expected ? std::optional(OdString()) : std::nullopt;
    }
    return readHash(*expected);
}

ReferenceChange readReference(Part const& part)
{
    common::Reference const reference(
        readReferenceName(part.member(keys::s_ref_name.c_str())), readHash(part.member(keys::s_commitHash.c_str())),
        readType(part.member(L"refType")));
    return {reference, readExpected(part)};
}

void checkNames(Part const& part, std::vector<ReferenceChange> const& changes)
{
    std::vector<OdString> names;
    names.reserve(changes.size());
    for (ReferenceChange const& change : changes) {
        names.push_back(change.reference.name);
    }
    std::sort(names.begin(), names.end());
    auto const twice = std::adjacent_find(names.begin(), names.end());
    if (twice != names.end()) {
        part.refuse("must not hold the name " + quoted(*twice) + " twice");
    }
}

std::vector<ReferenceChange> readReferences(Part const& part)
{
    std::vector<ReferenceChange> references;
    std::size_t const count = part.size();
    for (std::size_t i = 0; i < count; ++i) {
        references.push_back(readReference(part[i]));
    }
    checkNames(part, references);
    return references;
}

constexpr std::array<int, 12> kDaysBefore = {0, 31, 59, 90, 120, 151, 181, 212, 243, 273, 304, 334};

bool isLeap(int year)
{
    return (year % 4 == 0 && year % 100 != 0) || year % 400 == 0;
}

int daysIn(int year, int month)
{
    constexpr std::array<int, 12> kDays = {31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
    return kDays[static_cast<std::size_t>(month - 1)] + (month == 2 && isLeap(year) ? 1 : 0);
}

/// Days from 0000-01-01 to the day.
std::int64_t dayNumber(int year, int month, int day)
{
    int const leapDays = year == 0 ? 0 : (year - 1) / 4 - (year - 1) / 100 + (year - 1) / 400 + 1;
    int const leapDay = month > 2 && isLeap(year) ? 1 : 0;
    return std::int64_t{365} * year + leapDays + kDaysBefore[static_cast<std::size_t>(month - 1)] + leapDay + day - 1;
}

int numberAt(OdString const& text, std::size_t first, std::size_t count)
{
    int number = 0;
    for (std::size_t i = first; i < first + count; ++i) {
        number = number * 10 + (text.getAt(i) - L'0');
    }
    return number;
}

bool hasFormOfTime(OdString const& text)
{
    constexpr std::wstring_view kForm = L"0000-00-00T00:00:00Z";
    wchar_t const* const begin = text.c_str();
    return text.getLength() == kForm.size() &&
           std::equal(kForm.begin(), kForm.end(), begin, [](wchar_t form, wchar_t c) {
               return form == L'0' ? isDigit(c) : form == c;
           });
}

OdString timeText(std::int64_t seconds)
{
    OdTimeStamp time;
    time.setPackedValue(seconds);
    OdString text;
    time.strftime(L"%Y-%m-%dT%H:%M:%SZ", text);
    return text;
}

kutils::json::Array referenceArray(std::vector<ReferenceChange> const& changes)
{
    kutils::json::Array array;
    for (ReferenceChange const& change : changes) {
        kutils::json::Object object;
        object[keys::s_commitHash.c_str()] = jsonText(change.reference.commitHash);
        object[keys::s_ref_name.c_str()] = jsonText(change.reference.name);
        object[L"refType"] = change.reference.type == common::EType::branch ? L"branch" : L"tag";
        if (change.expected) {
            object[kExpected] = jsonText(*change.expected);
        }
        array.emplace_back(std::move(object));
    }
    return array;
}

common::RepoFile recorded(FileRecord const& file)
{
    if (file.previousPath.isEmpty()) {
        return {withPairs(file.path), file.url};
    }
    return {withPairs(file.path), file.url, std::make_unique<common::BaseFile>(withPairs(file.previousPath))};
}

} // namespace

OdString commitInfoDocument(NewCommit const& commit)
{
    common::CommitInfo info;
    for (FileRecord const& file : commit.files) {
        info.files.push_back(recorded(file));
    }
    info.parents = commit.commit.parents;
    info.hash = commit.commit.hash;
    info.author = withPairs(commit.commit.author);
    info.message = withPairs(commit.commit.message);
    kutils::json::Value document = common::serializeCommitInfo(info);
    kutils::json::Object& whole = document.get_object();
    kutils::json::Object& only = whole[L"commits"].get_array().front().get_object();
    only[keys::s_annotation.c_str()].get_object()[L"date"] = jsonText(timeText(commit.commit.date));
    whole[keys::s_references.c_str()] = referenceArray(commit.references);
    return compactText(document);
}

void requireHash(NewCommit const& commit)
{
    OdString const hash = commitHash(commit.commit, commit.files);
    if (hash != commit.commit.hash) {
        throw Failure(
            "'commits[0].hash' is " + quoted(commit.commit.hash) + ", but what is in the commit gives " + quoted(hash) +
                ".",
            kNothingChanged);
    }
}

OdString referenceChanges(std::vector<ReferenceChange> const& changes)
{
    return compactText(referenceArray(changes));
}

NewCommit readCommitInfo(OdString const& document)
{
    kutils::json::Value const value = parsed(document);
    Part const whole(value);
    Part const commits = whole.member(L"commits");
    if (commits.size() != 1) {
        commits.refuse("must hold one commit, not " + std::to_string(commits.size()));
    }
    Part const commit = commits[0];
    NewCommit result;
    result.commit = readCommit(commit);
    result.files = readFiles(commit.member(L"files"));
    result.references = readReferences(whole.member(keys::s_references.c_str()));
    return result;
}

std::vector<ReferenceChange> readReferences(OdString const& document)
{
    kutils::json::Value const value = parsed(document);
    return readReferences(Part(value));
}

std::int64_t readLastNumber(OdString const& document)
{
    std::int64_t last = 0;
    for (CommitNumber const& pair : readNumbers(document)) {
        last = std::max(last, pair.number);
    }
    return last;
}

std::vector<CommitNumber> readNumbers(OdString const& document)
{
    kutils::json::Value const value = parsed(document);
    Part const whole(value);
    std::size_t const count = whole.size();
    std::vector<CommitNumber> numbers;
    numbers.reserve(count);
    for (std::size_t i = 0; i < count; ++i) {
        Part const pair = whole[i];
        OdString hash = pair.member(keys::s_hash.c_str()).text();
        numbers.push_back({pair.member(L"commitNo").integer(), std::move(hash)});
    }
    return numbers;
}

OdString readRepositoryName(OdString const& document)
{
    kutils::json::Value const value = parsed(document);
    Part const whole(value);
    Part const part = whole.member(keys::s_ref_name.c_str());
    OdString name = part.text();
    if (char const* const fault = faultOfName(name)) {
        part.refuse(fault);
    }
    return name;
}

std::optional<std::int64_t> secondsOf(OdString const& time)
{
    if (!hasFormOfTime(time)) {
        return std::nullopt;
    }
    int const year = numberAt(time, 0, 4);
    int const month = numberAt(time, 5, 2);
    int const day = numberAt(time, 8, 2);
    int const hour = numberAt(time, 11, 2);
    int const minute = numberAt(time, 14, 2);
    int const second = numberAt(time, 17, 2);
    bool const isDay = month >= 1 && month <= 12 && day >= 1 && day <= daysIn(year, month);
    if (!isDay || hour > 23 || minute > 59 || second > 59) {
        return std::nullopt;
    }
    std::int64_t const days = dayNumber(year, month, day) - dayNumber(1970, 1, 1);
    return ((days * 24 + hour) * 60 + minute) * 60 + second;
}

std::optional<std::string> whyNoReferenceName(OdString const& name)
{
    char const* const fault = faultOfReferenceName(name);
    return fault ? std::optional<std::string>(fault) : std::nullopt;
}

} // namespace tav
