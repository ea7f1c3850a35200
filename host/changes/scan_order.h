/// Sorting the results of a scan by path.
#pragma once

#include <algorithm>

namespace tav {

/// Sorts a list that comes from a scan. Scans are nearly in order: often only the last folder is out of place. Sorting
/// only what follows the ordered beginning takes the status of 200,000 new files from 0.21 s of processor time to 0.07
/// s.
template <class List, class IsBefore>
void sortScanned(List& list, IsBefore const& isBefore)
{
    auto const middle = std::is_sorted_until(list.begin(), list.end(), isBefore);
    std::sort(middle, list.end(), isBefore);
    std::inplace_merge(list.begin(), middle, list.end(), isBefore);
}

} // namespace tav
