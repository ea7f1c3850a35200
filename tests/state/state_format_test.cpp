// The example in the description of the state file.
#include "tests/state/golden.h"
#include "tests/state/states.h"

#include <gmock/gmock.h>
#include <string>

namespace {

using namespace states;

/// The block of JSON in the description; there is exactly one.
std::string example()
{
    std::string const description = contentOf(MU_STATE_FORMAT);
    std::string const open = "\n```json\n";
    std::size_t const begin = description.find(open);
    EXPECT_NE(begin, std::string::npos);
    EXPECT_EQ(description.find(open, begin + 1), std::string::npos);
    std::size_t const content = begin + open.size();
    return description.substr(content, description.find("\n```\n", content) - content);
}

TEST(StateFormat, ExampleIsReadAsTheDescriptionSays)
{
    EXPECT_EQ(
        Repository(example()).loaded(), "HEAD feature\n"
                                        "staged modified plans/ground.dwg\n"
                                        "staged added plans/roof-new.dwg\n"
                                        "staged removed plans/gr\xC3\xBCndung.dwg\n"
                                        "rename plans/roof.dwg -> plans/roof-new.dwg\n"
                                        "index plans/ground.dwg 1700000000123456789 modified\n"
                                        "index plans/roof-new.dwg 1700000500000000000\n");
}

TEST(StateFormat, ExampleIsWrittenByteForByte)
{
    Repository const repository(example());
    State const state = repository.open()->read();
    Repository const other;
    EXPECT_EQ(other.saved(state), example());
}

TEST(StateFormat, ExampleIsWrittenByteForByteByItsOwnCache)
{
    Repository const repository(example());
    repository.open()->write();
    EXPECT_EQ(repository.stateFile(), example());
}

} // namespace
