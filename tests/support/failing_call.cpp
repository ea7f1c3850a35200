#include "tests/support/failing_call.h"

#include "platform/os/os_calls.h"

#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <fcntl.h>
#include <limits>
#include <type_traits>
#include <unistd.h>

namespace support {
namespace {

struct Plan {
    bool active = false;
    int failing = 0; // the number of the call that fails
    int error = 0;
    FailingCall::Lasts lasts = FailingCall::Lasts::once;
    int count = 0; // calls so far
    char const* failed = nullptr;
};

Plan plan;
os::Calls real;

bool isHit(int number, bool needsRoom)
{
    if (plan.lasts == FailingCall::Lasts::once) {
        return number == plan.failing;
    }
    return number >= plan.failing && (needsRoom || plan.error != ENOSPC);
}

bool mustFail(char const* name, bool needsRoom)
{
    if (!isHit(plan.count++, needsRoom)) {
        return false;
    }
    if (plan.error == FailingCall::kKillProcess) {
        std::raise(SIGKILL);
    }
    plan.failed = plan.failed == nullptr ? name : plan.failed;
    return true;
}

bool makesFile(int folder, char const* path, int flags, mode_t /*mode*/)
{
    bool const isUnnamed = (flags & O_TMPFILE) == O_TMPFILE;
    return isUnnamed || ((flags & O_CREAT) != 0 && faccessat(folder, path, F_OK, AT_SYMLINK_NOFOLLOW) == -1);
}

template <auto Member>
struct StandIn;

template <class Result, class... Arguments, Result (*os::Calls::*Member)(Arguments...)>
struct StandIn<Member> {
    static inline char const* name = nullptr;

    static bool needsRoom([[maybe_unused]] Arguments... arguments)
    {
        if constexpr (std::is_same_v<StandIn, StandIn<&os::Calls::openat>>) {
            return makesFile(arguments...);
        }
        return isAnyOf<
            &os::Calls::write, &os::Calls::pwrite, &os::Calls::linkat, &os::Calls::mkdir, &os::Calls::mkdirat>();
    }

    template <auto... Members>
    static constexpr bool isAnyOf()
    {
        return (std::is_same_v<StandIn, StandIn<Members>> || ...);
    }

    static Result call(Arguments... arguments)
    {
        if (!mustFail(name, needsRoom(arguments...))) {
            return (real.*Member)(arguments...);
        }
        if constexpr (std::is_same_v<StandIn, StandIn<&os::Calls::close>>) {
            real.close(arguments...);
        }
        errno = plan.error;
        return -1;
    }
};

template <auto Member>
void standInFor(char const* name)
{
    StandIn<Member>::name = name;
    os::calls().*Member = StandIn<Member>::call;
}

void standInForAll()
{
    standInFor<&os::Calls::openat>("openat");
    standInFor<&os::Calls::read>("read");
    standInFor<&os::Calls::write>("write");
    standInFor<&os::Calls::pread>("pread");
    standInFor<&os::Calls::pwrite>("pwrite");
    standInFor<&os::Calls::ftruncate>("ftruncate");
    standInFor<&os::Calls::fsync>("fsync");
    standInFor<&os::Calls::syncfs>("syncfs");
    standInFor<&os::Calls::close>("close");
    standInFor<&os::Calls::flock>("flock");
    standInFor<&os::Calls::fchown>("fchown");
    standInFor<&os::Calls::fchmod>("fchmod");
    standInFor<&os::Calls::fsetxattr>("fsetxattr");
    standInFor<&os::Calls::fremovexattr>("fremovexattr");
    standInFor<&os::Calls::linkat>("linkat");
    standInFor<&os::Calls::renameat>("renameat");
    standInFor<&os::Calls::renameat2>("renameat2");
    standInFor<&os::Calls::unlinkat>("unlinkat");
    standInFor<&os::Calls::mkdir>("mkdir");
    standInFor<&os::Calls::mkdirat>("mkdirat");
    standInFor<&os::Calls::futimens>("futimens");
}

} // namespace

FailingCall::FailingCall(int n, int error, Lasts lasts)
{
    if (plan.active) {
        std::fputs("FailingCall: one is active already\n", stderr);
        std::abort();
    }
    plan = {true, n, error, lasts, 0, nullptr};
    real = os::calls();
    standInForAll();
}

FailingCall::~FailingCall()
{
    os::calls() = real;
    plan.active = false;
}

bool FailingCall::hasFailed() const
{
    return plan.failed != nullptr;
}

std::string FailingCall::name() const
{
    return hasFailed() ? std::to_string(plan.failing) + ": " + plan.failed : "no call";
}

int countCalls(std::function<void()> const& operation)
{
    FailingCall const watching(std::numeric_limits<int>::max(), 0);
    operation();
    return plan.count;
}

} // namespace support
