/// Keeping the list of projects right when a working folder is moved.
#pragma once

namespace tav {

/// When the current folder is in a repository that the list has at a path where it is no longer, the entry gets its
/// path. Of a copy the original is still there, so its entry stays. The list is a convenience: failures are ignored.
void followMovedProject();

} // namespace tav
