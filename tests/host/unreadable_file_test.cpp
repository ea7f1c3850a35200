// Files that the user may not read: nothing overwrites them, as nobody could bring them back.
#include "tests/host/run_tav.h"
#include "tests/support/as_ordinary_user.h"
#include "tests/support/temp_folder.h"

#include <gtest/gtest.h>

#include <string>
#include <sys/stat.h>
#include <unistd.h>

namespace host_tests {
namespace {

class UnreadableFile : public testing::Test {
protected:
    UnreadableFile() { chmod(place.path().c_str(), 0777); }

    /// As an ordinary user: what the command says, and what "a.dwg", which nobody could read meanwhile, holds then.
    std::string after(Arguments const& command) const
    {
        return support::asOrdinaryUser([&] {
            umask(0);
            place.write("repository/a.dwg", "one");
            tav({"init", "--server", place.pathTo("server")});
            commit("first");
            place.write("repository/a.dwg", "two");
            commit("second");
            place.write("repository/a.dwg", "unsaved");
            setRights(0);
            std::string const said = testing::PrintToString(tav(command));
            setRights(0666);
            return said + "\n" + place.read("repository/a.dwg");
        });
    }

    static std::string refused()
    {
        return testing::PrintToString(
                   failed("tav: 'a.dwg' cannot be read, so it could not be brought back. Nothing has been written; "
                          "make it readable or move it away.\n")) +
               "\nunsaved";
    }

private:
    void commit(std::string const& message) const
    {
        tav({"add", "--all"});
        tav({"commit", "-m", message, "--author", "ann"});
    }

    void setRights(mode_t rights) const { chmod(place.pathTo("repository/a.dwg").c_str(), rights); }

    Outcome tav(Arguments const& arguments) const
    {
        Setting setting;
        setting.folder = place.pathTo("repository");
        setting.environment = {
            "HOME=" + place.path(), "XDG_CONFIG_HOME=" + place.path(), "XDG_DATA_HOME=" + place.path()};
        return run(setting, arguments);
    }

    support::TempFolder const place;
};

TEST_F(UnreadableFile, IsNotOverwrittenByARestore)
{
    EXPECT_EQ(after({"restore", "--force", "a.dwg"}), refused());
}

TEST_F(UnreadableFile, IsNotOverwrittenByARestoreOfAnEarlierVersion)
{
    EXPECT_EQ(after({"restore", "--force", "--from", "1", "a.dwg"}), refused());
}

TEST_F(UnreadableFile, IsNotOverwrittenByARestoreToItsPath)
{
    EXPECT_EQ(after({"restore", "--force", "--from", "1", "--to", "a.dwg", "a.dwg"}), refused());
}

TEST_F(UnreadableFile, IsNotOverwrittenByAMoveToAnotherCommit)
{
    EXPECT_EQ(after({"checkout", "--force", "1"}), refused());
}

TEST_F(UnreadableFile, IsNotOverwrittenByAMoveToABranch)
{
    EXPECT_EQ(after({"switch", "--force", "master"}), refused());
}

} // namespace
} // namespace host_tests
