// SPDX-License-Identifier: BSD-2-Clause
#include <array>
#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <filesystem>

#include <fcntl.h>
#include <sys/mount.h>
#include <sys/ptrace.h>
#include <sys/resource.h>
#include <sys/syscall.h>
#include <sys/uio.h>
#include <sys/user.h>
#include <sys/wait.h>
#include <unistd.h>

#include "private_root.h"

namespace tz::test {
namespace {

constexpr int killed = 0; // stands beside the errors

// The system at 2016c, and updates that are older, newer and newest, each with its tz database.
const std::string data =
    "/usr/share/zoneinfo.default/+VERSION=2016c, /usr/share/icu/icutzformat.txt=44l, "
    "localtime->/var/db/timezone/zoneinfo/Europe/Paris, "
    "tz/2016a/zoneinfo/+VERSION=2016a, tz/2016a/icutz/icutz44l.dat=, "
    "tz/2016d/zoneinfo/+VERSION=2016d, tz/2016d/icutz/icutz44l.dat=, "
    "tz/2016e/zoneinfo/+VERSION=2016e, tz/2016e/icutz/icutz44l.dat=, ";

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

void limit(decltype(RLIMIT_FSIZE) resource, rlim_t value) {
    const rlimit both{value, value};
    ::setrlimit(resource, &both);
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
    lay_out(parsed(data + links));
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
    int tried = 0;
    for (const auto& [name, links] : among) {
        for (const int error : errors) {
            int nth = 1;
            while (survives(links, nth, error)) {
                ASSERT_FALSE(testing::Test::HasFailure())
                    << name << ", call " << nth << ": " << std::strerror(error);
                ++nth;
            }
            tried += nth - 1;
        }
    }
    std::cout << tried << " disturbed starts\n";
}

TEST(fault, at_any_call_is_survived) {
    disturb_every_call({*starts.find("drop and adopt")}, {killed, EIO});
}

TEST(fault, DISABLED_at_any_call_of_any_start_is_survived) {
    disturb_every_call(starts, {killed, EIO, ENOENT, EACCES, EEXIST, ENOMEM, ENOSPC, EINTR, EMFILE,
                                EROFS, EINVAL});
}

TEST(process, with_an_odd_environment_starts_all_the_same) {
    std::vector<std::pair<std::string, std::function<void()>>> oddities = {
        {"no environment", [] { ::clearenv(); }},
        {"a hostile environment",
         [] {
             for (const auto* name : {"LD_PRELOAD", "LC_ALL", "LANGUAGE", "NLSPATH", "TZ", "TMPDIR",
                                      "GLIBC_TUNABLES", "MALLOC_PERTURB_", "LD_LIBRARY_PATH"}) {
                 ::setenv(name, "../%s%n/\xff=:", 1);
             }
         }},
        {"stderr that nobody reads",
         [] {
             std::array<int, 2> ends{};
             [[maybe_unused]] const int made = ::pipe(ends.data());
             ::dup2(ends[1], STDERR_FILENO);
             ::close(ends[0]);
         }},
        {"stderr that is full", [] { ::dup2(dev_full, STDERR_FILENO); }},
        {"no file may grow", [] { limit(RLIMIT_FSIZE, 0); }},
        {"five descriptors", [] { limit(RLIMIT_NOFILE, 5); }},
        {"a working directory that is gone",
         [] {
             std::filesystem::create_directory("gone");
             std::filesystem::current_path("gone");
             std::filesystem::remove("/var/db/timezone/gone");
         }},
    };
    for (unsigned closed = 1; closed < 8; ++closed) {
        oddities.emplace_back("closed descriptors " + std::to_string(closed), [closed] {
            for (int descriptor = 0; descriptor < 3; ++descriptor) {
                (closed >> descriptor & 1U) != 0 ? ::close(descriptor) : 0;
            }
        });
    }
    for (const auto& [name, beforehand] : oddities) {
        lay_out(parsed(data + starts.at("drop and adopt")));
        int status = -1;
        warnings_of([&status, act = beforehand] { status = run_program(act); });
        EXPECT_EQ(status, 0) << name;
        const auto after = state();
        EXPECT_EQ(after.at("zoneinfo"), "->@2016d/zoneinfo") << name;
        EXPECT_EQ(after.at("icutz"), "->@2016d/icutz") << name;
        EXPECT_EQ(after.at("needs_cleanup"), "=") << name;
        const bool no_room = name == "no file may grow";
        EXPECT_EQ(after.at("TZVersionDiffRecord"), no_room ? "=" : "=2016c.1.0_2016d") << name;
    }
}

TEST(file_system, that_is_full_or_read_only_keeps_usable_links) {
    const struct {
        const char* options;
        unsigned long flags;
        int status;
        std::string zoneinfo;
        std::string record;
        std::string last_words;
    } table[] = {
        {"nr_inodes=40", 0, 0, "->@2016e/zoneinfo", "",
         "Cannot touch file /var/db/timezone/needs_cleanup\n"},
        {"size=64k", 0, 0, "->@2016e/zoneinfo", "=", ""},
        {"", MS_RDONLY, 1, "->@2016d/zoneinfo", "", "Could not set all time-zone links\n"},
    };
    for (const auto& row : table) {
        lay_out({});
        ASSERT_EQ(::mount("none", "/var/db", "tmpfs", 0, row.options), 0) << std::strerror(errno);
        std::filesystem::create_directory("/var/db/timezone");
        std::filesystem::current_path("/var/db/timezone");
        add(parsed(data + starts.at("replace")));
        for (int i = 0; row.flags == 0 && i < 40; ++i) { // more than there is room for
            add({{"/var/db/ballast" + std::to_string(i), "=" + std::string(4096, 'x')}});
        }
        ASSERT_EQ(::mount("none", "/var/db", "tmpfs", MS_REMOUNT | row.flags, row.options), 0);
        const auto said =
            warnings_of([&] { EXPECT_EQ(WEXITSTATUS(run_program()), row.status) << row.options; });
        EXPECT_TRUE(said.ends_with(row.last_words)) << said;
        EXPECT_EQ(state()["zoneinfo"], row.zoneinfo);
        EXPECT_EQ(state()["TZVersionDiffRecord"], row.record);
    }
}

} // namespace
} // namespace tz::test
