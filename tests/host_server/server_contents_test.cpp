// Contents on their way to a server and back, whole and as differences, and what becomes of them there.
#include "host/protocol/content_document.h"
#include "host/server/sqlite_history.h"
#include "host/storage/chain.h"
#include "host/storage/record_file.h"

#include "tests/host_server/server_test.h"
#include "tests/support/failing_call.h"
#include "tests/support/rows.h"

#include "common/mu_common_versions.h"

#include <gmock/gmock.h>

#include <cerrno>
#include <filesystem>
#include <memory>
#include <optional>
#include <random>

namespace {

using server::commit;
using tav::Digest;
using tav::ServerError;

constexpr std::int64_t kDay = std::int64_t{24} * 60 * 60;

Digest digestOf(std::string const& bytes)
{
    common::ContentDigest digest;
    digest.update(bytes.data(), bytes.size());
    return tav::finish(digest);
}

std::string hexOf(std::string const& bytes)
{
    return tav::hexOf(digestOf(bytes));
}

/// `size` bytes that do not compress, others for each `seed`.
std::string drawing(unsigned seed, std::size_t size = 20000)
{
    std::minstd_rand random(seed + 1);
    std::string bytes;
    while (bytes.size() < size) {
        bytes += static_cast<char>(random() >> 8U);
    }
    return bytes;
}

/// `bytes` with some of them replaced, others for each `seed`.
std::string edited(std::string bytes, unsigned seed)
{
    std::string const edit = drawing(seed + 1000, 8);
    return bytes.replace(bytes.size() / 2, edit.size(), edit);
}

class ServerContents : public server::ServerTest {
protected:
    static std::string folderNamed(char name) { return std::string(32, name); }

    tav::KnownContent known(std::string const& bytes) const
    {
        tav::Buffer buffer;
        std::copy(bytes.begin(), bytes.end(), buffer.reserve(bytes.size()));
        return {digestOf(bytes), std::make_shared<tav::Content>(std::move(buffer), bytes.size())};
    }

    /// The bytes of a record, as a storage writes it.
    std::string
    recordOf(std::string const& content, std::string const& base = "", unsigned segmentLog = tav::kSegmentLog) const
    {
        std::filesystem::remove(folder().pathTo("record"));
        tav::KnownContent const it = known(content);
        tav::KnownContent const below = known(base);
        tav::RecordFile::create(folder().pathTo("record"), "A record")
            .append(*it.content, it.digest, base.empty() ? nullptr : &below, segmentLog);
        return folder().read("record");
    }

    static std::string
    announcement(std::string const& record, std::string const& content, std::string const& base = "", char from = '1')
    {
        std::string const onBase = base.empty() ? "" : R"("base":")" + hexOf(base) + R"(",)";
        return R"({"folder":")" + folderNamed(from) + R"(","records":[{)" + onBase + R"("digest":")" + hexOf(content) +
               R"(","record":")" + hexOf(record) + R"(","recordLength":)" + std::to_string(record.size()) + "}]}";
    }

    static std::string started(std::int64_t upload, std::uint64_t offset = 0)
    {
        return R"({"uploads":[{"offset":)" + std::to_string(offset) + R"(,"upload":)" + std::to_string(upload) + "}]}";
    }

    /// The number in the answer to an announcement; the answer as it is when there is none.
    std::int64_t begin(std::string const& document)
    {
        std::string const answer = ask(server, "upload <id>", document);
        std::size_t const place = answer.find(R"("upload":)");
        EXPECT_NE(place, std::string::npos) << answer;
        return place == std::string::npos ? 0 : std::stoll(answer.substr(place + 9));
    }

    /// The error as "1011: message", or "done".
    template <class T>
    std::string said(Expected<T> const& outcome)
    {
        return outcome.hasValue() ? "done"
                                  : std::to_string(outcome.error().code) + ": " + outcome.error().message.ansi_str();
    }

    std::string requested(std::string const& verb, std::string const& document)
    {
        return said(server.request(server::wideText(verb + " " + id()), server::wideText(document)));
    }

    std::string send(std::int64_t upload, std::uint64_t offset, std::string const& bytes, char from = '1')
    {
        return said(server.send(server::wideText(id()), {server::wideText(folderNamed(from)), upload}, offset, bytes));
    }

    std::string finish(std::int64_t upload, char from = '1')
    {
        return requested(
            "finish", R"({"folder":")" + folderNamed(from) + R"(","uploads":[)" + std::to_string(upload) + "]}");
    }

    /// Sends these bytes as the record of `content`.
    std::string sendRecord(std::string const& record, std::string const& content, std::string const& base = "")
    {
        std::int64_t const upload = begin(announcement(record, content, base));
        std::string const sent = send(upload, 0, record);
        return sent == "done" ? finish(upload) : sent;
    }

    std::string put(std::string const& content, std::string const& base = "")
    {
        return sendRecord(recordOf(content, base), content, base);
    }

    static std::string digests(std::vector<std::string> const& contents)
    {
        std::vector<std::string> items;
        for (std::string const& content : contents) {
            items.push_back("\"" + hexOf(content) + "\"");
        }
        return server::joined(items);
    }

    /// Which of the contents the server lacks, each "whole" or "difference to" one of `contents`, in words.
    std::string
    missing(std::vector<std::string> const& contents, std::vector<std::string> const& bases = {}, bool check = false)
    {
        std::vector<std::string> items;
        for (std::string const& content : contents) {
            items.push_back(R"({"bases":)" + digests(bases) + R"(,"digest":")" + hexOf(content) + "\"}");
        }
        std::string const document =
            R"({"check":)" + std::string(check ? "true" : "false") + R"(,"contents":)" + server::joined(items) + "}";
        return ask(server, "missing <id>", document);
    }

    static std::string lacking(std::vector<std::string> const& contents, std::string const& base = "")
    {
        std::vector<std::string> items;
        for (std::string const& content : contents) {
            std::string const onBase = base.empty() ? "" : R"("base":")" + hexOf(base) + R"(",)";
            items.push_back("{" + onBase + R"("digest":")" + hexOf(content) + "\"}");
        }
        return R"({"contents":)" + server::joined(items) + "}";
    }

    std::string locate(std::vector<std::string> const& contents, std::vector<std::string> const& have = {})
    {
        return ask(server, "locate <id>", R"({"contents":)" + digests(contents) + R"(,"have":)" + digests(have) + "}");
    }

    std::string received(std::string const& record, std::uint64_t offset = 0)
    {
        std::string bytes;
        auto const outcome =
            server.receive(server::wideText(id()), server::wideText(record), offset, [&](std::string_view piece) {
                bytes += piece;
                return true;
            });
        return outcome.hasValue() ? bytes : said(outcome);
    }

    /// The content as a client makes it of what the server has, or the error.
    std::string contentAt(std::string const& digest)
    {
        auto store = std::make_unique<tav::SqliteHistory>(serverFolder() + "/server.db");
        auto const content = store->read(server::wideText(id()))->content(*tav::digestFromHex(digest));
        if (!content) {
            return "nothing";
        }
        return received(tav::hexOf(content->record));
    }

    bool isReadable(std::string const& content) { return missing({content}, {}, true) == lacking({}); }

    /// The files with contents.
    std::vector<std::string> contentFiles() const
    {
        std::vector<std::string> files;
        for (std::string const& name : folder().list()) {
            if (name.rfind("server/contents/", 0) == 0 && name.back() != '/') {
                files.push_back(name);
            }
        }
        return files;
    }
    std::vector<std::string> parts() const
    {
        std::vector<std::string> files;
        for (std::string const& name : folder().list()) {
            if (name.rfind("server/uploads/", 0) == 0 && name.back() != '/') {
                files.push_back(name);
            }
        }
        return files;
    }
    std::string clean() { return ask(server, "clean <id>", ""); }

    /// A commit that names `contents`.
    std::string commitOf(char name, std::string const& parents, std::vector<std::string> const& contents)
    {
        std::vector<std::string> lines;
        std::string document = commit(name, parents, {}, {});
        std::string files;
        for (std::string const& content : contents) {
            files += (files.empty() ? "" : ",") + std::string(R"({"path":"f)") + hexOf(content) +
                     R"(","storagePath":"po:)" + hexOf(content) + R"("})";
        }
        document = server::replaced(document, R"("files":[])", R"("files":[)" + files + "]");
        server::renameCommit(name, document);
        return ask(server, "commit <id>", document);
    }

    std::int64_t now = 1'700'000'000;
    tav::EmbeddedServer server{serverFolder(), tav::EmbeddedServer::Missing::isMade, [this] { return now; }};
};

TEST_F(ServerContents, ComeInPartsAndGoBackByteForByte)
{
    std::string const content = drawing(1);
    std::string const record = recordOf(content);
    EXPECT_EQ(missing({content}), lacking({content}));
    std::string const document = announcement(record, content);
    EXPECT_EQ(ask(server, "upload <id>", document), started(1));
    EXPECT_EQ(send(1, 0, record.substr(0, 5000)), "done");
    tav::EmbeddedServer other(serverFolder()); // As after a crash.
    EXPECT_EQ(ask(other, "upload <id>", document), started(1, 5000));
    EXPECT_EQ(send(1, 4000, record.substr(4000)), "done");
    EXPECT_EQ(
        ask(server, "finish <id>", R"({"folder":")" + folderNamed('1') + R"(","uploads":[1]})"), R"({"done":true})");
    EXPECT_EQ(missing({content}), lacking({}));
    EXPECT_TRUE(isReadable(content));
    EXPECT_EQ(received(hexOf(record)), record);
    EXPECT_EQ(received(hexOf(record), 100), record.substr(100));
    EXPECT_EQ(received(hexOf(record), record.size()), "");
    EXPECT_EQ(ask(server, "upload <id>", document), R"({"uploads":[{"done":true}]})");
    EXPECT_THAT(parts(), testing::IsEmpty());
}

TEST_F(ServerContents, MayBeEmpty)
{
    EXPECT_EQ(put(""), "done");
    EXPECT_TRUE(isReadable(""));
    EXPECT_EQ(contentAt(hexOf("")), recordOf(""));
}

TEST_F(ServerContents, OfOneRepositoryAreUnknownToOthers)
{
    put(drawing(1));
    std::string const other = init("tunnel");
    std::string const record = recordOf(drawing(1));
    EXPECT_EQ(
        said(server.receive(server::wideText(other), server::wideText(hexOf(record)), 0, [](auto) { return true; })),
        "1005: The server does not have the record '" + hexOf(record) + "' any more. Ask again where its content is.");
    EXPECT_EQ(
        said(server.send(server::wideText(other), {server::wideText(folderNamed('1')), 1}, 0, "x")),
        "1011: The upload 1 is not under way. Announce it again to learn where it goes on.");
}

TEST_F(ServerContents, BuildOnEachOther)
{
    std::string const first = drawing(1);
    std::string const second = edited(first, 2);
    std::string const third = edited(second, 3);
    put(first);
    EXPECT_EQ(missing({second}, {third, first}), lacking({second}, first));
    EXPECT_EQ(put(second, first), "done");
    EXPECT_EQ(put(third, second), "done");
    EXPECT_TRUE(isReadable(third));
    auto const line = [&](std::string const& content, std::string const& base) {
        std::string const record = recordOf(content, base);
        std::string const onBase = base.empty() ? "" : R"("base":")" + hexOf(base) + R"(",)";
        return "{" + onBase + R"("digest":")" + hexOf(content) + R"(","record":")" + hexOf(record) +
               R"(","recordLength":)" + std::to_string(record.size()) + "}";
    };
    EXPECT_EQ(
        locate({third, second}), R"({"awaited":[],"records":)" +
                                     server::joined({line(first, ""), line(second, first), line(third, second)}) + "}");
    EXPECT_EQ(
        locate({third}, {first}),
        R"({"awaited":[],"records":)" + server::joined({line(second, first), line(third, second)}) + "}");
    EXPECT_EQ(locate({third}, {third}), R"({"awaited":[],"records":[]})");
    EXPECT_EQ(locate({"unknown"}), R"({"awaited":)" + digests({"unknown"}) + R"(,"records":[]})");
}

TEST_F(ServerContents, BuildOnTheBeginningOfAChainThatIsFull)
{
    std::vector<std::string> versions = {drawing(1)};
    put(versions[0]);
    for (unsigned i = 1; i <= tav::kLongestChain; ++i) {
        versions.push_back(edited(versions.back(), i));
        ASSERT_EQ(put(versions[i], versions[i - 1]), "done") << i;
    }
    std::string const next = edited(versions.back(), 99);
    EXPECT_EQ(missing({next}, {versions.back()}), lacking({next}, versions.front()));
    EXPECT_EQ(
        put(next, versions.back()),
        "1010: The record that was sent builds on a content that has too long a chain. Send it again.");
    EXPECT_EQ(put(next, versions.front()), "done");
    EXPECT_TRUE(isReadable(next));
    EXPECT_TRUE(isReadable(versions.back()));
}

TEST_F(ServerContents, ThatTwoFoldersSendAtOnceAreKeptOnce)
{
    std::string const content = drawing(1);
    std::string const record = recordOf(content);
    std::int64_t const one = begin(announcement(record, content, "", '1'));
    std::int64_t const two = begin(announcement(record, content, "", '2'));
    EXPECT_NE(one, two);
    EXPECT_EQ(send(two, 0, record, '2'), "done");
    EXPECT_EQ(send(one, 0, record, '1'), "done");
    EXPECT_EQ(finish(one, '1'), "done");
    EXPECT_EQ(finish(two, '2'), "done");
    EXPECT_THAT(contentFiles(), testing::ElementsAre("server/contents/" + id() + "/01/1"));
    EXPECT_THAT(parts(), testing::IsEmpty());
    EXPECT_TRUE(isReadable(content));
}

TEST_F(ServerContents, AreNotTakenFromTheUploadOfAnotherFolder)
{
    std::string const record = recordOf(drawing(1));
    std::int64_t const upload = begin(announcement(record, drawing(1)));
    std::string const refused = "1011: The upload 1 is not under way. Announce it again to learn where it goes on.";
    EXPECT_EQ(send(upload, 0, "garbage", '2'), refused);
    EXPECT_EQ(finish(upload, '2'), refused);
    EXPECT_EQ(send(upload, 0, record), "done");
    EXPECT_EQ(finish(upload), "done");
    EXPECT_EQ(finish(upload), refused) << "it is over";
}

TEST_F(ServerContents, DoNotGoBeyondWhatWasAnnouncedNorLeaveAGap)
{
    std::string const record = recordOf(drawing(1));
    std::int64_t const upload = begin(announcement(record, drawing(1)));
    EXPECT_EQ(send(upload, 0, record.substr(0, 10)), "done");
    EXPECT_EQ(
        send(upload, 11, "x"),
        "1011: The upload has 10 bytes, and goes on there. Announce it again to learn where it goes on.");
    std::string const tooLarge = "1015: The record has " + std::to_string(record.size()) +
                                 " bytes, and no more. Nothing has changed on the server.";
    EXPECT_EQ(send(upload, 10, record), tooLarge);
    EXPECT_EQ(send(upload, 0, record + record), tooLarge);
    EXPECT_EQ(
        finish(upload), "1011: The upload has 10 of " + std::to_string(record.size()) +
                            " bytes. Announce it again to learn where it goes on.");
    EXPECT_EQ(send(upload, 10, record.substr(10)), "done") << "nothing is lost by asking too early";
    EXPECT_EQ(finish(upload), "done");
}

TEST_F(ServerContents, AreRefusedWhereTheirBytesAreNotThoseAnnounced)
{
    std::string const content = drawing(1);
    std::string const record = recordOf(content);
    std::string changed = record;
    changed[200] = static_cast<char>(changed[200] ^ 1);
    std::int64_t const upload = begin(announcement(record, content));
    send(upload, 0, changed);
    EXPECT_EQ(
        finish(upload), "1010: The record that was sent has another digest than the one announced. Send it again.");
    EXPECT_EQ(ask(server, "upload <id>", announcement(record, content)), started(1));
    EXPECT_EQ(put(content), "done");
}

TEST_F(ServerContents, AreRefusedWhereTheirRecordIsNotClean)
{
    std::string const content = drawing(1);
    std::string const base = drawing(2);
    put(base);
    std::string const another = "1010: The record that was sent is of another content, base or segment length. Send it "
                                "again.";
    std::string const noRecord =
        "1010: The record that was sent is not a record, or has another length. Send it again.";
    EXPECT_EQ(sendRecord(recordOf(content), drawing(3)), another);
    EXPECT_EQ(sendRecord(recordOf(content), content, base), another);
    EXPECT_EQ(sendRecord(recordOf(content, "", 16), content), another);
    EXPECT_EQ(sendRecord(recordOf(content) + "x", content), noRecord);
    EXPECT_EQ(sendRecord(recordOf(content).substr(0, 500), content), noRecord);
    EXPECT_EQ(sendRecord("short", content), noRecord);
    EXPECT_EQ(sendRecord("", content), noRecord);
    EXPECT_EQ(sendRecord(recordOf(content) + recordOf(base), content), noRecord);
    EXPECT_EQ(missing({content}), lacking({content}));
    EXPECT_EQ(contentFiles().size(), 1u);
    EXPECT_THAT(parts(), testing::IsEmpty());
}

TEST_F(ServerContents, AreRefusedWhereTheRecordGivesAnotherContent)
{
    std::string const content = drawing(1);
    std::string record = recordOf(drawing(2));
    tav::Record header = *tav::parseHeader(record.substr(0, tav::kHeaderLength));
    header.digest = digestOf(content);
    record.replace(0, tav::kHeaderLength, tav::headerOf(header));
    EXPECT_EQ(
        sendRecord(record, content),
        "1010: The record that was sent does not give the content that it names. Send it again.");
    EXPECT_EQ(missing({content}), lacking({content}));
}

TEST_F(ServerContents, OfEndlessLengthAreRefusedBeforeTheyAreUnpacked)
{
    std::string record = recordOf(std::string(1000, '\0'));
    tav::Record header = *tav::parseHeader(record.substr(0, tav::kHeaderLength));
    header.length = tav::kLongestContent + 1;
    record.replace(0, tav::kHeaderLength, tav::headerOf(header));
    EXPECT_EQ(
        sendRecord(record, std::string(1000, '\0')),
        "1015: The content is longer than 68719476736 bytes. Nothing has changed on the server.");
    header.length = tav::kLongestContent; // More than its frames have.
    record.replace(0, tav::kHeaderLength, tav::headerOf(header));
    EXPECT_EQ(
        sendRecord(record, std::string(1000, '\0')),
        "1010: The record that was sent does not give the content that it names. Send it again.");
}

TEST_F(ServerContents, AreRefusedWhereTheBaseIsNotThere)
{
    std::string const base = drawing(1);
    std::string const content = edited(base, 2);
    std::string const record = recordOf(content, base);
    std::string const lacks = "1005: The server lacks the base '" + hexOf(base) +
                              "'. Ask which contents are missing, and send the record whole.";
    EXPECT_EQ(requested("upload", announcement(record, content, base)), lacks);
}

TEST_F(ServerContents, ThatAreDamagedAreAskedForAndReplaced)
{
    std::string const first = drawing(1);
    std::string const second = edited(first, 2);
    std::string const third = edited(second, 3);
    put(first);
    put(second, first);
    std::string const path = "server/contents/" + id() + "/01/1";
    folder().write(path, folder().read(path).replace(500, 4, "oops"));
    EXPECT_EQ(missing({first, second}), lacking({})) << "nobody has looked";
    EXPECT_EQ(missing({first, second}, {}, true), lacking({first, second}));
    EXPECT_EQ(missing({first, second}), lacking({first, second}));
    EXPECT_EQ(
        put(third, second), "1005: The server lacks the base '" + hexOf(second) +
                                "'. Ask which contents are missing, and send the record whole.");
    std::string const onBase = recordOf(first, drawing(9));
    EXPECT_EQ(put(first), "done");
    EXPECT_TRUE(isReadable(first));
    EXPECT_TRUE(isReadable(second)) << "it was not damaged itself";
    EXPECT_FALSE(folder().has(path));
}

TEST_F(ServerContents, ThatAreDamagedAreNotReplacedByADifference)
{
    std::string const first = drawing(1);
    std::string const second = edited(first, 2);
    put(first);
    put(second, first);
    std::string const path = "server/contents/" + id() + "/02/2";
    folder().write(path, "");
    missing({second}, {}, true);
    EXPECT_EQ(
        put(second, first),
        "1005: The server has a damaged file of the content '" + hexOf(second) + "'. Send it whole.");
    EXPECT_EQ(put(second), "done");
    EXPECT_TRUE(isReadable(second));
}

TEST_F(ServerContents, AreCleanedAwayWhenNobodyNamesThemInTime)
{
    std::string const content = drawing(1);
    put(content);
    now += 13 * kDay;
    EXPECT_EQ(clean(), R"({"bytes":0,"contents":0})");
    EXPECT_EQ(missing({content}), lacking({})); // Somebody is about to name it.
    now += 13 * kDay;
    EXPECT_EQ(clean(), R"({"bytes":0,"contents":0})");
    now += 2 * kDay;
    EXPECT_EQ(clean(), R"({"bytes":)" + std::to_string(recordOf(content).size()) + R"(,"contents":1})");
    EXPECT_THAT(contentFiles(), testing::IsEmpty());
    EXPECT_EQ(missing({content}), lacking({content}));
}

TEST_F(ServerContents, OfCommitsStayWithAllThatTheyBuildOn)
{
    std::string const first = drawing(1);
    std::string const second = edited(first, 2);
    put(first);
    put(second, first);
    put(drawing(7));
    EXPECT_EQ(commitOf('a', "", {second}), R"([{"commitNo":1,"hash":"<a>"}])");
    now += 100 * kDay;
    EXPECT_EQ(clean(), R"({"bytes":)" + std::to_string(recordOf(drawing(7)).size()) + R"(,"contents":1})");
    EXPECT_TRUE(isReadable(second));
    EXPECT_EQ(contentFiles().size(), 2u);
}

TEST_F(ServerContents, GoWithWhatBuiltOnThem)
{
    std::string const first = drawing(1);
    put(first);
    put(edited(first, 2), first);
    now += 15 * kDay;
    clean();
    EXPECT_THAT(contentFiles(), testing::IsEmpty());
}

TEST_F(ServerContents, ThatComeAfterTheirCommitAreNoLongerAwaited)
{
    std::string const content = drawing(1);
    commitOf('a', "", {content});
    EXPECT_EQ(locate({content}), R"({"awaited":)" + digests({content}) + R"(,"records":[]})");
    put(content);
    EXPECT_EQ(locate({content}).substr(0, 25), R"({"awaited":[],"records":[)");
    now += 100 * kDay;
    clean();
    EXPECT_TRUE(isReadable(content)) << "a commit names it";
}

TEST_F(ServerContents, OnTheWayAreGivenUpAfterAWeekOfSilence)
{
    std::string const record = recordOf(drawing(1));
    std::int64_t const upload = begin(announcement(record, drawing(1)));
    now += 6 * kDay;
    send(upload, 0, record.substr(0, 100));
    now += 6 * kDay;
    clean();
    EXPECT_EQ(parts().size(), 1u);
    EXPECT_EQ(send(upload, 100, record.substr(100, 100)), "done");
    now += 8 * kDay;
    clean();
    EXPECT_THAT(parts(), testing::IsEmpty());
    EXPECT_EQ(
        send(upload, 200, "x"), "1011: The upload 1 is not under way. Announce it again to learn where it goes on.");
    EXPECT_EQ(ask(server, "upload <id>", announcement(record, drawing(1))), started(2));
}

TEST_F(ServerContents, LeaveNothingBehindThatCleaningDoesNotFind)
{
    put(drawing(1));
    std::int64_t const upload = begin(announcement(recordOf(drawing(2)), drawing(2)));
    send(upload, 0, "some");
    folder().write("server/contents/" + id() + "/77/77", "put in place, and then the power went");
    folder().write("server/contents/" + id() + "/02/2", "the same, and the upload may go on");
    folder().write("server/uploads/78", "");
    folder().write("server/uploads/78.123", "");
    folder().write("server/uploads/2.123", "");
    clean();
    EXPECT_THAT(
        contentFiles(), testing::ElementsAre("server/contents/" + id() + "/01/1", "server/contents/" + id() + "/02/2"));
    EXPECT_THAT(parts(), testing::ElementsAre("server/uploads/2", "server/uploads/2.123"));
}

TEST_F(ServerContents, SurviveEveryCallThatFails)
{
    std::string const content = drawing(1);
    std::string const record = recordOf(content);
    std::string const document = announcement(record, content);
    auto const sendAll = [&] {
        std::string const answer = ask(server, "upload <id>", document);
        if (answer == R"({"uploads":[{"done":true}]})") {
            return std::string("done");
        }
        std::size_t const place = answer.find(R"("upload":)");
        if (place == std::string::npos) {
            return answer;
        }
        std::int64_t const upload = std::stoll(answer.substr(place + 9));
        std::string const sent = send(upload, 0, record);
        return sent == "done" ? finish(upload) : sent;
    };
    for (int n = 0;; ++n) {
        std::optional<support::FailingCall> failing(std::in_place, n, EIO);
        std::string const answer = sendAll();
        bool const hasFailed = failing->hasFailed();
        failing.reset();
        EXPECT_EQ(sendAll(), "done") << "after call " << n << ": " << answer;
        EXPECT_TRUE(isReadable(content)) << n;
        now += 15 * kDay;
        clean();
        EXPECT_THAT(contentFiles(), testing::IsEmpty()) << n;
        EXPECT_THAT(parts(), testing::IsEmpty()) << n;
        if (!hasFailed) {
            EXPECT_GT(n, 5);
            break;
        }
    }
}

TEST_F(ServerContents, OfOneRequestCountEvenIfOthersAreRefused)
{
    std::string const first = drawing(1);
    std::string const second = edited(first, 2);
    std::string const broken = drawing(3);
    std::vector<std::string> const records = {
        recordOf(broken), recordOf(first), recordOf(second, first), recordOf(drawing(4))};
    auto const line = [&](std::string const& record, std::string const& content, std::string const& base) {
        std::string const whole = announcement(record, content, base);
        std::size_t const begin = whole.find('[') + 1;
        return whole.substr(begin, whole.size() - begin - 2);
    };
    std::string const document = R"({"folder":")" + folderNamed('1') + R"(","records":)" +
                                 server::joined(
                                     {line(records[0], broken, ""), line(records[1], first, ""),
                                      line(records[2], second, first), line(records[3], drawing(4), "")}) +
                                 "}";
    EXPECT_EQ(
        ask(server, "upload <id>", document),
        R"({"uploads":[{"offset":0,"upload":1},{"offset":0,"upload":2},{"offset":0,"upload":3},{"offset":0,"upload":4}]})");
    send(1, 0, std::string(records[0].size(), 'x'));
    send(2, 0, records[1]);
    send(3, 0, records[2]);
    send(4, 0, records[3].substr(1));
    EXPECT_EQ(
        requested("finish", R"({"folder":")" + folderNamed('1') + R"(","uploads":[1,2,3,4,2,9]})"),
        "1010: The record that was sent has another digest than the one announced. Send it again.");
    EXPECT_EQ(missing({broken, first, second, drawing(4)}, {}, true), lacking({broken, drawing(4)}));
    EXPECT_EQ(parts().size(), 1u) << "the rest of it may come";
}

TEST_F(ServerContents, OfManyRecordsAreFlushedTogether)
{
    std::vector<std::string> contents;
    std::vector<std::string> uploads;
    for (unsigned i = 0; i < 20; ++i) {
        contents.push_back(drawing(i, 500));
        std::string const record = recordOf(contents.back());
        std::int64_t const upload = begin(announcement(record, contents.back()));
        ASSERT_EQ(send(upload, 0, record), "done");
        uploads.push_back(std::to_string(upload));
    }
    EXPECT_EQ(
        requested("finish", R"({"folder":")" + folderNamed('1') + R"(","uploads":)" + server::joined(uploads) + "}"),
        "done");
    EXPECT_EQ(missing(contents, {}, true), lacking({}));
    EXPECT_EQ(contentFiles().size(), 20u);
}

TEST_F(ServerContents, OnAFullDiskAreRefusedAndGoOnLater)
{
    std::string const record = recordOf(drawing(1));
    std::int64_t const upload = begin(announcement(record, drawing(1)));
    {
        support::FailingCall const full(0, ENOSPC, support::FailingCall::Lasts::on);
        EXPECT_EQ(
            send(upload, 0, record),
            "1016: The upload 1 cannot be written: No space left on device. Nothing has changed on the server.");
    }
    EXPECT_EQ(send(upload, 0, record), "done");
    EXPECT_EQ(finish(upload), "done");
}

/// A server that a tav without contents made: two commits of three contents.
class EarlierServer : public testing::Test {
protected:
    EarlierServer()
    {
        std::filesystem::copy(std::string(TAV_GOLDEN) + "/server_2/server.db", folder.pathTo("server.db"));
    }

    std::string ask(std::string const& verb, std::string const& document)
    {
        auto const answer =
            server.request(server::wideText(verb + " 8fc3755cd6a4dab827d842240ce01955"), server::wideText(document));
        return answer.hasValue() ? answer.value().ansi_str() : answer.error().message.ansi_str();
    }

    std::int64_t version() const { return tav::Database(folder.pathTo("server.db")).version(); }

    support::TempFolder const folder;
    tav::EmbeddedServer server{folder.path()};
};

TEST_F(EarlierServer, AwaitsAllContentsOfItsCommits)
{
    std::string const before = ask("history", "[]");
    std::string const notes = R"("2c8b08da5ce60398e1f19af0e5dccc744df274b826abe585eaba68c525434806")";
    std::string const located = R"({"awaited":[)" + notes + R"(],"records":[]})";
    EXPECT_EQ(ask("locate", R"({"contents":[)" + notes + "]}"), located);
    EXPECT_EQ(version(), 2) << "who reads leaves it as it is";
    EXPECT_EQ(ask("missing", R"({"contents":[]})"), R"({"contents":[]})");
    EXPECT_EQ(version(), 3);
    EXPECT_EQ(ask("locate", R"({"contents":[)" + notes + "]}"), located);
    tav::Database const database(folder.pathTo("server.db"));
    tav::Statement rows = database.prepare("SELECT count(*) FROM awaited");
    ASSERT_TRUE(rows.next());
    EXPECT_EQ(rows.integer(0), 3);
    EXPECT_EQ(ask("history", "[]"), before);
}

struct HostileRow {
    char const* name;
    char const* verb;
    char const* document;
    std::int32_t code;
    char const* message;
};

class ServerContentsDocument
    : public server::ServerTest
    , public testing::WithParamInterface<HostileRow> {};

TEST_P(ServerContentsDocument, IsRefusedWithItsCode)
{
    tav::EmbeddedServer server(serverFolder());
    auto const answer = server.request(
        server::wideText(std::string(GetParam().verb) + " " + id()), server::wideText(GetParam().document));
    ASSERT_FALSE(answer.hasValue());
    EXPECT_EQ(answer.error().code, GetParam().code);
    EXPECT_EQ(
        answer.error().message.ansi_str(), std::string(GetParam().message) + " Nothing has changed on the server.");
}

#define HEX64 "e3b0c44298fc1c149afbf4c8996fb92427ae41e4649b934ca495991b7852b855"
#define HEX32 "e3b0c44298fc1c149afbf4c8996fb924"

INSTANTIATE_TEST_SUITE_P(
    Documents, ServerContentsDocument,
    testing::Values(
        HostileRow{"MissingOfNoJson", "missing", "", 1014, "The document is not valid JSON."},
        HostileRow{"MissingWithoutContents", "missing", "{}", 1014, "The document lacks the member 'contents'."},
        HostileRow{
            "MissingWithBadDigest", "missing", R"({"contents":[{"digest":"1"}]})", 1014,
            "'contents[0].digest' must be a hash of 64 lower-case hexadecimal digits."},
        HostileRow{
            "MissingWithBadCheck", "missing", R"({"check":1,"contents":[]})", 1014,
            "'check' must be of type bool, not int."},
        HostileRow{
            "UploadWithNegativeLength", "upload",
            R"({"folder":")" HEX32 R"(","records":[{"record":")" HEX64 R"(","digest":")" HEX64
            R"(","recordLength":-1}]})",
            1014, "'records[0].recordLength' must not be negative."},
        HostileRow{
            "UploadWithEndlessLength", "upload",
            R"({"folder":")" HEX32 R"(","records":[{"record":")" HEX64 R"(","digest":")" HEX64
            R"(","recordLength":18446744073709551615}]})",
            1015, "The record is longer than 68719476736 bytes."},
        HostileRow{
            "UploadOfNoFolder", "upload", R"({"folder":"../1"})", 1014,
            "'folder' must be an identifier of 32 lower-case hexadecimal digits."},
        HostileRow{
            "FinishWithText", "finish", R"({"folder":")" HEX32 R"(","uploads":["1"]})", 1014,
            "'uploads[0]' must be of type int, not string."},
        HostileRow{
            "LocateWithNumber", "locate", R"({"contents":[1]})", 1014,
            "'contents[0]' must be of type string, not int."},
        HostileRow{"Unknown", "contents", "{}", 1014, "The server does not know the request 'contents'."}),
    support::rowName);

class ServerContentsDocuments : public server::ServerTest {};

TEST_F(ServerContentsDocuments, NameAThousandContentsAtMost)
{
    tav::EmbeddedServer server(serverFolder());
    std::vector<std::string> const many(1001, "\"" HEX64 "\"");
    std::string const tooMany = "error: The document names 1001 contents, and 1000 is the most. Nothing has changed on "
                                "the server.";
    EXPECT_EQ(ask(server, "locate <id>", R"({"contents":)" + server::joined(many) + "}"), tooMany);
    EXPECT_EQ(ask(server, "missing <id>", R"({"contents":)" + server::joined(many) + "}"), tooMany);
    std::vector<std::string> const most(1000, "\"" HEX64 "\"");
    EXPECT_EQ(
        ask(server, "locate <id>", R"({"contents":)" + server::joined(most) + "}").rfind(R"({"awaited":[)", 0), 0u);
}

TEST_F(ServerContentsDocuments, CutOffAnywhereAreErrors)
{
    tav::EmbeddedServer server(serverFolder());
    std::string const upload =
        R"({"folder":")" HEX32 R"(","records":[{"record":")" HEX64 R"(","digest":")" HEX64 R"(","recordLength":5}]})";
    for (std::size_t length = 0; length < upload.size(); ++length) {
        ASSERT_EQ(
            ask(server, "upload <id>", upload.substr(0, length)),
            "error: The document is not valid JSON. Nothing has changed on the server.");
    }
}

} // namespace
