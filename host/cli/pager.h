/// Showing long output page by page.
#pragma once

#include <sys/types.h>

namespace tav {

/// While it lives, what is printed on a terminal goes through the user's pager. When the user ends the pager, tav ends
/// too, quietly. There is one at a time, and only in commands that change nothing.
class Pager {
public:
    Pager();
    Pager(Pager const&) = delete;
    Pager& operator=(Pager const&) = delete;
    ~Pager();

private:
    void start(char const* command);

    int terminal_ = -1; ///< the standard output that waits; -1 without a pager
};

} // namespace tav
