// SPDX-License-Identifier: BSD-2-Clause
#include <array>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "private_root.h"

int program_main(); // main of the program, renamed

namespace tz::test {
namespace {

TEST(start, adopts_what_is_large_or_dated_after_2038) {
    const auto* const version = "/usr/share/zoneinfo.default/+VERSION";
    const auto* const icu = "tz/2016d/icutz/icutz44l.dat";
    const std::array<timespec, 2> in_2040 = {{{2'208'988'800, 0}, {2'208'988'800, 0}}};
    const off_t three_gib = 3LL << 30;
    const auto date = [&](const char* path) {
        EXPECT_EQ(::utimensat(AT_FDCWD, path, in_2040.data(), 0), 0) << path;
    };
    const std::function<void()> changes[] = {
        [&] { date(version); },
        [&] { date(icu); },
        [&] { date("tz/2016d/icutz"); },
        [&] { EXPECT_EQ(::truncate(icu, three_gib), 0); },
    };
    for (const auto& change : changes) {
        lay_out(parsed("/usr/share/zoneinfo.default/+VERSION=2016c, "
                       "/usr/share/icu/icutzformat.txt=44l, tz/2016d/icutz/icutz44l.dat=, "
                       "zoneinfo->/usr/share/zoneinfo.default, tz_latest->@2016d, "
                       "localtime->/var/db/timezone/zoneinfo/Europe/Paris"));
        change();
        EXPECT_EQ(warnings_of([] { EXPECT_EQ(program_main(), 0); }), "");
        EXPECT_EQ(state()["zoneinfo"], "->@2016d/zoneinfo");
    }
}

} // namespace
} // namespace tz::test
