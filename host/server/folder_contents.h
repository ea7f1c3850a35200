/// Contents in a folder.
#pragma once

#include "host/server/content_store.h"

#include <string>

namespace tav {

/// The file 1234 of a repository is "REPOSITORY/34/1234": no folder gets too many entries.
class FolderContents final : public ContentStore {
public:
    /// Keeps the files in `folder`, in bytes, which is made with the first one.
    explicit FolderContents(std::string folder);

    void put(OdString const& repository, std::vector<NewFile> const& files) override;
    std::uint64_t size(OdString const& repository, std::int64_t id) override;
    std::string read(OdString const& repository, std::int64_t id, std::uint64_t offset, std::size_t count) override;
    RecordFile open(OdString const& repository, std::int64_t id) override;
    std::vector<std::int64_t> list(OdString const& repository) override;
    void remove(OdString const& repository, std::int64_t id) override;

private:
    std::string folderOf(OdString const& repository) const;
    std::string fileOf(OdString const& repository, std::int64_t id) const;

    std::string folder_;
};

} // namespace tav
