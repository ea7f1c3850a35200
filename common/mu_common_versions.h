/// Digests of contents, and the status of files.
#pragma once

#include "common/mu_common_export.h"
#include "common/mu_common_repo_files.h"

#include "platform/sdk/OdString.h"

#include <cstddef>
#include <memory>

/// The SHA-256 digest (FIPS 180-4) of exactly `size` bytes at `data`: 64 lower-case hexadecimal digits.
MU_COMMON_EXPORT OdString generateSha(char const* data, int size);

/// The digest of the first n bytes of the narrow form of `text`, n being its number of characters. For texts with
/// characters beyond ASCII that is not the whole text; stored digests depend on it.
MU_COMMON_EXPORT OdString generateSha(OdString const& text);

namespace common {

/// The digest of `generateSha`, computed over pieces, for contents that do not fit into memory or into an `int`.
/// Owned and used by one thread at a time.
class MU_COMMON_EXPORT ContentDigest {
public:
    ContentDigest();
    ContentDigest(ContentDigest const&) = delete;
    ContentDigest& operator=(ContentDigest const&) = delete;
    ~ContentDigest();

    /// Adds `size` bytes at `data`, which are not kept.
    void update(char const* data, std::size_t size);
    /// The digest of all bytes added, 64 lower-case hexadecimal digits. To be called once, last.
    OdString finish();

private:
    struct Context;
    std::unique_ptr<Context> context_;
};

/// Extra information that a status or a pair of versions can carry.
class MU_COMMON_EXPORT MetaInfo {
public:
    MetaInfo() = default;
    MetaInfo(MetaInfo const&) = default;
    MetaInfo& operator=(MetaInfo const&) = default;
    virtual ~MetaInfo();
};

/// A conflicted drawing and its other versions. In the result of a scan, all paths are relative to the conflict folder.
class MU_COMMON_EXPORT ConflictInfo : public MetaInfo {
public:
    /// Stores the three.
    ConflictInfo(OdString const& path, OdString const& theirsPath, OdString const& basePath);

    OdString path;       ///< the drawing
    OdString theirsPath; ///< the incoming version; empty when there is none
    OdString basePath;   ///< the common ancestor; empty when there is none
};

/// The status of one file, as `StatusRef` shares it among its copies.
class MU_COMMON_EXPORT StatusImp {
public:
    StatusImp() = default;
    StatusImp(StatusImp const&) = delete;
    StatusImp& operator=(StatusImp const&) = delete;
    virtual ~StatusImp();

    /// Path of the file, relative to the working folder.
    virtual OdString path() const = 0;
    /// What happened to it.
    virtual FileChange status() const = 0;
    /// The status's own pointer, which the caller may read or set; null at first.
    virtual std::shared_ptr<MetaInfo>& metaInfo() = 0;
    /// Whether `other`, which may be null, is the status of the same path and change.
    virtual bool operator==(StatusImp const* other) const = 0;
};

/// Handle to the status of one file. Copies share the status, so what is set through one shows through all.
class MU_COMMON_EXPORT StatusRef {
public:
    /// Makes a status of its own, without extra information.
    StatusRef(OdString const& path, FileChange status);

    /// Path of the file, relative to the working folder.
    OdString path() const;
    /// What happened to it.
    FileChange status() const;
    /// The shared pointer itself, to read or to set; null at first.
    ///@{
    std::shared_ptr<MetaInfo>& metaInfo();
    std::shared_ptr<MetaInfo>& metaInfo() const;
    ///@}

    /// Same path (case-sensitive) and same status; the extra information is not compared.
    bool operator==(StatusRef const& other) const;

    bool selected = true; ///< true in every handle that the library makes; the host may keep a choice here

private:
    std::shared_ptr<StatusImp> imp_;
};

} // namespace common
