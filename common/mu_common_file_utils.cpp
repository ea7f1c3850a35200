#include "common/mu_common_file_utils.h"

#include "common/mu_common_pattern.h"

#include "platform/ut/Dir.h"
#include "platform/ut/FileName.h"

#include <utime.h>

#include <algorithm>
#include <map>
#include <string>
#include <utility>

namespace common {

namespace {

/// One walk: what it lists, and where it puts it.
class Walk {
public:
    Walk(
        CollectOptions const& options, NameFilter const& excluded, DirContents& contents, std::vector<OdString>& unread)
        : options_(options)
        , excluded_(excluded)
        , contents_(contents)
        , unread_(unread)
    {
    }

    void enter(OdString const& folder, OdString const& prefix) const
    {
        ut::Dir dir;
        OdString const separator = ut::FileName::getPathSeparator();
        if (!dir.open(folder)) {
            unread_.push_back(prefix.left(prefix.getLength() - std::min(prefix.getLength(), separator.getLength())));
            return;
        }
        forEachAccepted(dir, ut::Dir::kFiles, [&](OdString const& name) { contents_.files.push_back(prefix + name); });
        forEachAccepted(dir, ut::Dir::kDirs, [&](OdString const& name) {
            if (options_.collectDirs) {
                contents_.dirs.push_back(prefix + name);
            }
            enter(dir.getName() + separator + name, prefix + name + separator);
        });
    }

private:
    template <class Take>
    void forEachAccepted(ut::Dir& dir, int kinds, Take const& take) const
    {
        OdString name;
        bool more = dir.getFirst(name, OdString::kEmpty, options_.enumerationFlags | kinds);
        for (; more; more = dir.getNext(name)) {
            if (!name.isEmpty() && (excluded_.isEmpty() || !excluded_.matches(name.ansi_str()))) {
                take(name);
            }
        }
    }

    CollectOptions const& options_;
    NameFilter const& excluded_;
    DirContents& contents_;
    std::vector<OdString>& unread_;
};

NameFilter namesOutsideTheRepository(RootPath const& root)
{
    std::vector<OdString> rules = RepoIgnore(root).rules();
    rules.push_back(LR"(^\.tav$)");
    return NameFilter(rules);
}

/// The text before `ending`, or an empty one when `path` does not end so or has nothing before it.
OdString beforeEnding(OdString const& path, OdString const& ending)
{
    std::size_t const length = ending.getLength();
    if (path.getLength() <= length || path.right(length) != ending) {
        return OdString::kEmpty;
    }
    return path.left(path.getLength() - length);
}

struct ConflictCopies {
    OdString theirs;
    OdString base;
};

} // namespace

CollectOptions::CollectOptions(
    bool useRelativePaths, bool listDirs, bool includeHidden, std::vector<std::regex> excludedNames)
    : relativePaths(useRelativePaths)
    , collectDirs(listDirs)
    , enumerationFlags(includeHidden * ut::Dir::kHidden)
    , excludes(std::move(excludedNames))
{
}

void touch(OdString const& path)
{
    if (ut::FileName::fileExists(path)) {
        utime(path.ansi_str().c_str(), nullptr);
    }
}

DirContents collectDirContents(OdString const& folder, CollectOptions const& options)
{
    DirContents contents;
    OdString const prefix = options.relativePaths ? OdString() : folder + ut::FileName::getPathSeparator();
    NameFilter const excluded(options.excludes);
    std::vector<OdString> unread;
    Walk(options, excluded, contents, unread).enter(folder, prefix);
    return contents;
}

Expected<std::vector<File>> collectRepoFiles(RootPath const& root)
{
    std::vector<OdString> unread;
    return collectRepoFiles(root, unread);
}

Expected<std::vector<File>> collectRepoFiles(RootPath const& root, std::vector<OdString>& unread)
{
    CollectOptions const options(true, false, false, {});
    NameFilter const excluded = namesOutsideTheRepository(root);
    DirContents contents;
    Walk const walk(options, excluded, contents, unread);
    walk.enter(root.path(), OdString::kEmpty);

    Expected<OdString> const properties = root.relativePathTo(root.propertiesPath());
    if (!properties.hasValue()) {
        return properties.error();
    }
    walk.enter(root.propertiesPath(), properties.value() + ut::FileName::getPathSeparator());

    std::vector<File> files;
    files.reserve(contents.files.size());
    for (OdString& path : contents.files) {
        files.push_back(File{std::move(path)});
    }
    return files;
}

std::vector<std::unique_ptr<ConflictInfo>> collectConflictPaths(RootPath const& root)
{
    std::map<OdString, ConflictCopies> copies;
    for (OdString const& path : collectDirContents(root.conflictPath(), CollectOptions(true, false, true, {})).files) {
        if (OdString const base = beforeEnding(path, L".base.dwg"); !base.isEmpty()) {
            copies[base].base = path;
        } else if (OdString const theirs = beforeEnding(path, L".theirs.dwg"); !theirs.isEmpty()) {
            copies[theirs].theirs = path;
        }
    }
    std::vector<std::unique_ptr<ConflictInfo>> conflicts;
    conflicts.reserve(copies.size());
    for (auto const& [stem, copy] : copies) {
        conflicts.push_back(std::make_unique<ConflictInfo>(stem + L".dwg", copy.theirs, copy.base));
    }
    return conflicts;
}

} // namespace common
