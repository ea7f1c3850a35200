/// States that show at every place how often they were rewritten, so that a mixture of two is seen.
#pragma once

#include "tests/state/states.h"
#include "tests/support/utf8.h"

#include <cstdint>
#include <string>

namespace states {

constexpr int kEntries = 300;

/// Its place in the index, with leading zeros: in the order of numbers.
inline std::string entryPath(int entry)
{
    return "plans/house-" + std::to_string(1000 + entry) + ".dwg";
}

/// The state after so many rewritings.
inline State generation(std::uint64_t number)
{
    State state;
    state.head = support::fromUtf8("generation-" + std::to_string(number));
    for (int entry = 0; entry < kEntries; ++entry) {
        state.index[support::fromUtf8(entryPath(entry))] = {number, number % 2 == 1};
    }
    return state;
}

/// Its document, composed here independently of the library.
inline std::string documentOf(std::uint64_t number)
{
    std::string const text = std::to_string(number);
    std::string document =
        "{\n    \"head\" : {\n        \"reference\" : \"generation-" + text + "\"\n    },\n    \"index\" : [\n";
    for (int entry = 0; entry < kEntries; ++entry) {
        document += "        {\n            \"data\" : {\n                \"last_checked\" : " + text +
                    ",\n                \"modified\" : " + (number % 2 == 1 ? "true" : "false") +
                    "\n            },\n            \"path\" : \"" + entryPath(entry) + "\"\n        }" +
                    (entry + 1 < kEntries ? ",\n" : "\n");
    }
    return document + "    ]\n}";
}

/// How often the state of `repository` was rewritten. Throws when it does not load or is no whole state.
inline std::uint64_t generationOf(Repository const& repository)
{
    std::shared_ptr<Cache> const cache = repository.open();
    State const& state = cache->read();
    std::uint64_t const number = state.index.empty() ? 0 : state.index.begin()->second.lastChecked;
    if (inWords(state) != inWords(generation(number))) {
        throw std::runtime_error("a mixture of states: " + inWords(state));
    }
    return number;
}

/// Loads the state, changes all of it, and saves it: one generation more. False when the host is told of an error.
inline bool rewrite(Repository const& repository)
{
    std::size_t const calls = repository.calls().size();
    {
        std::shared_ptr<Cache> const cache = repository.open();
        std::uint64_t const next = cache->read().index.begin()->second.lastChecked + 1;
        cache->write() = generation(next);
    }
    return repository.calls().size() == calls + 1 && repository.calls().back() == "report success";
}

} // namespace states
