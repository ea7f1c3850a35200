/// A repository with a history.
#pragma once

#include "tests/host/tav_test.h"

#include <regex>
#include <string>

namespace host_tests {

/// A repository that `tav init` has made, with the server and the list of projects in the home of the test.
class HistoryTest : public TavTest {
protected:
    HistoryTest() { EXPECT_EQ(tav({"init"}).code, 0); }

    /// Stages everything and commits it, with all removals.
    Outcome commitAll(std::string const& message) const
    {
        EXPECT_EQ(tav({"add", "--all"}).code, 0);
        return tav({"commit", "-m", message, "--author", "ann@studio", "--all-removed"});
    }

    /// What status shows below the line of the branch.
    std::string status() const
    {
        std::string const text = tav({"status"}).out;
        return text.substr(text.find("\n\n") + 2);
    }

    /// All values of the member `key` in the documents that a command prints, in their order.
    std::vector<std::string> values(Arguments arguments, std::string const& key) const
    {
        arguments.insert(arguments.begin() + 1, "--json"); // Not at the end, where "--" makes names of all.
        std::string const text = tav(arguments).out;
        std::regex const member("\"" + key + "\" : \"?([^\",\n]*)");
        std::vector<std::string> found;
        for (std::sregex_iterator match(text.begin(), text.end(), member), end; match != end; ++match) {
            found.push_back((*match)[1]);
        }
        return found;
    }

    static constexpr char const* kClean = "Nothing has changed since the last commit.\n";
};

} // namespace host_tests
