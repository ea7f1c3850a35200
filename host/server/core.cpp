#include "host/server/core.h"

#include "host/history/tree.h"
#include "host/protocol/content_document.h"
#include "host/protocol/document.h"
#include "host/protocol/fetch_document.h"
#include "host/protocol/refusal.h"
#include "host/server/content_cleaning.h"
#include "host/server/content_requests.h"
#include "host/server/history_answers.h"
#include "host/server/reference_rules.h"
#include "host/server/uploads.h"
#include "host/storage/storage_error.h"
#include "host/storage/storage_url.h"
#include "host/text/characters.h"
#include "host/text/json_text.h"
#include "host/text/utf8.h"

#include "common/mu_common_json_keys.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <exception>
#include <iomanip>
#include <new>
#include <random>
#include <sstream>
#include <utility>

namespace tav {

namespace {

using kutils::json::Array;
using kutils::json::Object;
using kutils::json::Value;

namespace keys = common::json;

constexpr wchar_t const* kCommandVersion = L"1";
constexpr std::size_t kChangesOfAPage = 10'000;

struct Request {
    Stores& stores;
    HistoryStore& history;
    Repository repository; ///< as far as the request names one
    OdString const& document;
};

Value numbersDocument(std::vector<CommitNumber> const& commits)
{
    Array pairs;
    pairs.reserve(commits.size());
    for (CommitNumber const& commit : commits) {
        Object pair;
        pair[L"commitNo"] = commit.number;
        pair[keys::s_hash.c_str()] = jsonText(commit.hash);
        pairs.emplace_back(std::move(pair));
    }
    return pairs;
}

OdString answerVersion(Request const&)
{
    Object version;
    version[L"commandVersion"] = kCommandVersion;
    version[L"features"] = Array{L"contents"};
    return compactText(version);
}

/// 128 bits that no other repository has.
OdString newIdentifier()
{
    std::random_device random;
    std::ostringstream digits;
    digits << std::hex << std::setfill('0');
    for (int i = 0; i < 4; ++i) {
        digits << std::setw(8) << random();
    }
    return fromUtf8(digits.str());
}

OdString answerInit(Request const& request)
{
    NewRepository const wanted = readNewRepository(request.document);
    Repository const added{wanted.id.isEmpty() ? newIdentifier() : wanted.id, wanted.name};
    if (!request.history.add(added)) {
        throw refusal(
            ServerError::referenceExists, "The server has a repository " + quoted(added.id) + " already.",
            kNothingChanged);
    }
    Object answer;
    answer[L"id"] = jsonText(added.id);
    return compactText(answer);
}

OdString answerRepositories(Request const& request)
{
    Array repositories;
    for (Repository const& repository : request.history.repositories()) {
        repositories.push_back(repositoryDocument(repository.id, repository.name));
    }
    return compactText(repositories);
}

/// What the commit changes against its first parent. Parents never change, so others need not wait for this.
std::vector<FileRecord> changesOf(Request const& request, NewCommit const& added)
{
    auto const history = request.history.read(request.repository.id);
    requireParents(*history, added);
    std::vector<OdString> const& parents = added.commit.parents;
    return changesBetween(parents.empty() ? Tree() : history->files(parents.front()), added.files);
}

std::vector<Digest> digestsOf(std::vector<FileRecord> const& changes)
{
    std::vector<Digest> digests;
    for (FileRecord const& change : changes) {
        if (!change.url.isEmpty()) {
            digests.push_back(*digestOf(change.url));
        }
    }
    return digests;
}

/// Adds the commit unless an earlier request, whose answer may have been lost, has done so. Returns whether it did.
bool addUnlessThere(HistoryTransaction& history, NewCommit& added, std::vector<FileRecord> const& changes)
{
    CommitRecord& commit = added.commit;
    if (auto const there = history.find(commit.hash)) {
        commit.number = there->number;
        return false;
    }
    requireParents(history, added);
    commit.number = history.lastNumber() + 1;
    history.add(commit, changes);
    history.await(history.name(digestsOf(changes)));
    return true;
}

OdString answerCommit(Request const& request, Force force)
{
    NewCommit added = readCommitInfo(request.document);
    requireHash(added);
    bool const isThere = request.history.read(request.repository.id)->find(added.commit.hash).has_value();
    std::vector<FileRecord> const changes = isThere ? std::vector<FileRecord>() : changesOf(request, added);
    auto const history = request.history.write(request.repository.id);
    bool const isNew = addUnlessThere(*history, added, changes);
    for (ReferenceChange const& reference : added.references) {
        if (isNew || force == Force::yes || !hasPassed(*history, reference.reference, added.commit.hash)) {
            setReference(*history, reference, force);
        }
    }
    history->commit();
    return compactText(numbersDocument({{added.commit.number, added.commit.hash}}));
}

void setReferences(Request const& request, std::vector<ReferenceChange> const& wanted, Force force)
{
    auto const history = request.history.write(request.repository.id);
    for (ReferenceChange reference : wanted) {
        if (force == Force::no && !reference.expected) {
            reference.expected = OdString(); // Who does not say what is there does not know of it.
        }
        setReference(*history, reference, force);
    }
    history->commit();
}

OdString answerReferences(Request const& request, Force force)
{
    std::vector<ReferenceChange> const wanted = readReferences(request.document);
    if (!wanted.empty()) { // Who only asks does not wait for those who write.
        setReferences(request, wanted, force);
    }
    return compactText(referencesDocument(request.history.read(request.repository.id)->references()));
}

/// Notes that all there is behind the number `known` is handed out.
void noteDelivered(Request const& request, std::int64_t known)
{
    std::int64_t const last = request.history.read(request.repository.id)->lastNumber();
    if (last > known) {
        request.history.noteDelivered(request.repository.id, last);
    }
}

OdString answerFetch(Request const& request)
{
    std::int64_t const known = readLastNumber(request.document);
    noteDelivered(request, known);
    return fetchAnswer(request.repository, *request.history.read(request.repository.id), known);
}

OdString answerNumbers(Request const& request)
{
    std::int64_t const first = readLastNumber(request.document);
    return compactText(numbersDocument(request.history.read(request.repository.id)->numbersFrom(first)));
}

OdString answerHistory(Request const& request)
{
    std::int64_t const known = readLastNumber(request.document);
    noteDelivered(request, known);
    return historyPage(*request.history.read(request.repository.id), known, kChangesOfAPage);
}

OdString answerMissing(Request const& request)
{
    return missingAnswer(missingOf(request.stores, request.repository.id, readOffer(request.document)));
}

OdString answerUpload(Request const& request)
{
    return uploadsAnswer(beginUploads(request.stores, request.repository.id, readAnnouncement(request.document)));
}

OdString answerFinish(Request const& request)
{
    finishUploads(request.stores, request.repository.id, readSentUploads(request.document));
    return doneAnswer();
}

OdString answerLocate(Request const& request)
{
    return locatedAnswer(located(request.stores, request.repository.id, readWanted(request.document)));
}

OdString answerClean(Request const& request)
{
    Freed const freed = cleanContents(request.stores, request.repository.id);
    Object answer;
    answer[L"bytes"] = freed.bytes;
    answer[L"contents"] = static_cast<std::uint64_t>(freed.contents);
    return compactText(answer);
}

template <Force force>
OdString answerCommit(Request const& request)
{
    return answerCommit(request, force);
}

template <Force force>
OdString answerReferences(Request const& request)
{
    return answerReferences(request, force);
}

struct Verb {
    wchar_t const* name;
    bool namesRepository;
    OdString (*answer)(Request const& request);
};

constexpr std::array kVerbs = {
    Verb{L"version", false, answerVersion},
    Verb{L"init", false, answerInit},
    Verb{L"repositories", false, answerRepositories},
    Verb{L"commit", true, answerCommit<Force::no>},
    Verb{L"force-commit", true, answerCommit<Force::yes>},
    Verb{L"references", true, answerReferences<Force::no>},
    Verb{L"force-references", true, answerReferences<Force::yes>},
    Verb{L"fetch", true, answerFetch},
    Verb{L"numbers", true, answerNumbers},
    Verb{L"history", true, answerHistory},
    Verb{L"missing", true, answerMissing},
    Verb{L"upload", true, answerUpload},
    Verb{L"finish", true, answerFinish},
    Verb{L"locate", true, answerLocate},
    Verb{L"clean", true, answerClean},
};

/// The verb and, behind its first blank, the repository; that is empty when there is none.
std::pair<OdString, OdString> splitRequest(OdString const& request)
{
    wchar_t const* const begin = request.c_str();
    auto const length = static_cast<std::size_t>(std::find(begin, begin + request.getLength(), L' ') - begin);
    return {request.left(length), request.mid(length + 1)};
}

Verb const& verbOrFail(OdString const& name, OdString const& repository)
{
    auto const* const verb =
        std::find_if(kVerbs.begin(), kVerbs.end(), [&](Verb const& candidate) { return name == candidate.name; });
    if (verb == kVerbs.end()) {
        throw refusal(
            ServerError::badDocument, "The server does not know the request " + quoted(name) + ".", kNothingChanged);
    }
    if (verb->namesRepository == repository.isEmpty()) {
        std::string const fault = verb->namesRepository ? " must name a repository." : " does not take a repository.";
        throw refusal(ServerError::badDocument, "The request " + quoted(name) + fault, kNothingChanged);
    }
    return *verb;
}

Repository repositoryOrFail(HistoryStore& history, OdString const& id)
{
    auto const found = history.find(id);
    if (!found) {
        throw refusal(ServerError::noRepository, "The server has no repository " + quoted(id) + ".", kNothingChanged);
    }
    return *found;
}

ErrorMessage messageOf(std::string const& text, std::int32_t code = 0)
{
    ErrorMessage message(fromUtf8(text));
    message.code = code;
    return message;
}

/// What is out of reach has one code, whatever the system calls it.
std::int32_t codeOf(std::int32_t code)
{
    switch (code) {
    case ENOSPC: return static_cast<std::int32_t>(ServerError::diskFull);
    case EBUSY: return static_cast<std::int32_t>(ServerError::busy);
    default: return code;
    }
}

} // namespace

OdString ServerCore::answer(OdString const& request, OdString const& document)
{
    auto const [name, id] = splitRequest(request);
    Verb const& verb = verbOrFail(name, id);
    Repository const repository = verb.namesRepository ? repositoryOrFail(stores_.history, id) : Repository();
    return verb.answer({stores_, stores_.history, repository, document});
}

void ServerCore::send(
    OdString const& repository, UploadName const& upload, std::uint64_t offset, std::string_view bytes)
{
    repositoryOrFail(stores_.history, repository);
    continueUpload(stores_, repository, upload, offset, bytes);
}

void ServerCore::receive(
    OdString const& repository, OdString const& record, std::uint64_t offset,
    std::function<bool(std::string_view)> const& sink)
{
    repositoryOrFail(stores_.history, repository);
    auto const digest = digestFromHex(record.ansi_str());
    if (!digest) {
        throw refusal(ServerError::badDocument, quoted(record) + " is not the digest of a record.", kNothingChanged);
    }
    sendRecord(stores_, repository, *digest, offset, sink);
}

ErrorMessage errorOf(std::exception_ptr const& thrown)
{
    try {
        std::rethrow_exception(thrown);
    } catch (Failure const& failure) {
        return messageOf(failure.what + " " + failure.next, codeOf(failure.code));
    } catch (StorageError const& error) {
        return messageOf(error.what + " " + kNothingChanged, codeOf(error.code));
    } catch (std::bad_alloc const&) {
        return messageOf(std::string("There is not enough memory for the request. ") + kNothingChanged);
    } catch (std::exception const& error) {
        return messageOf(std::string("The server failed: ") + error.what() + ". " + kNothingChanged);
    }
}

} // namespace tav
