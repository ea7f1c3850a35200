#include "host/repository/staging_change.h"

#include <algorithm>
#include <iterator>

namespace tav {

namespace {

using List = std::vector<common::StagedFile>;

List const& listOn(Side side, StagingChange const& change)
{
    return side == Side::before ? change.before : change.after;
}

OdString const& previousOn(Side side, std::pair<OdString, OdString> const& rename)
{
    return side == Side::before ? rename.first : rename.second;
}

OdString previousIn(common::State const& state, OdString const& path)
{
    auto const rename = state.renames.find(path);
    return rename == state.renames.end() ? OdString() : rename->second;
}

void addRenames(
    common::State const& from, common::State const& before, common::State const& after, StagingChange& change)
{
    for (auto const& [path, previous] : from.renames) {
        std::pair<OdString, OdString> const both = {previousIn(before, path), previousIn(after, path)};
        if (both.first != both.second) {
            change.renames.emplace(path, both);
        }
    }
}

} // namespace

common::State stagedPart(common::State const& state)
{
    common::State part;
    part.stagedFiles = state.stagedFiles;
    part.renames = state.renames;
    return part;
}

StagingChange stagingChange(common::State const& before, common::State const& after)
{
    List const& old = before.stagedFiles;
    List const& now = after.stagedFiles;
    auto const [oldBegin, nowBegin] = std::mismatch(old.begin(), old.end(), now.begin(), now.end());
    auto const [oldEnd, nowEnd] = std::mismatch(
        old.rbegin(), std::make_reverse_iterator(oldBegin), now.rbegin(), std::make_reverse_iterator(nowBegin));
    StagingChange change;
    change.position = static_cast<std::size_t>(oldBegin - old.begin());
    change.behind = static_cast<std::size_t>(oldEnd - old.rbegin());
    change.before.assign(oldBegin, oldEnd.base());
    change.after.assign(nowBegin, nowEnd.base());
    addRenames(before, before, after, change);
    addRenames(after, before, after, change);
    return change;
}

bool isEmpty(StagingChange const& change)
{
    return change.before.empty() && change.after.empty() && change.renames.empty();
}

bool isOn(Side side, StagingChange const& change, common::State const& state)
{
    if (isEmpty(change)) {
        return true;
    }
    List const& wanted = listOn(side, change);
    List const& staged = state.stagedFiles;
    bool const fits = staged.size() == change.position + wanted.size() + change.behind;
    return fits &&
           std::equal(wanted.begin(), wanted.end(), staged.begin() + static_cast<std::ptrdiff_t>(change.position)) &&
           std::all_of(change.renames.begin(), change.renames.end(), [&](auto const& rename) {
               return previousIn(state, rename.first) == previousOn(side, rename.second);
           });
}

void bringTo(Side side, StagingChange const& change, common::State& state)
{
    List const& old = listOn(side == Side::before ? Side::after : Side::before, change);
    List const& wanted = listOn(side, change);
    auto const begin = state.stagedFiles.begin() + static_cast<std::ptrdiff_t>(change.position);
    auto const place = state.stagedFiles.erase(begin, begin + static_cast<std::ptrdiff_t>(old.size()));
    state.stagedFiles.insert(place, wanted.begin(), wanted.end());
    for (auto const& [path, rename] : change.renames) {
        OdString const& previous = previousOn(side, rename);
        if (previous.isEmpty()) {
            state.renames.erase(path);
        } else {
            state.renames[path] = previous;
        }
    }
}

} // namespace tav
