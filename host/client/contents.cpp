#include "host/client/contents.h"

#include "host/errors/failure.h"
#include "host/text/characters.h"

#include <algorithm>
#include <set>

namespace tav {

namespace {

/// What has been entered as a content of this folder has to be here. Of the others some may have come by another way.
bool isHere(OdString const& url, LocalDatabase const& database, LocalStorage& storage)
{
    if (database.sizeOf(url)) {
        return true;
    }
    auto const isKept = storage.contains(url);
    return !isKept.hasValue() || isKept.value(); // One that cannot be looked for is not given up.
}

/// What undoing may bring back, and what has been put aside; no commit has most of it.
std::set<OdString> urlsOfWork(LocalDatabase const& database)
{
    std::set<OdString> urls;
    auto const add = [&](std::vector<OdString> const& more) { urls.insert(more.begin(), more.end()); };
    add(database.hasOperations() ? database.operations().urls() : std::vector<OdString>());
    add(database.hasShelves() ? database.shelves().urls() : std::vector<OdString>());
    return urls;
}

} // namespace

Contents contentsOf(common::RootPath const& root, LocalDatabase const& database)
{
    Contents contents;
    LocalStorage storage(root);
    std::vector<OdString> const committed = database.commits().urls();
    for (OdString const& url : urlsOfWork(database)) {
        if (!std::binary_search(committed.begin(), committed.end(), url)) {
            contents.here.push_back(url);
        }
    }
    for (OdString const& url : committed) {
        bool const here = isHere(url, database, storage);
        (here ? contents.here : contents.elsewhere).push_back(url);
    }
    return contents;
}

void requireHere(Tree const& files, LocalDatabase const& database, LocalStorage& storage)
{
    for (auto const& [path, url] : files) {
        if (!isHere(url, database, storage)) {
            throw Failure(
                "This version of " + quoted(path) + " was made in another folder, and its content is not here.",
                "Nothing has been written; get the file from that folder.");
        }
    }
}

} // namespace tav
