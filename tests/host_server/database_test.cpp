#include "host/database/sqlite.h"
#include "host/errors/failure.h"

#include "tests/support/temp_folder.h"

#include <gtest/gtest.h>

#include <chrono>
#include <functional>
#include <string>

namespace {

using std::chrono::milliseconds;

std::string failureOf(std::function<void()> const& operation)
{
    try {
        operation();
        return "no failure";
    } catch (tav::Failure const& failure) {
        return failure.what + " " + failure.next;
    }
}

class DatabaseTest : public testing::Test {
protected:
    DatabaseTest() { database.run("CREATE TABLE notes (number INTEGER, text TEXT)"); }

    void add(std::int64_t number, OdString const& text)
    {
        database.prepare("INSERT INTO notes VALUES (?, ?)").with(number).with(text).run();
    }

    static std::string notes(tav::Database const& from)
    {
        std::string all;
        tav::Statement rows = from.prepare("SELECT number, text FROM notes ORDER BY number");
        while (rows.next()) {
            all += std::to_string(rows.integer(0)) + " " + rows.text(1).ansi_str() + ";";
        }
        return all;
    }

    support::TempFolder folder;
    std::string const path = folder.pathTo("notes.db");
    tav::Database database{path, milliseconds(1)};
};

TEST_F(DatabaseTest, KeepsTextsOfAnyCharacters)
{
    OdString const text = OdString(L"a\0\U0001F600\xDCFF", 4);
    add(1, text);
    tav::Statement row = database.prepare("SELECT text FROM notes");
    ASSERT_TRUE(row.next());
    EXPECT_EQ(row.text(0), text);
}

TEST_F(DatabaseTest, ReadsNullAsZeroAndEmpty)
{
    database.run("INSERT INTO notes VALUES (NULL, NULL)");
    EXPECT_EQ(notes(database), "0 ;");
}

TEST_F(DatabaseTest, RunsAStatementAgainWithOtherParameters)
{
    tav::Statement insert = database.prepare("INSERT INTO notes VALUES (?, ?)");
    insert.with(1).with(L"one").run();
    insert.with(2).with(L"two").run();
    EXPECT_EQ(notes(database), "1 one;2 two;");
}

TEST_F(DatabaseTest, RunsNothingThatAStrangerPutIntoTheFile)
{
    database.run("CREATE TRIGGER trap AFTER INSERT ON notes BEGIN DELETE FROM notes; END;"
                 "CREATE VIEW shown AS SELECT * FROM notes;");
    add(1, L"one");
    EXPECT_EQ(notes(database), "1 one;");
    EXPECT_THROW(database.prepare("SELECT * FROM shown"), tav::Failure);
}

TEST_F(DatabaseTest, ReadsOneMomentWhileAReadTransactionLives)
{
    add(1, L"one");
    tav::Database other(path);
    {
        tav::ReadTransaction const transaction(database);
        EXPECT_EQ(notes(database), "1 one;");
        EXPECT_THROW(
            tav::Database(path, std::chrono::milliseconds(0)).run("INSERT INTO notes VALUES (2, 'two')"), tav::Failure);
        EXPECT_EQ(notes(database), "1 one;");
    }
    other.run("INSERT INTO notes VALUES (3, 'three')");
    EXPECT_EQ(notes(database), "1 one;3 three;");
}

TEST_F(DatabaseTest, ReadsInsideOfAWriteTransaction)
{
    tav::WriteTransaction transaction(database);
    add(1, L"one");
    {
        tav::ReadTransaction const reading(database);
        EXPECT_EQ(notes(database), "1 one;");
    }
    transaction.commit();
    EXPECT_EQ(notes(database), "1 one;");
}

TEST_F(DatabaseTest, HasSmallPagesUnlessTheFileHasOthersAlready)
{
    auto const pageSize = [](tav::Database const& from) {
        tav::Statement row = from.prepare("PRAGMA page_size");
        return row.next() ? row.integer(0) : 0;
    };
    EXPECT_EQ(pageSize(database), 2048);
    std::string const earlier = folder.pathTo("earlier.db");
    {
        tav::Database other(earlier);
        other.run("PRAGMA page_size = 4096; CREATE TABLE notes (number INTEGER)");
    }
    EXPECT_EQ(pageSize(tav::Database(earlier)), 4096);
}

TEST_F(DatabaseTest, IsInTheFileWithExactlyThatName)
{
    for (char const* const name : {"50%25.db", "a?mode=ro&vfs=x.db", "a#b.db", "//slashes.db", "ä b.db"}) {
        tav::Database(folder.pathTo(name)).run("CREATE TABLE notes (number INTEGER)");
        EXPECT_GT(folder.read(name).size(), 0u) << name;
    }
}

TEST_F(DatabaseTest, KeepsWholeSectorsOfTheDiskInItsJournal)
{
    tav::WriteTransaction const transaction(database);
    add(1, L"one");
    std::string const header = folder.read("notes.db-journal").substr(0, 28);
    ASSERT_EQ(header.size(), 28u);
    EXPECT_EQ(header.substr(20, 4), std::string("\0\0\x10\0", 4)) << "the length of a sector, 4096 bytes";
}

TEST_F(DatabaseTest, KeepsWhatWasCommitted)
{
    tav::WriteTransaction transaction(database);
    add(1, L"one");
    transaction.commit();
    EXPECT_EQ(notes(tav::Database(path)), "1 one;");
}

TEST_F(DatabaseTest, UndoesWhatWasNotCommitted)
{
    {
        tav::WriteTransaction const transaction(database);
        add(1, L"one");
        EXPECT_EQ(notes(database), "1 one;");
    }
    EXPECT_EQ(notes(database), "");
}

TEST_F(DatabaseTest, ShowsOthersNothingOfAnOpenTransaction)
{
    tav::WriteTransaction const transaction(database);
    add(1, L"one");
    EXPECT_EQ(notes(tav::Database(path, milliseconds(1))), "");
}

TEST_F(DatabaseTest, SaysThatAnotherProgramUsesIt)
{
    tav::WriteTransaction const transaction(database);
    tav::Database other(path, milliseconds(1));
    EXPECT_EQ(
        failureOf([&] { tav::WriteTransaction const second(other); }),
        "The database '" + path +
            "' cannot be used: database is locked. Another program uses it; run the command again when that is done.");
}

TEST_F(DatabaseTest, SaysThatTheFileIsNoDatabase)
{
    folder.write("other.db", std::string(8192, 'x'));
    EXPECT_EQ(
        failureOf([&] { tav::Database(folder.pathTo("other.db")).version(); }),
        "The database '" + folder.pathTo("other.db") +
            "' cannot be used: file is not a database. Put a copy of it from a backup in its place.");
}

TEST_F(DatabaseTest, FindsDamage)
{
    for (int i = 0; i < 1000; ++i) {
        add(i, L"a text that is long enough to fill some pages of the file");
    }
    EXPECT_EQ(database.damage(), "");
    std::string content = folder.read("notes.db");
    ASSERT_GT(content.size(), 20000u);
    content.replace(12288, 64, std::string(64, '\xFF'));
    folder.write("damaged.db", content);
    EXPECT_NE(tav::Database(folder.pathTo("damaged.db")).damage(), "");
    EXPECT_EQ(
        failureOf([&] { notes(tav::Database(folder.pathTo("damaged.db"))); }),
        "The database '" + folder.pathTo("damaged.db") +
            "' cannot be used: database disk image is malformed. Put a copy of it from a backup in its place.");
}

TEST_F(DatabaseTest, SaysThatItsFolderIsMissing)
{
    std::string const nowhere = folder.pathTo("nowhere/a.db");
    EXPECT_EQ(
        failureOf([&] { tav::Database const none(nowhere); }),
        "The database '" + nowhere +
            "' cannot be used: unable to open database file. Check the free space and your rights in the folder of '" +
            nowhere + "'.");
}

TEST_F(DatabaseTest, KeepsTheVersionOfItsTables)
{
    EXPECT_EQ(database.version(), 0);
    database.setVersion(7);
    EXPECT_EQ(tav::Database(path).version(), 7);
}

} // namespace
