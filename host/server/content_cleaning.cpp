#include "host/server/content_cleaning.h"

#include "host/server/uploads.h"

namespace tav {

namespace {

constexpr std::size_t kContentsOfAPage = 1'000;

/// Those that go at once. What they build on may be next.
std::vector<StoredContent> removePage(Stores& stores, OdString const& repository)
{
    if (stores.history.read(repository)->unneeded(stores.now(), 1).empty()) {
        return {}; // Nobody has to wait.
    }
    auto const history = stores.history.write(repository);
    std::vector<StoredContent> unneeded = history->unneeded(stores.now(), kContentsOfAPage);
    for (StoredContent const& content : unneeded) {
        history->removeContent(content.digest);
    }
    history->commit();
    return unneeded;
}

Freed removeContents(Stores& stores, OdString const& repository)
{
    Freed freed;
    for (auto page = removePage(stores, repository); !page.empty(); page = removePage(stores, repository)) {
        for (StoredContent const& content : page) {
            stores.contents.remove(repository, content.id);
            freed += {1, content.recordLength};
        }
    }
    return freed;
}

void giveUpUploads(Stores& stores, OdString const& repository)
{
    std::int64_t const before = stores.now() - kPatienceForUploads;
    if (stores.history.read(repository)->uploadsBefore(before).empty()) {
        return;
    }
    auto const history = stores.history.write(repository);
    std::vector<Upload> const old = history->uploadsBefore(before);
    for (Upload const& upload : old) {
        history->removeUpload(upload.id);
    }
    history->commit();
}

/// A number is in a table before the file gets its name, and never used again: a file without one is a leftover.
void removeLeftovers(Stores& stores, OdString const& repository)
{
    for (std::int64_t const id : stores.contents.list(repository)) {
        if (!stores.history.read(repository)->isUsed(id)) {
            stores.contents.remove(repository, id);
        }
    }
}

} // namespace

Freed cleanContents(Stores& stores, OdString const& repository)
{
    Freed const freed = removeContents(stores, repository);
    giveUpUploads(stores, repository);
    removeLeftovers(stores, repository);
    stores.parts.removeOthers([&](std::int64_t upload) { return stores.history.hasUpload(upload); });
    return freed;
}

} // namespace tav
