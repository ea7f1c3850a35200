#include "common/mu_common_versions.h"

#define OPENSSL_SUPPRESS_DEPRECATED // The plain functions of SHA-256 allocate nothing and cannot fail.
#include <openssl/sha.h>

#include <array>
#include <string>

namespace common {

struct ContentDigest::Context {
    SHA256_CTX sha;
};

ContentDigest::ContentDigest() : context_(std::make_unique<Context>())
{
    SHA256_Init(&context_->sha);
}

ContentDigest::~ContentDigest() = default;

void ContentDigest::update(char const* data, std::size_t size)
{
    SHA256_Update(&context_->sha, data, size);
}

OdString ContentDigest::finish()
{
    constexpr wchar_t const* kDigits = L"0123456789abcdef";
    std::array<unsigned char, SHA256_DIGEST_LENGTH> bytes{};
    SHA256_Final(bytes.data(), &context_->sha);
    std::array<wchar_t, 2 * SHA256_DIGEST_LENGTH> text{};
    for (std::size_t i = 0; i < bytes.size(); ++i) {
        text[2 * i] = kDigits[bytes[i] >> 4];
        text[2 * i + 1] = kDigits[bytes[i] & 15];
    }
    return OdString(text.data(), text.size());
}

namespace {

OdString digestOf(char const* data, std::size_t size)
{
    ContentDigest digest;
    digest.update(data, size);
    return digest.finish();
}

class FileStatusImp final : public StatusImp {
public:
    FileStatusImp(OdString const& path, FileChange status) : path_(path), status_(status) {}

    OdString path() const override { return path_; }
    FileChange status() const override { return status_; }
    std::shared_ptr<MetaInfo>& metaInfo() override { return metaInfo_; }

    bool operator==(StatusImp const* other) const override
    {
        auto const* const file = dynamic_cast<FileStatusImp const*>(other);
        return file && path_ == file->path_ && status_ == file->status_;
    }

private:
    std::shared_ptr<MetaInfo> metaInfo_;
    OdString path_;
    FileChange status_;
};

} // namespace

MetaInfo::~MetaInfo() = default;

ConflictInfo::ConflictInfo(OdString const& drawing, OdString const& theirs, OdString const& base)
    : path(drawing)
    , theirsPath(theirs)
    , basePath(base)
{
}

StatusImp::~StatusImp() = default;

StatusRef::StatusRef(OdString const& path, FileChange status) : imp_(std::make_shared<FileStatusImp>(path, status)) {}

OdString StatusRef::path() const
{
    return imp_->path();
}

FileChange StatusRef::status() const
{
    return imp_->status();
}

std::shared_ptr<MetaInfo>& StatusRef::metaInfo()
{
    return imp_->metaInfo();
}

std::shared_ptr<MetaInfo>& StatusRef::metaInfo() const
{
    return imp_->metaInfo();
}

bool StatusRef::operator==(StatusRef const& other) const
{
    return imp_->operator==(other.imp_.get());
}

} // namespace common

OdString generateSha(char const* data, int size)
{
    return common::digestOf(data, static_cast<std::size_t>(size));
}

OdString generateSha(OdString const& text)
{
    return common::digestOf(text.ansi_str().data(), text.getLength());
}
