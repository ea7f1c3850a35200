#include "host/history/commit_hash.h"

#include "host/text/characters.h"

#include "common/mu_common_versions.h"

#include <algorithm>
#include <string>

namespace tav {

namespace {

class Digest {
public:
    /// Texts count in the form in which documents carry them.
    Digest& add(OdString const& text)
    {
        std::string const bytes = withPairs(text).ansi_str();
        std::string const length = std::to_string(bytes.size()) + ":"; // Else "ab","c" would be "a","bc".
        digest_.update(length.data(), length.size());
        digest_.update(bytes.data(), bytes.size());
        return *this;
    }
    OdString finish() { return digest_.finish(); }

private:
    common::ContentDigest digest_;
};

std::vector<FileRecord const*> inOrderOfPaths(std::vector<FileRecord> const& files)
{
    std::vector<FileRecord const*> sorted;
    sorted.reserve(files.size());
    for (FileRecord const& file : files) {
        sorted.push_back(&file);
    }
    std::sort(sorted.begin(), sorted.end(), [](FileRecord const* a, FileRecord const* b) { return a->path < b->path; });
    return sorted;
}

} // namespace

OdString commitHash(CommitRecord const& commit, std::vector<FileRecord> const& files)
{
    Digest digest;
    digest.add(L"tav commit").add(commit.author).add(commit.message);
    for (OdString const& parent : commit.parents) {
        digest.add(parent);
    }
    digest.add(OdString::kEmpty);
    for (FileRecord const* const file : inOrderOfPaths(files)) {
        digest.add(file->path).add(file->url).add(file->previousPath);
    }
    return digest.finish();
}

} // namespace tav
