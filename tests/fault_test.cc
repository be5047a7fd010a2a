// SPDX-License-Identifier: BSD-2-Clause
#include <array>
#include <cerrno>
#include <csignal>
#include <cstring>
#include <filesystem>

#include <fcntl.h>
#include <sys/ptrace.h>
#include <sys/syscall.h>
#include <sys/uio.h>
#include <sys/user.h>
#include <sys/wait.h>
#include <unistd.h>

#include "private_root.h"

namespace tz::test {
namespace {

constexpr int killed = 0; // stands beside the errors

const std::map<std::string, std::string> starts = {
    {"settled", "zoneinfo->@2016d/zoneinfo, icutz->@2016d/icutz, tz_latest->@2016d"},
    {"adopt", "zoneinfo->/usr/share/zoneinfo.default, tz_latest->@2016d"},
    {"replace", "zoneinfo->@2016d/zoneinfo, icutz->@2016d/icutz, tz_latest->@2016e"},
    {"drop", "zoneinfo->@2016a/zoneinfo, icutz->@2016a/icutz"},
    {"drop and adopt", "zoneinfo->@2016a/zoneinfo, icutz->@2016a/icutz, tz_latest->@2016d"},
    {"missing current link", "tz_latest->@2016d"},
    {"legacy layout", "zoneinfo->@2016d/zoneinfo, /var/db/icutz->@2016d/icutz, /var/db/icu/, "
                      "localtime->/usr/share/zoneinfo/x"},
};

bool usable() {
    return std::filesystem::exists("/var/db/timezone/zoneinfo/+VERSION");
}

// What happened to the one system call that was disturbed.
struct disturbance {
    bool hit = false;
    bool of_the_zoneinfo_link = false; // its removal or creation
    int status = 0;                    // of the program, as wait(2) tells it
};

bool changes_the_zoneinfo_link(pid_t child, const user_regs_struct& registers) {
    const auto path = registers.orig_rax == SYS_unlink ? registers.rdi : registers.rsi;
    std::array<char, 64> text{};
    iovec here{text.data(), text.size()};
    iovec there{reinterpret_cast<void*>(path), text.size()}; // NOLINT(*-int-to-ptr)
    return (registers.orig_rax == SYS_unlink || registers.orig_rax == SYS_symlink) &&
           ::process_vm_readv(child, &here, 1, &there, 1, 0) > 0 &&
           std::string(text.data()) == "/var/db/timezone/zoneinfo";
}

unsigned long long minus(int number) {
    return static_cast<unsigned long long>(-number);
}

// Lets the program run to its next stop; false if it has ended.
bool go_on(pid_t child, int& status) {
    const int stopped_by = WSTOPSIG(status);
    const bool is_ours = stopped_by == SIGSTOP || (stopped_by & ~0x80) == SIGTRAP;
    ::ptrace(PTRACE_SYSCALL, child, 0, is_ours ? 0 : stopped_by);
    ::waitpid(child, &status, 0);
    return WIFSTOPPED(status);
}

// Runs the program and makes its system call number `nth` since main began fail with `error`, or
// kills it there. (Before main the C library is on its own: it gives up, with nothing touched.)
disturbance disturb(int nth, int error) {
    disturbance result;
    const pid_t child = start_program([] {
        ::ptrace(PTRACE_TRACEME);
        (void)std::raise(SIGSTOP);
    });
    ::waitpid(child, &result.status, 0);
    ::ptrace(PTRACE_SETOPTIONS, child, 0, PTRACE_O_TRACESYSGOOD);

    int calls = 0;
    user_regs_struct entered{};
    unsigned long long program_break = 0;
    for (bool entering = true; go_on(child, result.status);) {
        if (WSTOPSIG(result.status) != (SIGTRAP | 0x80)) {
            continue;
        }
        user_regs_struct registers{};
        ::ptrace(PTRACE_GETREGS, child, 0, &registers);
        if (entering) {
            entered = registers;
            calls += calls > 0 || registers.orig_rax == SYS_fcntl ? 1 : 0;
        }
        const bool now = calls == nth && entered.orig_rax != SYS_exit_group; // which cannot fail
        if (now && entering) {
            result.hit = true;
            result.of_the_zoneinfo_link = changes_the_zoneinfo_link(child, registers);
            registers.orig_rax = minus(1); // there is no such call
            ::ptrace(PTRACE_SETREGS, child, 0, &registers);
            if (error == killed) {
                ::kill(child, SIGKILL);
            }
        } else if (now) { // brk alone tells no error: it answers with the break as it was
            registers.rax = entered.orig_rax == SYS_brk ? program_break : minus(error);
            ::ptrace(PTRACE_SETREGS, child, 0, &registers);
        } else if (entered.orig_rax == SYS_brk) {
            program_break = registers.rax;
        }
        entering = !entering;
    }
    return result;
}

// Disturbs one call of a start, and looks at what is left; false if there is no such call.
bool survives(const std::string& links, int nth, int error) {
    lay_out(parsed(three_updates + links));
    const bool was_usable = usable();
    disturbance result;
    const auto said = warnings_of([&] { result = disturb(nth, error); });
    if (result.hit && error == killed) {
        EXPECT_TRUE(WIFSIGNALED(result.status) && WTERMSIG(result.status) == SIGKILL);
        EXPECT_TRUE(usable() || !was_usable || result.of_the_zoneinfo_link);
    } else {
        const bool gave_up = said.ends_with("Could not set all time-zone links\n");
        EXPECT_TRUE(WIFEXITED(result.status) && WEXITSTATUS(result.status) == (gave_up ? 1 : 0))
            << result.status << said;
        EXPECT_TRUE(usable() || result.of_the_zoneinfo_link);
    }
    warnings_of([] { EXPECT_EQ(run_program(), 0); });
    EXPECT_TRUE(usable());
    return result.hit;
}

void disturb_every_call(const std::map<std::string, std::string>& among,
                        const std::vector<int>& errors) {
    std::size_t tried = 0;
    for (const auto& [name, links] : among) {
        for (const int error : errors) {
            int nth = 1;
            for (; survives(links, nth, error); ++nth, ++tried) {
                ASSERT_FALSE(testing::Test::HasFailure())
                    << name << ", call " << nth << ": " << std::strerror(error);
            }
        }
    }
    EXPECT_GT(tried, 30 * among.size() * errors.size());
    std::cout << tried << " disturbed starts\n";
}

TEST(fault, at_any_call_is_survived) {
    disturb_every_call({*starts.find("drop and adopt")}, {killed, EIO});
}

TEST(fault, DISABLED_at_any_call_of_any_start_is_survived) {
    disturb_every_call(starts, {killed, EIO, ENOENT, EACCES, EEXIST, ENOMEM, ENOSPC, EINTR, EMFILE,
                                EROFS, EINVAL});
}

} // namespace
} // namespace tz::test
