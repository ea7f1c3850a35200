// A platform whose text files are emptied on the disk when they are created, and a disk that takes nothing. A program
// of its own: what is defined here takes the place of the platform library's.
#include "platform/ut/TextFile.h"

#include "tests/state/states.h"

#include <fstream>
#include <gmock/gmock.h>
#include <string>

void ut::TextFile::create()
{
    std::ofstream(path_.ansi_str(), std::ios::trunc);
    lines_.clear();
    next_ = 0;
}

bool ut::TextFile::write()
{
    return false;
}

namespace {

using namespace states;

TEST(TruncatingPlatform, LeavesTheOldStateWhenTheNewOneCannotBeWritten)
{
    std::string const old = R"({"head": {"reference": "old"}})";
    Repository const repository(old);
    repository.open()->write().head = L"new";
    EXPECT_THAT(
        repository.calls(),
        testing::ElementsAre("report error: Error writing to file '" + repository.statePath() + "'"));
    EXPECT_EQ(repository.stateFile(), old);
}

} // namespace
