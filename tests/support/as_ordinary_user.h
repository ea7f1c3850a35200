/// Running a part of a test in a process of its own, with or without the rights of the administrator.
#pragma once

#include <functional>
#include <string>

namespace support {

/// Runs `body` in a forked child process that has given up the administrator's rights if it had them, and returns the
/// text that `body` returns, or a text that says how the child ended. Expectations belong to the parent: have `body`
/// return what it saw. Open the folders concerned to everybody before.
std::string asOrdinaryUser(std::function<std::string()> const& body);

/// The same with the rights that the test has.
std::string inOwnProcess(std::function<std::string()> const& body);

} // namespace support
