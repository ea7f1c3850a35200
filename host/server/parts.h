/// What has come of the records that are being sent, each in a file of its own until it is whole.
#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <string_view>

namespace tav {

/// Files in one folder, named after the numbers of their uploads. Everything throws `StorageError`.
class Parts {
public:
    /// Keeps the files in `folder`, in bytes, which is made with the first one.
    explicit Parts(std::string folder);

    /// How much has come; makes the file when it is missing.
    std::uint64_t begin(std::int64_t upload) const;
    /// How much has come; 0 when there is no file.
    std::uint64_t length(std::int64_t upload) const;
    /// Writes `bytes` at `offset`, which is at most the present length. Not flushed.
    void write(std::int64_t upload, std::uint64_t offset, std::string_view bytes) const;

    /// Gives the file a name that `write` does not know, and returns its path: nothing changes it any more. Not
    /// flushed.
    std::string take(std::int64_t upload) const;
    void remove(std::int64_t upload) const;

    /// Removes the files whose upload is gone.
    void removeOthers(std::function<bool(std::int64_t upload)> const& isThere) const;

private:
    std::string fileOf(std::int64_t upload) const;

    std::string folder_;
};

} // namespace tav
