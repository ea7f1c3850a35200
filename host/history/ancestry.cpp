#include "host/history/ancestry.h"

#include <functional>
#include <set>

namespace tav {

std::vector<std::int64_t> const& Ancestry::parents(std::int64_t commit) const
{
    static std::vector<std::int64_t> const none;
    auto const found = parents_.find(commit);
    return found == parents_.end() ? none : found->second;
}

std::int64_t Ancestry::firstParent(std::int64_t commit) const
{
    std::vector<std::int64_t> const& all = parents(commit);
    return all.empty() ? 0 : all.front();
}

std::vector<std::int64_t> Ancestry::past(std::vector<std::int64_t> const& starts) const
{
    std::set<std::int64_t, std::greater<>> waiting(starts.begin(), starts.end());
    std::vector<std::int64_t> past;
    while (!waiting.empty()) {
        std::int64_t const commit = *waiting.begin();
        waiting.erase(waiting.begin());
        past.push_back(commit);
        waiting.insert(parents(commit).begin(), parents(commit).end());
    }
    return past;
}

} // namespace tav
