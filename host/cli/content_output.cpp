#include "host/cli/content_output.h"

#include "host/changes/line_diff.h"
#include "host/cli/output.h"
#include "host/client/contents.h"
#include "host/commits/commit_names.h"
#include "host/errors/failure.h"
#include "host/repository/names.h"
#include "host/storage/local_storage.h"
#include "host/text/utf8.h"

#include <sstream>

namespace tav {

namespace {

FileOfCommit
fileOf(CommitRecord const& commit, std::string const& name, LocalDatabase const& database, common::RootPath const& root)
{
    Tree const files = database.commits().files(commit.hash);
    std::vector<common::StagedFile> all;
    for (auto const& [path, url] : files) {
        all.emplace_back(path, common::FileChange::added);
    }
    std::vector<common::StagedFile> const found = NameFinder(all, root).find(name);
    if (found.size() != 1) {
        throw Failure(
            "Commit " + std::to_string(commit.number) + " has no file '" + name + "'.",
            "Run 'tav files --at " + std::to_string(commit.number) + "' to see its files.");
    }
    OdString const& path = found.front().path;
    LocalStorage storage(root);
    requireHere({{path, files.at(path)}}, database, storage);
    return {commit.number, path, files.at(path)};
}

constexpr char const* kVerify = "Run 'tav verify' to see what is damaged.";

/// None when the content is too long for a text, or holds a NUL.
std::optional<std::string> textOf(FileOfCommit const& file, common::RootPath const& root)
{
    std::string text;
    bool isText = true;
    auto const keep = [&](char const* bytes, std::size_t count) {
        text.append(bytes, count);
        isText = text.size() <= kLongestText && text.find('\0') == std::string::npos;
        return isText;
    };
    WriteOutcome const outcome = LocalStorage(root).read(file.url, keep);
    if (isText) {
        valueOrFail(outcome, kVerify);
    }
    return isText ? std::optional(std::move(text)) : std::nullopt;
}

void printOnTerminal(FileOfCommit const& file, common::RootPath const& root)
{
    auto const text = textOf(file, root);
    if (!text) {
        throw Failure(
            "'" + file.path.ansi_str() + "' is not text, and a terminal cannot show it.",
            "Write it to a file, as in 'tav cat " + std::to_string(file.commit) + ":NAME >FILE'.");
    }
    std::istringstream lines(*text);
    for (std::string line; std::getline(lines, line);) {
        print(shownLine(fromUtf8(line)) + "\n");
    }
}

} // namespace

std::optional<FileOfCommit>
findFileOfCommit(std::string const& typed, LocalDatabase const& database, common::RootPath const& root)
{
    for (std::size_t colon = typed.find(':'); colon != std::string::npos; colon = typed.find(':', colon + 1)) {
        if (auto const commit = findCommitIfAny(database, typed.substr(0, colon))) {
            return fileOf(*commit, typed.substr(colon + 1), database, root);
        }
    }
    return std::nullopt;
}

void requireCommitOf(std::string const& typed, LocalDatabase const& database)
{
    if (std::size_t const colon = typed.find(':'); colon != std::string::npos) {
        findCommit(database, typed.substr(0, colon));
    }
}

void printContent(FileOfCommit const& file, common::RootPath const& root)
{
    if (isTerminal()) {
        printOnTerminal(file, root);
        return;
    }
    auto const printPiece = [](char const* bytes, std::size_t count) { return print(std::string(bytes, count)), true; };
    valueOrFail(LocalStorage(root).read(file.url, printPiece), kVerify);
}

} // namespace tav
