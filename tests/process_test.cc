// SPDX-License-Identifier: BSD-2-Clause
#include <array>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>

#include <sys/mount.h>
#include <sys/resource.h>
#include <unistd.h>

#include "private_root.h"

namespace tz::test {
namespace {

void limit(decltype(RLIMIT_FSIZE) resource, rlim_t value) {
    const rlimit both{value, value};
    ::setrlimit(resource, &both);
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
        lay_out(parsed(three_updates + "tz_latest->@2016e, zoneinfo->@2016a/zoneinfo"));
        int status = -1;
        warnings_of([&status, act = beforehand] { status = run_program(act); });
        EXPECT_EQ(status, 0) << name;
        const auto after = state();
        EXPECT_EQ(after.at("zoneinfo"), "->@2016e/zoneinfo") << name;
        EXPECT_EQ(after.at("icutz"), "->@2016e/icutz") << name;
        EXPECT_EQ(after.at("needs_cleanup"), "=") << name;
        const bool no_room = name == "no file may grow";
        EXPECT_EQ(after.at("TZVersionDiffRecord"), no_room ? "=" : "=2016c.1.0_2016e") << name;
    }
}

TEST(file_system, that_is_full_or_read_only_keeps_usable_links) {
    const struct {
        const char* options;
        unsigned long flags;
        int status; // that it exits with
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
        add(parsed(three_updates +
                   "tz_latest->@2016e, zoneinfo->@2016d/zoneinfo, icutz->@2016d/icutz"));
        for (int i = 0; row.flags == 0 && i < 40; ++i) { // more than there is room for
            add({{"/var/db/ballast" + std::to_string(i), "=" + std::string(4096, 'x')}});
        }
        ASSERT_EQ(::mount("none", "/var/db", "tmpfs", MS_REMOUNT | row.flags, row.options), 0);
        const auto said = warnings_of([&] { EXPECT_EQ(run_program(), row.status << 8); });
        EXPECT_TRUE(said.ends_with(row.last_words)) << said;
        EXPECT_EQ(state()["zoneinfo"], row.zoneinfo);
        EXPECT_EQ(state()["TZVersionDiffRecord"], row.record);
    }
}

} // namespace
} // namespace tz::test
