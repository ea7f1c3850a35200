#include "host/storage/inventory.h"

#include "host/storage/files.h"
#include "host/storage/record_file.h"

#include <utility>

namespace tav {

std::map<std::string, std::string> storesIn(StorageLayout const& layout)
{
    std::map<std::string, std::string> stores;
    for (std::string const& file : entriesOf(layout.storeFolder())) {
        if (auto name = StorageLayout::storeIn(file)) {
            stores.emplace(std::move(*name), layout.storeFolder() + "/" + file);
        }
    }
    return stores;
}

std::set<Digest> objectsIn(StorageLayout const& layout)
{
    std::set<Digest> objects;
    for (std::string const& file : entriesOf(layout.objectFolder())) {
        if (auto const digest = digestFromHex(file)) {
            objects.insert(*digest);
        }
    }
    return objects;
}

std::set<OdString> contentsIn(StorageLayout const& layout)
{
    std::set<OdString> urls;
    for (Digest const& digest : objectsIn(layout)) {
        urls.insert(StorageUrl{{}, digest}.text());
    }
    for (auto const& [name, path] : storesIn(layout)) {
        RecordFile const store = RecordFile::openForReading(path, nameOfStore(name));
        for (Entry const& entry : store.entries()) {
            urls.insert(StorageUrl{name, entry.record.digest}.text());
        }
    }
    return urls;
}

} // namespace tav
