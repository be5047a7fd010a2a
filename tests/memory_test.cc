// SPDX-License-Identifier: BSD-2-Clause
#include <cerrno>
#include <cstddef>

#include <dlfcn.h>
#include <fts.h>

#include "private_root.h"

int program_main(); // main of the program, renamed

namespace {

int allocations = 0;
int first_failing = 0; // 0 while memory does not run out
int last_failing = 0;
int allocations_of_fts_open = -1; // -1 outside of it

bool runs_out() {
    // The C library's fts_open does not survive the failure of its fourth allocation.
    const bool spared = allocations_of_fts_open >= 0 && ++allocations_of_fts_open == 4;
    const bool failing = ++allocations >= first_failing && allocations <= last_failing;
    if (failing && !spared) {
        errno = ENOMEM;
    }
    return failing && !spared;
}

} // namespace

// NOLINTBEGIN(bugprone-reserved-identifier,cert-dcl*,readability-inconsistent-declaration-*)
extern "C" {
void* __libc_malloc(std::size_t size);
void* __libc_calloc(std::size_t count, std::size_t size);
void* __libc_realloc(void* memory, std::size_t size);

void* malloc(std::size_t size) {
    return runs_out() ? nullptr : __libc_malloc(size);
}

void* calloc(std::size_t count, std::size_t size) {
    return runs_out() ? nullptr : __libc_calloc(count, size);
}

void* realloc(void* memory, std::size_t size) {
    return runs_out() ? nullptr : __libc_realloc(memory, size);
}

FTS* fts_open(char* const* paths, int options, int (*order)(const FTSENT**, const FTSENT**)) {
    const auto real = reinterpret_cast<decltype(&fts_open)>(::dlsym(RTLD_NEXT, "fts_open"));
    allocations_of_fts_open = 0;
    FTS* const walk = real(paths, options, order);
    allocations_of_fts_open = -1;
    return walk;
}
}
// NOLINTEND(bugprone-reserved-identifier,cert-dcl*,readability-inconsistent-declaration-*)

namespace tz::test {
namespace {

TEST(memory, that_runs_out_at_any_allocation_ends_in_the_fall_back_or_says_so) {
    for (const bool for_good : {false, true}) {
        int made = 1;
        for (int nth = 1; nth <= made; ++nth) {
            lay_out(
                parsed("/usr/share/zoneinfo.default/+VERSION=2016c, "
                       "/usr/share/icu/icutzformat.txt=44l, tz/2016d/icutz/icutz44l.dat=, "
                       "tz/2016a/icutz/icutz44l.dat=, zoneinfo->@2016a/zoneinfo, "
                       "tz_latest->@2016d, /var/db/icutz->/usr, localtime->/usr/share/zoneinfo"));
            int status = -1;
            const auto said = warnings_of([&] {
                allocations = 0;
                first_failing = nth;
                last_failing = for_good ? 1 << 30 : nth;
                status = program_main();
                made = allocations;
                last_failing = 0;
            });
            const auto now = state()["zoneinfo"];
            EXPECT_TRUE(status == 0
                            ? now == "->/usr/share/zoneinfo.default" || now == "->@2016d/zoneinfo"
                            : said.ends_with("Could not set all time-zone links\n"))
                << "allocation " << nth << ": " << said;
        }
        EXPECT_GT(made, 50); // as a whole start does
    }
}

} // namespace
} // namespace tz::test
