#include "host/server/stored_contents.h"

#include "host/storage/storage_error.h"

#include <cerrno>

namespace tav {

FindBase contentsOf(Stores& stores, OdString const& repository)
{
    return [&stores, repository](Digest const& digest) {
        auto const content = stores.history.read(repository)->content(digest);
        if (!content) {
            throw StorageError("The server lacks the content '" + hexOf(digest) + "'.");
        }
        auto const file = std::make_shared<RecordFile const>(stores.contents.open(repository, content->id));
        auto const index = file->find(digest);
        if (!index) {
            file->failAsDamaged();
        }
        return Link{file, *index};
    };
}

bool isReadable(Stores& stores, OdString const& repository, Digest const& digest)
{
    try {
        FindBase const find = contentsOf(stores, repository);
        ChainReader(stores.scratch).read(find(digest), find, [](std::string_view) {});
        return true;
    } catch (StorageError const& error) {
        if (error.code == 0 || error.code == ENOENT || error.code == EIO) {
            return false;
        }
        throw; // No rights, or no room: that says nothing of the content.
    }
}

} // namespace tav
