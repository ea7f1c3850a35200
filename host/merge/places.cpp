#include "host/merge/places.h"

#include "host/merge/folded_name.h"

#include <algorithm>
#include <cstddef>
#include <iterator>
#include <map>
#include <string_view>
#include <utility>

namespace tav {

namespace {

std::wstring_view viewOf(OdString const& path)
{
    return {path.c_str(), path.getLength()};
}

/// The folders of `path` from the top down.
std::vector<OdString> foldersOf(OdString const& path)
{
    std::vector<OdString> folders;
    std::wstring_view const text = viewOf(path);
    for (std::size_t slash = text.find(L'/'); slash != text.npos; slash = text.find(L'/', slash + 1)) {
        folders.push_back(path.left(slash));
    }
    return folders;
}

/// Files that want a place where mine has something else or nothing. Theirs has all of them there, so they are not in
/// each other's way.
class Movers {
public:
    struct Stopped {
        MergedFile* file;
        MergeConflict conflict;
    };

    void add(MergedFile& file) { byPath_.emplace(file.path, &file); }

    /// Takes out those that cannot be beside a file `path`.
    std::vector<Stopped> takeThoseStoppedBy(OdString const& path)
    {
        std::vector<Stopped> stopped;
        takeOut(byPath_.find(path), MergeConflict::twoFiles, stopped);
        for (OdString const& folder : foldersOf(path)) {
            takeOut(byPath_.find(folder), MergeConflict::fileAndFolder, stopped);
        }
        OdString const inside = path + L'/';
        for (auto next = byPath_.lower_bound(inside);
             next != byPath_.end() && next->first.left(inside.getLength()) == inside;) {
            next = takeOut(next, MergeConflict::fileAndFolder, stopped);
        }
        return stopped;
    }

    /// Takes out those with a name for which `isTaken` says so.
    template <class Predicate>
    std::vector<Stopped> takeThoseThatCollide(Predicate isTaken)
    {
        std::vector<Stopped> stopped;
        for (auto next = byPath_.begin(); next != byPath_.end();) {
            next = isTaken(next->first) ? takeOut(next, MergeConflict::namesCollide, stopped) : std::next(next);
        }
        return stopped;
    }

private:
    using ByPath = std::map<OdString, MergedFile*>;

    ByPath::iterator takeOut(ByPath::iterator mover, MergeConflict conflict, std::vector<Stopped>& stopped)
    {
        if (mover == byPath_.end()) {
            return mover;
        }
        stopped.push_back({mover->second, conflict});
        return byPath_.erase(mover);
    }

    ByPath byPath_;
};

/// Names that mine has and base has not: files, and folders by which their paths go.
class NewNames {
public:
    explicit NewNames(std::function<bool(OdString const& path)> const& isInBase) : isInBase_(isInBase) {}

    void add(OdString const& path)
    {
        for (OdString const& name : newNamesOf(path)) {
            byFolded_.emplace(foldedName(name), name);
        }
    }

    /// Whether a new name of `path` is one of these in other letters.
    bool collideWith(OdString const& path) const
    {
        if (byFolded_.empty()) {
            return false;
        }
        for (OdString const& name : newNamesOf(path)) {
            auto const found = byFolded_.find(foldedName(name));
            if (found != byFolded_.end() && found->second != name) {
                return true;
            }
        }
        return false;
    }

private:
    std::vector<OdString> newNamesOf(OdString const& path) const
    {
        if (isInBase_(path)) {
            return {};
        }
        std::vector<OdString> names = foldersOf(path);
        names.push_back(path);
        names.erase(std::remove_if(names.begin(), names.end(), isInBase_), names.end());
        return names;
    }

    std::function<bool(OdString const& path)> const& isInBase_;
    std::map<OdString, OdString> byFolded_;
};

} // namespace

void givePlaces(std::vector<MergedFile>& files, std::function<bool(OdString const& path)> const& isInBase)
{
    Movers movers;
    NewNames newNames(isInBase);
    std::vector<OdString> taken;
    for (MergedFile& file : files) {
        if (!file.path.isEmpty() && file.path != file.myPath) {
            movers.add(file);
        } else if (!file.path.isEmpty()) {
            taken.push_back(file.path);
            newNames.add(file.path);
        }
    }
    auto const sendBack = [&](std::vector<Movers::Stopped> const& stopped) {
        for (auto const& [file, conflict] : stopped) {
            file->conflict = conflict;
            file->path = file->myPath;
            file->result = file->values.mine;
            if (!file->path.isEmpty()) {
                taken.push_back(file->path);
            }
        }
    };
    sendBack(movers.takeThoseThatCollide([&](OdString const& path) { return newNames.collideWith(path); }));
    while (!taken.empty()) {
        OdString const path = std::move(taken.back());
        taken.pop_back();
        sendBack(movers.takeThoseStoppedBy(path));
    }
}

} // namespace tav
