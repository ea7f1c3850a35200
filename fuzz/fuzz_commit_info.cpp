// The first byte chooses a document that clients send, the rest is the document. It is refused with a text, or what was
// read is clean: every path leads into the working folder, and no file is the folder of another.
#include "host/errors/failure.h"
#include "host/history/reference_name.h"
#include "host/history/tracked_path.h"
#include "host/protocol/commit_document.h"
#include "host/protocol/members.h"

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <set>

namespace {

void require(bool holds)
{
    if (!holds) {
        std::abort();
    }
}

void checkPath(OdString const& path)
{
    require(!tav::whyUnsafe(path));
    std::string const bytes = "/" + path.ansi_str() + "/";
    for (char const* const part : {"//", "/./", "/../", "/.tav/tav", "\\", "\n"}) {
        require(bytes.find(part) == std::string::npos);
    }
}

void checkTree(std::vector<tav::FileRecord> const& files)
{
    std::set<std::string> paths;
    for (tav::FileRecord const& file : files) {
        require(paths.insert(file.path.ansi_str()).second);
    }
    for (std::string const& path : paths) {
        for (std::size_t slash = path.find('/'); slash != std::string::npos; slash = path.find('/', slash + 1)) {
            require(paths.count(path.substr(0, slash)) == 0);
        }
    }
}

void check(std::vector<tav::ReferenceChange> const& changes)
{
    std::set<std::string> names;
    for (tav::ReferenceChange const& change : changes) {
        common::Reference const& reference = change.reference;
        require(!change.expected || change.expected->isEmpty() || tav::isHash(*change.expected));
        require(!tav::whyNotReferenceName(reference.name) && tav::isHash(reference.commitHash));
        require(names.insert(reference.name.ansi_str()).second);
    }
}

void check(tav::NewCommit const& added)
{
    require(tav::isHash(added.commit.hash) && added.commit.parents.size() <= 2);
    for (tav::FileRecord const& file : added.files) {
        checkPath(file.path);
        require(tav::isContentUrl(file.url));
        if (!file.previousPath.isEmpty()) {
            checkPath(file.previousPath);
        }
    }
    checkTree(added.files);
    check(added.references);
}

void read(unsigned kind, OdString const& document)
{
    switch (kind) {
    case 0: return check(tav::readCommitInfo(document));
    case 1: return check(tav::readReferences(document));
    case 2: return require(tav::readLastNumber(document) >= 0);
    default: return require(!tav::readNewRepository(document).name.isEmpty());
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    if (size == 0) {
        return 0;
    }
    try {
        read(data[0] % 4u, OdString(reinterpret_cast<char const*>(data) + 1, size - 1, CP_UTF_8));
    } catch (tav::Failure const& failure) {
        require(!failure.what.empty() && !failure.next.empty());
    }
    return 0;
}
