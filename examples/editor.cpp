// What a drawing editor does with the library, from opening a repository to the document of a new commit. It reads what
// the server knows, stages the drawing that the user names, and prints the history and the document for the server.
// Usage: editor FOLDER FETCH.json NAME MESSAGE
#include "common/mu_common_diff.h"
#include "common/mu_common_file_utils.h"
#include "common/mu_common_history.h"
#include "common/mu_common_serialization.h"
#include "common/mu_common_state.h"

#include "platform/ut/File.h"
#include "platform/ut/text.h"
#include "json/json_reader.h"
#include "json/json_writer.h"

#include <QString>

#include <algorithm>
#include <array>
#include <cstdint>
#include <cstdio>
#include <map>

using namespace common;

namespace {

using Contents = std::map<OdString, OdString>; // Storage URLs by path.

/// What the library asks the editor, and tells it.
class Editor final : public IoInterface {
public:
    std::int32_t accept(OdString const& /*path*/) const override { return 1; }
    void report(WriteOutcome const& outcome) const override
    {
        if (!outcome.hasValue()) {
            std::fprintf(stderr, "not saved: %s\n", outcome.error().message.ansi_str().c_str());
        }
    }
};

/// The value of a result; its error becomes an exception, which `main` prints.
template <class T>
T valueOf(Expected<T> result)
{
    if (!result.hasValue()) {
        throw OdError(result.error().message);
    }
    return std::move(result).visit(GetRValueOrThrow<T>{});
}

FetchData readFetch(OdString const& path)
{
    kutils::json::Value document;
    if (!kutils::json::read_string(document, ut::readEntireFile(path))) {
        throw OdError(path + L" is not JSON.");
    }
    return valueOf(deserializeFetchData(document.get_object()));
}

/// In pieces: a drawing may be larger than memory.
OdString digestOf(OdString const& path)
{
    ut::File file;
    if (!file.open(path, ut::File::kRead)) {
        throw OdError(path + L" cannot be read.");
    }
    ContentDigest digest;
    std::array<char, 65'536> piece;
    std::uint64_t done = 0;
    while (std::size_t const count = file.read(piece.data(), piece.size())) {
        digest.update(piece.data(), count);
        done += count;
    }
    if (done < file.length()) {
        throw OdError(path + L" cannot be read.");
    }
    return digest.finish();
}

RepoChanges compare(RootPath const& root, Contents committed)
{
    RepoChanges changes;
    for (File const& file : valueOf(collectRepoFiles(root))) {
        auto const last = committed.find(file.path);
        if (last == committed.end()) {
            changes.untracked.push_back({nullptr, file});
        } else if (isDifferent(file.path, last->second, root)) {
            changes.modified.push_back({nullptr, file, {file.path, last->second}});
        } else {
            changes.unchanged.push_back({file.path, last->second});
        }
        committed.erase(file.path);
    }
    for (auto const& [path, url] : committed) { // What is left is not in the folder any more.
        changes.removed.push_back({nullptr, {path, url}});
    }
    return changes;
}

/// Without `commit` the destructor of the transaction would put the old state back.
void stage(Cache& cache, RepoFileExplorer& explorer, OdString const& name)
{
    auto const found = explorer.findForStaging(name);
    if (auto const* const error = std::get_if<ErrorMessage>(&found)) {
        throw OdError(error->message);
    }
    auto const* const file = std::get_if<StagedFile>(&found);
    if (file == nullptr || !explorer.stage(*file)) {
        throw OdError(L"Nothing to stage by the name " + name + L".");
    }
    Transaction transaction = cache.getTransaction();
    std::vector<StagedFile>& staged = cache.write().stagedFiles;
    if (std::find(staged.begin(), staged.end(), *file) == staged.end()) {
        staged.push_back(*file);
    }
    transaction.commit();
}

void add(ContentDigest& digest, OdString const& text)
{
    std::string const bytes = text.ansi_str() + "\n";
    digest.update(bytes.data(), bytes.size());
}

/// The whole next commit: `files` of the last one, with those that are staged as they are now.
CommitInfo commitOf(State const& state, RootPath const& root, Contents files, OdString const& parent)
{
    for (StagedFile const& staged : state.stagedFiles) {
        files[staged.path] = L"po:" + digestOf(root.pathTo(staged.path));
    }
    CommitInfo info;
    ContentDigest hash;
    add(hash, parent);
    for (auto const& [path, url] : files) {
        info.files.emplace_back(path, url);
        add(hash, path + L"\n" + url);
    }
    info.hash = hash.finish();
    info.parents = {parent};
    info.references.emplace_back(state.head, info.hash, EType::branch);
    return info;
}

Commit const& newestOf(std::vector<Commit> const& commits)
{
    if (commits.empty()) {
        throw OdError(L"The server has no commit yet.");
    }
    return *std::max_element(
        commits.begin(), commits.end(), [](auto const& a, auto const& b) { return a.commitNo < b.commitNo; });
}

void printHistory(std::vector<Commit> const& commits)
{
    for (Commit const& commit : commits) {
        Annotation const& note = commit.annotation;
        HistoryItem const item(note.date, note.author, note.message, commit.hash, commit.commitNo);
        std::printf("%d  %s  (%s)\n", item.number, qPrintable(item.getName()), qPrintable(item.getInfo()));
    }
}

void run(OdString const& folder, OdString const& fetch, OdString const& name, OdString const& message)
{
    Editor const editor; // Outlives everything that saves itself.
    RootPath const root = valueOf(RootPath::get(folder, true));
    FetchData const history = readFetch(fetch);
    printHistory(history.commits);
    Commit const& last = newestOf(history.commits);
    Contents committed;
    for (ReceivedFile const& file : last.files) {
        committed[file.current.path] = file.current.storagePath;
    }
    Cache::create(root, editor);
    std::shared_ptr<Cache> const cache = valueOf(Cache::get(root, editor));
    RepoChanges const changes = compare(root, committed);
    RepoFileExplorer explorer(changes, root);
    stage(*cache, explorer, name);
    for (auto const& gone : changes.removed) { // Removed files are committed without staging.
        committed.erase(gone.committed.path);
    }
    CommitInfo info = commitOf(cache->read(), root, committed, last.hash);
    info.author = L"ann@bridges.example";
    info.message = message;
    std::wstring const document = kutils::json::write_string(serializeCommitInfo(info), true);
    std::printf("%s\n", OdString(document.c_str(), document.size()).ansi_str().c_str());
} // The cache goes last and saves what is staged.

} // namespace

int main(int argc, char** argv)
try {
    if (argc != 5) {
        std::fprintf(stderr, "usage: editor FOLDER FETCH.json NAME MESSAGE\n");
        return 2;
    }
    std::array<OdString, 5> words;
    std::transform(argv, argv + argc, words.begin(), [](char const* word) { return OdString(word, CP_UTF_8); });
    run(words[1], words[2], words[3], words[4]);
    return 0;
} catch (std::exception const& error) {
    std::fprintf(stderr, "%s\n", error.what());
    return 1;
}
