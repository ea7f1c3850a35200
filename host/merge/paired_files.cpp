#include "host/merge/paired_files.h"

#include <set>

namespace tav {

namespace {

/// The paths of one side.
class Side {
public:
    Side(MergeInput const& input, std::map<OdString, OdString> const& renames, FileValue PathValues::*value)
        : input_(input)
        , renames_(renames)
        , value_(value)
    {
        for (auto const& [from, to] : renames) {
            targets_.insert(to);
        }
    }

    /// Where this side has the file `basePath` of base; empty where it has removed it.
    OdString pathOf(OdString const& basePath) const
    {
        auto const renamed = renames_.find(basePath);
        if (renamed != renames_.end()) {
            return at(renamed->second) ? renamed->second : OdString();
        }
        return targets_.count(basePath) == 0 && at(basePath) ? basePath : OdString();
    }

    /// Whether the file of this side at `path` comes from no file of base.
    bool isNew(OdString const& path) const
    {
        bool const isFree = !input_.paths.at(path).base || renames_.count(path) > 0;
        return isFree && targets_.count(path) == 0 && at(path);
    }

    FileValue at(OdString const& path) const
    {
        auto const found = input_.paths.find(path);
        return found == input_.paths.end() ? FileValue() : found->second.*value_;
    }

private:
    MergeInput const& input_;
    std::map<OdString, OdString> const& renames_;
    FileValue PathValues::*value_;
    std::set<OdString> targets_;
};

} // namespace

std::vector<MergedFile> pairedFiles(MergeInput const& input)
{
    Side const mine(input, input.myRenames, &PathValues::mine);
    Side const theirs(input, input.theirRenames, &PathValues::theirs);
    std::vector<MergedFile> files;
    auto const add = [&](OdString const& basePath, FileValue const& base, OdString const& my, OdString const& their) {
        files.push_back({basePath, my, their, {base, mine.at(my), theirs.at(their)}, {}, {}, {}});
    };
    for (auto const& [path, values] : input.paths) {
        if (values.base) {
            add(path, values.base, mine.pathOf(path), theirs.pathOf(path));
        }
        OdString const my = mine.isNew(path) ? path : OdString();
        OdString const their = theirs.isNew(path) ? path : OdString();
        if (!my.isEmpty() || !their.isEmpty()) {
            add({}, {}, my, their);
        }
    }
    return files;
}

} // namespace tav
