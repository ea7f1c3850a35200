#include "host/server/embedded_server.h"

#include "host/errors/failure.h"
#include "host/protocol/commit_document.h"
#include "host/protocol/document.h"
#include "host/protocol/fetch_document.h"
#include "host/protocol/history_document.h"
#include "host/text/characters.h"
#include "host/text/json_text.h"
#include "host/text/utf8.h"

#include "common/mu_common_json_keys.h"
#include "platform/os/os_files.h"
#include "platform/ut/FileName.h"

#include <algorithm>
#include <array>
#include <exception>
#include <new>
#include <utility>

namespace tav {

namespace {

using kutils::json::Array;
using kutils::json::Object;
using kutils::json::Value;

namespace keys = common::json;

constexpr std::int64_t kTablesVersion = 2;
constexpr std::int64_t kFirstWithDelivered = 2;
constexpr wchar_t const* kCommandVersion = L"1";
constexpr mode_t kFolderPermissions = 0777;
constexpr std::size_t kChangesOfAPage = 10'000;
constexpr char const* kFetchFirst = "Merge what others have done, or send it as a branch of its own.";

struct Repository {
    std::int64_t key = 0;
    OdString id;
    OdString name;
};

/// Whether a rule that protects what others have is in force.
enum class Force { no, yes };

/// Up to which number commits have been handed out, of each repository: nobody but who made them has those behind it.
constexpr char const* kDelivered = "CREATE TABLE delivered (repository INTEGER PRIMARY KEY, number INTEGER NOT NULL)";

void createTables(Database& database)
{
    database.run(kDelivered);
    database.run("CREATE TABLE repositories (key INTEGER PRIMARY KEY, id TEXT NOT NULL UNIQUE, name TEXT NOT NULL)");
    CommitTables::create(database);
    database.setVersion(kTablesVersion);
}

/// Two processes may find the file new at the same time: the one that comes second looks again.
void prepareTables(Database& database)
{
    if (database.version() == 0) {
        WriteTransaction transaction(database);
        if (database.version() == 0) {
            createTables(database);
        }
        transaction.commit();
    }
    if (database.version() > kTablesVersion) {
        throw Failure(
            "The database '" + database.path() + "' was made by a newer tav.",
            "Install that one, or name another folder for the server.");
    }
}

/// Brings tables that an earlier tav made to the form of this one; that handed out all that there was. Part of a
/// `WriteTransaction` of the caller: who only reads a server may not be allowed to change it.
void upgrade(Database& database)
{
    if (database.version() < kFirstWithDelivered) {
        database.run(kDelivered);
        database.run("INSERT INTO delivered SELECT repository, max(number) FROM commits GROUP BY repository");
        database.setVersion(kTablesVersion);
    }
}

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

Failure withCode(Failure failure, ServerError code)
{
    failure.code = static_cast<std::int32_t>(code);
    return failure;
}

Repository repositoryOrFail(Database const& database, OdString const& id)
{
    Statement row = database.prepare("SELECT key, name FROM repositories WHERE id = ?");
    if (!row.with(id).next()) {
        throw withCode(
            Failure("The server has no repository " + quoted(id) + ".", kNothingChanged), ServerError::noRepository);
    }
    return {row.integer(0), id, row.text(1)};
}

/// Whether all references that there are move with the commit, and are known to whoever moves them.
bool movesAll(NewCommit const& added, CommitTables const& tables)
{
    auto const isMoved = [&](common::Reference const& there) {
        auto const isIt = [&](ReferenceChange const& change) {
            return change.reference.name == there.name && change.expected == there.commitHash;
        };
        return std::any_of(added.references.begin(), added.references.end(), isIt);
    };
    auto const references = tables.references();
    return std::all_of(references.begin(), references.end(), isMoved);
}

void requireParents(CommitTables const& tables, NewCommit const& added)
{
    for (OdString const& parent : added.commit.parents) {
        if (!tables.find(parent)) {
            throw Failure("The server does not have the parent commit " + quoted(parent) + ".", kNothingChanged);
        }
    }
    if (added.commit.parents.empty() && !movesAll(added, tables)) {
        throw withCode(
            Failure("The repository has commits already; one without a parent would not follow them.", kFetchFirst),
            ServerError::hasMovedOn);
    }
}

/// Adds the commit unless an earlier request, whose answer may have been lost, has done so. Returns whether it did.
bool addUnlessThere(CommitTables& tables, NewCommit& added)
{
    if (auto const there = tables.find(added.commit.hash)) {
        added.commit.number = there->number;
        return false;
    }
    requireParents(tables, added);
    added.commit.number = tables.lastNumber() + 1;
    tables.add(added.commit, added.files);
    return true;
}

void requireSameType(common::Reference const& there, common::Reference const& wanted)
{
    if (there.type != wanted.type) {
        std::string const kind = there.type == common::EType::tag ? "a tag" : "a branch";
        throw Failure(quoted(wanted.name) + " is the name of " + kind + " already.", "Choose another name.");
    }
}

void requireForward(CommitTables const& tables, common::Reference const& there, common::Reference const& wanted)
{
    if (wanted.type == common::EType::tag) {
        throw Failure("The tag " + quoted(wanted.name) + " names another commit already.", "Choose another name.");
    }
    if (!tables.isBefore(there.commitHash, wanted.commitHash)) {
        throw withCode(
            Failure(
                "The branch " + quoted(wanted.name) + " has commits that the new one does not follow.", kFetchFirst),
            ServerError::hasMovedOn);
    }
}

/// One that names the wanted commit already is as good: an earlier request, whose answer was lost, may have done it.
void requireExpected(std::optional<common::Reference> const& there, ReferenceChange const& change)
{
    OdString const now = there ? there->commitHash : OdString();
    if (!change.expected || now == *change.expected || now == change.reference.commitHash) {
        return;
    }
    std::string const kind = change.reference.type == common::EType::tag ? "tag " : "branch ";
    std::string const name = kind + quoted(change.reference.name);
    if (change.expected->isEmpty()) {
        throw Failure("There is a " + name + " already.", "Choose another name.");
    }
    throw withCode(
        Failure("The " + name + " now names a different commit.", "Fetch what others have done, and try again."),
        ServerError::hasMovedOn);
}

struct Request {
    Database& database;
    Repository repository; ///< as far as the request names one
    OdString const& document;
};

std::int64_t deliveredNumber(Request const& request)
{
    Statement row = request.database.prepare("SELECT number FROM delivered WHERE repository = ?");
    return row.with(request.repository.key).next() ? row.integer(0) : 0;
}

/// Why the branch `there` may not leave these commits behind, as the ends of a sentence.
std::vector<std::string> hindrances(
    Request const& request, CommitTables const& tables, common::Reference const& there,
    std::vector<CommitNumber> const& left)
{
    std::vector<std::string> reasons;
    for (common::Reference const& other : tables.references()) {
        auto const isNamed = [&](CommitNumber const& commit) { return tables.isBefore(commit.hash, other.commitHash); };
        if (other.name != there.name && std::any_of(left.begin(), left.end(), isNamed)) {
            reasons.push_back(quoted(other.name) + " has it");
        }
    }
    if (left.front().number <= deliveredNumber(request)) {
        reasons.emplace_back("it may be in other working folders");
    }
    return reasons;
}

/// A branch goes back, or aside, only while that takes no commit away from anybody.
void requireLeavable(
    Request const& request, CommitTables const& tables, common::Reference const& there, OdString const& to)
{
    std::vector<CommitNumber> const left = tables.between(there.commitHash, to);
    std::string reasons;
    for (std::string const& reason :
         left.empty() ? std::vector<std::string>() : hindrances(request, tables, there, left)) {
        reasons += (reasons.empty() ? "" : ", and ") + reason;
    }
    if (!reasons.empty()) {
        throw Failure(
            "Commit " + std::to_string(left.front().number) + " cannot be taken back: " + reasons + ".",
            "Make another commit that puts things right.");
    }
}

void removeReference(Request const& request, CommitTables& tables, ReferenceChange const& change, Force force)
{
    auto const there = tables.reference(change.reference.name);
    if (!there) {
        return;
    }
    requireSameType(*there, change.reference);
    requireExpected(there, change);
    if (force == Force::no) {
        requireLeavable(request, tables, *there, OdString());
    }
    tables.removeReference(there->name);
}

void setReference(Request const& request, CommitTables& tables, ReferenceChange const& change, Force force)
{
    common::Reference const& wanted = change.reference;
    if (wanted.commitHash.isEmpty()) {
        removeReference(request, tables, change, force);
        return;
    }
    if (!tables.find(wanted.commitHash)) {
        throw Failure(
            "The server does not have the commit " + quoted(wanted.commitHash) + " of " + quoted(wanted.name) + ".",
            kNothingChanged);
    }
    auto const there = tables.reference(wanted.name);
    if (there) {
        requireSameType(*there, wanted);
    }
    requireExpected(there, change);
    if (there && force == Force::no && there->commitHash != wanted.commitHash) {
        if (change.expected && wanted.type == common::EType::branch) {
            requireLeavable(request, tables, *there, wanted.commitHash);
        } else {
            requireForward(tables, *there, wanted);
        }
    }
    tables.set(wanted);
}

/// Whether the branch went past the commit since an earlier request that added it and moved the branch there.
bool hasPassed(CommitTables const& tables, common::Reference const& branch, OdString const& hash)
{
    auto const there = tables.reference(branch.name);
    return there && there->type == branch.type && branch.type == common::EType::branch && branch.commitHash == hash &&
           tables.isBefore(hash, there->commitHash);
}

OdString answerVersion(Request const&)
{
    Object version;
    version[L"commandVersion"] = kCommandVersion;
    return compactText(version);
}

void requireFree(Database const& database, OdString const& id)
{
    Statement row = database.prepare("SELECT 1 FROM repositories WHERE id = ?");
    if (row.with(id).next()) {
        throw Failure("The server has a repository " + quoted(id) + " already.", kNothingChanged);
    }
}

OdString answerInit(Request const& request)
{
    NewRepository const wanted = readNewRepository(request.document);
    WriteTransaction transaction(request.database);
    requireFree(request.database, wanted.id);
    Statement addRepository = request.database.prepare(
        "INSERT INTO repositories(id, name) VALUES (coalesce(nullif(?, ''), lower(hex(randomblob(16)))), ?)");
    addRepository.with(wanted.id).with(wanted.name).run();
    Statement row = request.database.prepare("SELECT id FROM repositories WHERE key = last_insert_rowid()");
    Object answer;
    answer[L"id"] = jsonText(row.next() ? row.text(0) : OdString());
    row.reset();
    transaction.commit();
    return compactText(answer);
}

OdString answerRepositories(Request const& request)
{
    Statement rows = request.database.prepare("SELECT id, name FROM repositories ORDER BY key");
    Array repositories;
    while (rows.next()) {
        repositories.push_back(repositoryDocument(rows.text(0), rows.text(1)));
    }
    return compactText(repositories);
}

OdString answerCommit(Request const& request, Force force)
{
    NewCommit added = readCommitInfo(request.document);
    requireHash(added);
    CommitTables tables(request.database, request.repository.key);
    WriteTransaction transaction(request.database);
    upgrade(request.database);
    bool const isNew = addUnlessThere(tables, added);
    for (ReferenceChange const& reference : added.references) {
        if (isNew || force == Force::yes || !hasPassed(tables, reference.reference, added.commit.hash)) {
            setReference(request, tables, reference, force);
        }
    }
    transaction.commit();
    return compactText(numbersDocument({{added.commit.number, added.commit.hash}}));
}

OdString answerReferences(Request const& request, Force force)
{
    std::vector<ReferenceChange> wanted = readReferences(request.document);
    CommitTables tables(request.database, request.repository.key);
    if (!wanted.empty()) { // Who only asks does not wait for those who write.
        WriteTransaction transaction(request.database);
        upgrade(request.database);
        for (ReferenceChange& reference : wanted) {
            if (force == Force::no && !reference.expected) {
                reference.expected = OdString(); // Who does not say what is there does not know of it.
            }
            setReference(request, tables, reference, force);
        }
        transaction.commit();
    }
    return compactText(referencesDocument(tables.references()));
}

/// That it cannot be noted is no reason to hand nothing out: no commit is lost by that.
void noteDelivered(Request const& request, CommitTables const& tables, std::int64_t known)
{
    std::int64_t const last = tables.lastNumber();
    bool const isToNote =
        last > known && request.database.version() >= kFirstWithDelivered && last > deliveredNumber(request);
    if (!isToNote) {
        return;
    }
    try {
        WriteTransaction transaction(request.database);
        Statement row = request.database.prepare("INSERT OR REPLACE INTO delivered VALUES (?, ?)");
        row.with(request.repository.key).with(last).run();
        transaction.commit();
    } catch (Failure const&) {
    }
}

OdString answerFetch(Request const& request)
{
    std::int64_t const known = readLastNumber(request.document);
    CommitTables const tables(request.database, request.repository.key);
    noteDelivered(request, tables, known);
    return fetchDocument(repositoryDocument(request.repository.id, request.repository.name), tables, known);
}

OdString answerNumbers(Request const& request)
{
    std::int64_t const first = readLastNumber(request.document);
    return compactText(numbersDocument(CommitTables(request.database, request.repository.key).numbersFrom(first)));
}

OdString answerHistory(Request const& request)
{
    std::int64_t const known = readLastNumber(request.document);
    CommitTables const tables(request.database, request.repository.key);
    noteDelivered(request, tables, known);
    return historyPage(tables, known, kChangesOfAPage);
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
        throw Failure("The server does not know the request " + quoted(name) + ".", kNothingChanged);
    }
    if (verb->namesRepository == repository.isEmpty()) {
        std::string const fault = verb->namesRepository ? " must name a repository." : " does not take a repository.";
        throw Failure("The request " + quoted(name) + fault, kNothingChanged);
    }
    return *verb;
}

ErrorMessage messageOf(std::string const& text)
{
    return ErrorMessage(fromUtf8(text));
}

} // namespace

EmbeddedServer::EmbeddedServer(std::string folder, Missing missing) : folder_(std::move(folder)), missing_(missing) {}

Expected<OdString> EmbeddedServer::request(OdString const& verb, OdString const& document)
{
    try {
        return answer(verb, document);
    } catch (Failure const& failure) {
        ErrorMessage message = messageOf(failure.what + " " + failure.next);
        message.code = failure.code;
        return message;
    } catch (std::bad_alloc const&) {
        return messageOf(std::string("There is not enough memory for the request. ") + kNothingChanged);
    } catch (std::exception const& error) {
        return messageOf(std::string("The server failed: ") + error.what() + ". " + kNothingChanged);
    }
}

OdString EmbeddedServer::answer(OdString const& verb, OdString const& document)
{
    auto const [name, id] = splitRequest(verb);
    Verb const& known = verbOrFail(name, id);
    Database& database = openDatabase();
    return known.answer({database, known.namesRepository ? repositoryOrFail(database, id) : Repository(), document});
}

Database& EmbeddedServer::openDatabase()
{
    if (database_) {
        return *database_;
    }
    if (missing_ == Missing::isAnError && !ut::FileName::fileExists(fromUtf8(folder_ + "/server.db"))) {
        throw withCode(
            Failure("The server folder '" + folder_ + "' is missing.", "Connect its drive or move the folder back."),
            ServerError::noServer);
    }
    if (auto const error = os::makeFolders(folder_, kFolderPermissions)) {
        throw Failure(
            "The folder '" + folder_ + "' cannot be made: " + error.message() + ".",
            "Check your permissions there, or name another folder for the server.");
    }
    Database database(folder_ + "/server.db");
    prepareTables(database);
    return database_.emplace(std::move(database));
}

} // namespace tav
