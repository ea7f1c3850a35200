// The first byte chooses a reader of server documents, the rest is the document. Reading it ends with a value as every
// received value is, with an error that has a text, or with JsonParseError. What was received can be sent.
#include "common/mu_common_json.h"
#include "common/mu_common_serialization.h"

#include "json/json_reader.h"
#include "json/json_writer.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <vector>

namespace {

using kutils::json::Object;
using kutils::json::Value;
using kutils::json::Value_type;

void require(bool holds)
{
    if (!holds) {
        std::abort();
    }
}

void send(common::CommitInfo const& info)
{
    std::wstring const text = kutils::json::write_string(common::serializeCommitInfo(info), true);
    Value document;
    require(kutils::json::read_string(document, OdString(text.data(), text.size())));
    require(document.get_object().at(L"commits").get_array().size() == 1);
    require(document.get_object().at(L"references").get_array().size() == info.references.size());
}

void check(common::EType) {}

void check(OdString const&) {}

void check(common::CommitNumberPair const&) {}

void check(common::Annotation const& annotation)
{
    OdString text;
    annotation.date.strftime(L"%Y-%m-%d %H:%M:%S", text);
    require(!text.isEmpty());
}

void check(common::Reference const& reference)
{
    require(!reference.annotation);
    require(reference.type == common::EType::branch || reference.type == common::EType::tag);
    send({{}, {reference}, {}, reference.commitHash, {}, {}});
}

void check(common::RepoData const& repository)
{
    require(repository.description.isEmpty());
}

void check(common::ReceivedFile const& file)
{
    require(!file.previous && !file.metaInfo);
}

void check(common::Commit const& commit);

template <class T>
void check(std::vector<T> const& items)
{
    for (T const& item : items) {
        check(item);
    }
}

void check(common::Commit const& commit)
{
    check(commit.annotation);
    check(commit.files);
    common::CommitInfo info{{}, {}, commit.parents, commit.hash, commit.annotation.author, commit.annotation.message};
    for (common::ReceivedFile const& file : commit.files) {
        info.files.emplace_back(file.current.path, file.current.storagePath);
    }
    send(info);
}

void check(common::FetchData const& data)
{
    check(data.repository);
    check(data.commits);
    check(data.references);
}

template <class T>
void check(Expected<T> const& result)
{
    if (result.hasValue()) {
        check(result.value());
    } else {
        require(!result.error().message.isEmpty() && result.error().code == 0);
    }
}

template <auto Read>
void readText(OdString const& text)
{
    check(Read(text));
}

template <auto Read>
void readObject(OdString const& text)
{
    Value document;
    if (kutils::json::read_string(document, text) && document.type() == Value_type::object) {
        check(Read(document.get_object()));
    }
}

template <auto Read>
void readArray(OdString const& text)
{
    Value document;
    if (kutils::json::read_string(document, text) && document.type() == Value_type::array) {
        check(Read(document.get_array()));
    }
}

Expected<common::ReceivedFile> readFile(Object const& object)
{
    return common::deserializeRepoFile(object, {L"4f0a"});
}

using RepoDataOfText = Expected<common::RepoData> (*)(OdString const&);
using RepoDataOfObject = Expected<common::RepoData> (*)(Object const&);

// The order is that of the corpus: new readers go to the end.
constexpr std::array kReaders = {
    readText<common::deserializeReferences>,
    readText<static_cast<RepoDataOfText>(common::deserializeRepoData)>,
    readText<common::deserializeRepoDatas>,
    readText<common::deserializeServerVersion>,
    readObject<common::deserializeReference>,
    readObject<static_cast<RepoDataOfObject>(common::deserializeRepoData)>,
    readObject<common::deserializeAnnotation>,
    readObject<readFile>,
    readObject<common::deserializeCommit>,
    readObject<common::deserializeFetchData>,
    readObject<common::deserializeCommitNumber>,
    readObject<common::deserializeInitData>,
    readArray<common::deserializeParentHashes>,
    readArray<common::deserializeCommitNumbers>,
    readText<common::toType>,
};

} // namespace

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    if (size == 0) {
        return 0;
    }
    OdString const text(reinterpret_cast<char const*>(data) + 1, size - 1, CP_UTF_8);
    try {
        kReaders[data[0] % kReaders.size()](text);
    } catch (common::JsonParseError const& error) {
        require(!error.description().isEmpty());
    }
    return 0;
}
