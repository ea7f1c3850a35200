#include "host/repository/verified_files.h"

namespace tav {

namespace {

constexpr char const* kTable = R"(
CREATE TABLE verified_files (
    path TEXT PRIMARY KEY,
    digest TEXT NOT NULL,
    size INTEGER NOT NULL,
    inode INTEGER NOT NULL,
    changed INTEGER NOT NULL,
    modified INTEGER NOT NULL
) WITHOUT ROWID;
)";

} // namespace

void VerifiedFiles::create(Database& database)
{
    database.run(kTable);
}

VerifiedFileList VerifiedFiles::all() const
{
    VerifiedFileList files;
    Statement row =
        database_->prepare("SELECT path, digest, size, inode, changed, modified FROM verified_files ORDER BY path");
    while (row.next()) {
        FileStamp const stamp{
            static_cast<std::uint64_t>(row.integer(2)), static_cast<std::uint64_t>(row.integer(3)), row.integer(4),
            row.integer(5)};
        if (auto const digest = digestFromHex(row.bytes(1))) { // What is not a digest says nothing of the file.
            files.push_back({std::string(row.bytes(0)), *digest, stamp});
        }
    }
    return files;
}

void VerifiedFiles::put(VerifiedFileList const& files)
{
    Statement row = database_->prepare("INSERT OR REPLACE INTO verified_files VALUES (?, ?, ?, ?, ?, ?)");
    for (VerifiedFile const& file : files) {
        row.with(std::string_view(file.path)).with(std::string_view(hexOf(file.digest)));
        row.with(static_cast<std::int64_t>(file.stamp.size)).with(static_cast<std::int64_t>(file.stamp.inode));
        row.with(file.stamp.changed).with(file.stamp.modified).run();
    }
}

} // namespace tav
