/// A repository whose storage a test fills.
#pragma once

#include "host/storage/chain.h"
#include "host/storage/local_storage.h"
#include "host/storage/storage_error.h"

#include "tests/support/temp_repository.h"
#include "tests/support/utf8.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <filesystem>
#include <map>
#include <random>
#include <string>
#include <utility>
#include <vector>

namespace storage_tests {

/// What a result without a value says; "success" when there is nothing to say.
template <class T>
std::string messageOf(Expected<T> const& result)
{
    return result.hasValue() ? "success" : result.error().message.ansi_str();
}

/// Work goes by segments of 4 KiB, so that small contents show what gigabytes do.
inline constexpr unsigned kSegmentLog = tav::kSmallestSegmentLog;
inline constexpr std::size_t kSegment = std::size_t{1} << kSegmentLog;

/// `size` bytes that do not compress, others for each `seed`.
inline std::string drawing(unsigned seed, std::size_t size)
{
    std::minstd_rand random(seed + 1);
    std::string bytes;
    while (bytes.size() < size) {
        bytes += static_cast<char>(random() >> 8U);
    }
    return bytes;
}

/// `bytes` with some bytes in the middle replaced, others for each `seed`.
inline std::string edited(std::string bytes, unsigned seed)
{
    std::string const edit = drawing(seed + 1000, 8);
    return bytes.replace(bytes.size() / 2, edit.size(), edit);
}

/// Names are relative to the working folder, contents and URLs are bytes.
class StorageTest : public testing::Test {
protected:
    /// A storage as a command makes it: it knows what `commit` has recorded.
    tav::LocalStorage newStorage() const
    {
        return tav::LocalStorage(
            repo.root(),
            {[this](OdString const& path) { return lookUp(committed, path); },
             [this](tav::Digest const& digest) { return lookUp(known, support::fromUtf8(tav::hexOf(digest))); },
             [this](OdString const&) { return similar; }},
            kSegmentLog);
    }

    /// Stores and flushes `content` as the file `name`. The URL, or the message.
    std::string store(std::string const& name, std::string const& content) const
    {
        repo.write(name, content);
        tav::LocalStorage storage = newStorage();
        auto const url = storage.store(support::fromUtf8(name));
        WriteOutcome const flushed = storage.flush();
        return url.hasValue() && flushed.hasValue() ? url.value().ansi_str() : messageOf(url) + messageOf(flushed);
    }

    /// Stores it and remembers it as the version of the last commit.
    std::string commit(std::string const& name, std::string const& content)
    {
        std::string url = store(name, content);
        committed[name] = url;
        return url;
    }

    /// The content, or the message.
    std::string contentOf(std::string const& url) const
    {
        std::string content;
        tav::LocalStorage storage = newStorage();
        WriteOutcome const outcome = storage.read(support::fromUtf8(url), [&](char const* bytes, std::size_t count) {
            content.append(bytes, count);
            return true;
        });
        return outcome.hasValue() ? content : messageOf(outcome);
    }

    std::string verify(std::string const& url) const { return messageOf(newStorage().verify(support::fromUtf8(url))); }

    bool contains(std::string const& url) const
    {
        auto const answer = newStorage().contains(support::fromUtf8(url));
        return answer.hasValue() && answer.value();
    }

    /// Where the content of `url` lies, relative to the working folder.
    static std::string fileOf(std::string const& url)
    {
        return url[0] == 'p' ? ".tav/objects/" + url.substr(3) : ".tav/tf/" + url.substr(3, url.find('#') - 3) + ".tf";
    }

    tav::RecordFile recordsOf(std::string const& url) const
    {
        return tav::RecordFile::openForReading(repo.pathTo(fileOf(url)), "The store");
    }

    /// The record of an object.
    tav::Record objectOf(std::string const& url) const { return recordsOf(url).entries().at(0).record; }
    /// Makes an object whole, as earlier versions of tav stored all of them.
    void makeWhole(std::string const& url, std::string const& content) const
    {
        std::filesystem::remove(repo.pathTo(fileOf(url)));
        tav::Buffer bytes;
        std::copy(content.begin(), content.end(), bytes.reserve(content.size()));
        tav::RecordFile::create(repo.pathTo(fileOf(url)), "The object")
            .append({std::move(bytes), content.size()}, *tav::digestFromHex(url.substr(3)), nullptr, kSegmentLog);
    }

    /// The URL of the object that the one at `url` builds on.
    std::string baseOf(std::string const& url) const { return "po:" + tav::hexOf(objectOf(url).base); }
    /// How many differences lead to an object.
    std::size_t deltasOf(std::string url) const
    {
        std::size_t count = 0;
        for (; !objectOf(url).isWhole(); url = baseOf(url)) {
            ++count;
        }
        return count;
    }

    /// The files of the storage, without folders.
    std::vector<std::string> files() const
    {
        std::vector<std::string> names;
        for (std::string const& name : repo.list()) {
            if (name.substr(0, 5) == ".tav/" && name.back() != '/') {
                names.push_back(name);
            }
        }
        return names;
    }

    support::TempRepository const repo;
    std::map<std::string, std::string> committed; ///< by path
    std::map<std::string, std::string> known;     ///< by digest
    std::vector<OdString> similar;                ///< of each file without a version before

private:
    static OdString lookUp(std::map<std::string, std::string> const& urls, OdString const& key)
    {
        auto const found = urls.find(key.ansi_str());
        return found == urls.end() ? OdString() : support::fromUtf8(found->second);
    }
};

} // namespace storage_tests
