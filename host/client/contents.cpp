#include "host/client/contents.h"

#include "host/errors/failure.h"
#include "host/text/characters.h"

#include <algorithm>

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

} // namespace

Contents contentsOf(common::RootPath const& root, LocalDatabase const& database)
{
    Contents contents;
    LocalStorage storage(root);
    std::vector<OdString> const committed = database.commits().urls();
    for (OdString const& url : database.hasOperations() ? database.operations().urls() : std::vector<OdString>()) {
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
