// SPDX-License-Identifier: BSD-2-Clause
#include <cstdlib>
#include <new>

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include "dataset/kiv_icu.h"
#include "dataset/kiv_zoneinfo.h"
#include "platform/data_protection.h"
#include "private_root.h"

int program_main(); // main of the program, renamed

// The numbers of the first and the last allocation that fail, at first none; and of the latest.
int first_failing = 0;
int last_failing = 0;
int allocations = 0;

// NOLINTBEGIN(cppcoreguidelines-no-malloc,cppcoreguidelines-owning-memory)
void* operator new(std::size_t size) {
    const bool fails = ++allocations >= first_failing && allocations <= last_failing;
    void* const memory = fails ? nullptr : std::malloc(size);
    return memory != nullptr ? memory : throw std::bad_alloc();
}

void operator delete(void* memory) noexcept {
    std::free(memory);
}

void operator delete(void* memory, std::size_t /*size*/) noexcept {
    std::free(memory);
}
// NOLINTEND(cppcoreguidelines-no-malloc,cppcoreguidelines-owning-memory)

namespace tz {

// These replace the platform's data protection, and leave the number of the class where a test can
// see it: as a subdirectory's name in a directory, and as the text of a new file.
int platform::set_protection_class(int descriptor, int protection_class) {
    ::mkdirat(descriptor, std::to_string(protection_class).c_str(), 0755);
    return -1;
}

int platform::open_dprotected_np(const char* path, int flags, int protection_class,
                                 int /*protection_flags*/, mode_t mode) {
    const int descriptor = ::open(path, flags, mode);
    const auto name = std::to_string(protection_class);
    [[maybe_unused]] const auto written = ::write(descriptor, name.c_str(), name.size());
    return descriptor;
}

namespace test {
namespace {

// The system at 2016c.1.0, its own data current; updates older and newer than that, and odd ones.
const std::string before =
    "/usr/share/zoneinfo.default/+VERSION=2016c, /usr/share/zoneinfo.default/Europe/Paris=, "
    "/usr/share/icu/icutzformat.txt=44l, /usr/share/icu/icutz46l.dat=, "
    "zoneinfo->/usr/share/zoneinfo.default, localtime->/var/db/timezone/zoneinfo/Europe/Paris, "
    "tz/2016a/icutz/icutz44l.dat=, tz/2016b.1/icutz/icutz44l.dat=, "
    "tz/2016c.1.0/icutz->../2016a/icutz, "
    "tz/2016d/icutz/icutz44l.dat=, tz/2016e/icutz/icutz44b.dat=, tz/2016f/icutz/icutz44l.dat/, "
    "tz/2016f/icutz/icutz45l.dat=, tz/2016f/icutz/icutz46l.dat->/usr/share/icu/icutz46l.dat, "
    "tz/2016f/icutz/a/icutz44l.dat=, tz/2016g/icutz/icutz44l.dat=, tz/9999999999a/, ";

const std::string bad = "Bad zoneinfo link ";
const std::string bad_path = "kiv_dataset::create_components: bad path ";
const std::string correcting = "Correcting localtime link to /var/db/timezone/zoneinfo";
const std::string dropped = "Symlink points at data incompatible with installed system\n";
const std::string failed = "Unable to locate data; resetting to system partition\n";
const std::string gave_up = "Could not set all time-zone links\n";
const std::string invalid = "Invalid current symlinks; resetting to system partition\n";
const std::string no_icu = "No ICU schema found for /var/db/timezone/tz/";
const std::string not_read = "read_symlink: /var/db/timezone/";
const std::string not_removed = "remove: could not remove /var/db/timezone/";
const std::string not_made = "create_symlink: from /var/db/timezone/";
const std::string refused = "New update not compatible or older version: ";
const std::string resetting = "localtime link invalid; resetting to America/Los_Angeles\n";
const std::string unlinked = not_removed + "zoneinfo\nUnlink of zoneinfo softlink failed\n" +
                             not_made + "zoneinfo to /usr/share/zoneinfo.default\n";
const std::string unlinked_icu = not_removed + "icutz\nunlink of ICU softlink failed\n";
const std::string unmigrated = "Could not migrate /var/db/icutz to /var/db/timezone/icutz\n";
const std::string unparsed = "Cannot parse version string ";
const std::string no_version = unparsed + ".1.0, results.size() = 0\n" + unparsed + ".1.0\n";

const std::string system_data = "zoneinfo->/usr/share/zoneinfo.default";
const std::string los_angeles = "localtime->/var/db/timezone/zoneinfo/America/Los_Angeles";
const std::string marker = ", needs_cleanup=4";
const std::string record = ", TZVersionDiffRecord=";

std::string links_to(const std::string& update) {
    return "zoneinfo->@" + update + "/zoneinfo, icutz->@" + update + "/icutz";
}

const std::string adopted = links_to("2016d") + record + "2016c.1.0_2016d";

const struct {
    std::string given; // laid out over `before`
    std::string warnings;
    std::string changes; // made by the start
    int status = 0;
} starts[] = {
    {"", "", ""},
    {"needs_cleanup=x, ../icu/, TZVersionDiffRecord=x", "", "needs_cleanup!, ../icu!"},

    // The current update is kept, and so is its lack of an ICU link; or it is dropped.
    {"zoneinfo->@2016c.1.0/zoneinfo", "", ""},
    {links_to("2016d") + ", tz_latest->@2016d", refused + "2016d vs. 2016d\n", ""},
    {"zoneinfo->@2016a/x, ../icutz->/none", dropped, system_data + marker + ", ../icutz!"},
    {"zoneinfo->@2016e/x, icutz->@2016e/icutz", dropped, system_data + ", icutz!" + marker},
    {"zoneinfo->@2016b.1/x, tz_latest->@2016a", dropped + refused + "2016a vs. 2016b.1\n",
     system_data + marker},

    // The latest update is adopted if newer than what the current link named; or refused.
    {"tz_latest->@2016d, TZVersionDiffRecord=longer than what replaces it", "", adopted},
    {"zoneinfo->@2016c.1.0/x, tz_latest->@2016d, TZVersionDiffRecord|", "",
     links_to("2016d") + marker},
    {"zoneinfo->@2016c.1.0/x, tz_latest->@2016d, needs_cleanup/x=, ../icu/x=",
     "Cannot touch file /var/db/timezone/needs_cleanup\n", adopted},
    {"zoneinfo->@2016d/x, tz_latest->@2016g", "",
     links_to("2016g") + marker + record + "2016d_2016g"},
    {"zoneinfo->@2016a/x, tz_latest->@2016b.1", dropped,
     links_to("2016b.1") + marker + record + "2016c.1.0_2016b.1"},
    {"tz_latest->@2016e", refused + "2016e vs. 2016c.1.0\n", ""},
    {"tz_latest->@2016f", no_icu + "2016f\n" + refused + "2016f vs. 2016c.1.0\n", ""},

    // If the current link names no dataset, the system's data becomes current.
    {"zoneinfo!, tz_latest->@2016a, localtime!",
     bad + "\n" + invalid + refused + "2016a vs. 2016c.1.0\n" + resetting,
     system_data + ", " + los_angeles},
    {"zoneinfo->@/zoneinfo, tz_latest->@2016d", bad + "/var/db/timezone/tz//zoneinfo\n" + invalid,
     adopted},
    {"zoneinfo->@x/", // the shortest that names a dataset
     unparsed + "x, results.size() = 0\n" + unparsed + "x\n" + no_icu + "x\n" + dropped,
     system_data + marker},

    // After any failure the system's data becomes current; what was done before that stays.
    {"zoneinfo!, icutz->/x, tz_latest=x", not_read + "tz_latest\n" + failed,
     system_data + ", icutz!"},
    {"zoneinfo->@2016a/x, tz_latest->@9999999999a", dropped + failed, system_data + marker},
    {"tz_latest->@", bad_path + "/var/db/timezone/tz/\n" + failed, ""},
    {"tz_latest->%s%n\xff", bad_path + "%s%n\xff\n" + failed, ""},
    {"zoneinfo->@2016c.1.0/x, tz_latest->@2016d, icutz/x=, ../icutz->/none",
     unlinked_icu + not_made + "icutz to /var/db/timezone/tz/2016d/icutz\n" + failed + unlinked_icu,
     system_data}, // nothing was adopted, so no marker; the legacy link was not attempted
    {"zoneinfo/, icutz->/x, localtime!", // neither of which is reached
     not_read + "zoneinfo\n" + invalid + unlinked + failed + unlinked + gave_up, "", 1},
    {"/usr/share/zoneinfo.default/+VERSION=9999999999a, tz_latest=x", failed + gave_up, "", 1},
    {"/usr/share/zoneinfo.default/+VERSION|, tz_latest->@2016a", // that nobody writes into
     no_version + no_version, links_to("2016a") + record + ".1.0_2016a"},

    // The local-time link is kept, corrected or replaced.
    {"localtime->/var/db/timezone/zoneinfo.x", "", ""},
    {"localtime->/usr/share/zoneinfo/Europe/Paris", correcting + "/Europe/Paris\n",
     "localtime->/var/db/timezone/zoneinfo/Europe/Paris"},
    {"localtime->/usr/share/zoneinfo" + std::string(1100, 'x'),
     correcting + std::string(1005, 'x') + "\n" + resetting, los_angeles},
    {"localtime->/var/db/timezone/zoneinf", resetting, los_angeles},
    {"localtime/", not_read + "localtime\n" + resetting, los_angeles},
    {"localtime/x=",
     not_read + "localtime\n" + resetting + not_made +
         "localtime to /var/db/timezone/zoneinfo/America/Los_Angeles\n" + gave_up,
     "", 1},

    // The legacy ICU link is moved.
    {"../icutz->../db", "", "../icutz!, icutz->../db"},
    {"../icutz->/none", "", ""},
    {"../icutz->/var, icutz->/usr", "", "../icutz!"},
    {"../icutz->/var, icutz->/none", not_made + "icutz to /var\n" + unmigrated, "../icutz!"},
    {"../icutz/",
     "read_symlink: /var/db/icutz\n" + unmigrated +
         "remove: could not remove /var/db/icutz\nCould not remove /var/db/icutz\n",
     ""},
};

void prepare(const std::string& given) {
    tree entries = parsed(before);
    for (const auto& [path, what] : parsed(given)) {
        entries.erase(path.substr(0, path.find("/x")));
        entries[path] = what;
    }
    lay_out(entries);
    ::chmod("tz/2016f/icutz/icutz45l.dat", 0773); // others may not read it
}

TEST(start, changes_what_it_should_and_says_so) {
    for (const auto& row : starts) {
        prepare(row.given);
        tree expected = state();
        expected["4"] = expected["tz/4"] = "/"; // no protection
        for (const auto& [path, what] : parsed(row.changes)) {
            expected[path] = what;
        }
        std::erase_if(expected, [](const auto& entry) { return entry.second == "!"; });
        EXPECT_EQ(warnings_of([&] { EXPECT_EQ(program_main(), row.status); }), row.warnings);
        EXPECT_EQ(state(), expected) << "given " << row.given;
    }
}

TEST(start, makes_the_standard_descriptors_valid) {
    prepare("");
    int status = ::fork();
    if (status == 0) {
        ::close_range(STDIN_FILENO, STDERR_FILENO, 0);
        program_main();
        ::_exit(::dup(STDERR_FILENO) > STDERR_FILENO ? 0 : 1); // the first that is free
    }
    ::wait(&status);
    EXPECT_EQ(status, 0);
}

TEST(start, ends_well_or_says_so_where_memory_runs_out) {
    for (const int number : {1, 1000}) { // of allocations that fail, from the nth
        int made = 1;
        for (int nth = 1; nth <= made; ++nth) {
            prepare("zoneinfo->@2016a/x, tz_latest->@2016d, ../icutz->/usr, localtime->/x");
            int status = -1;
            const auto said = warnings_of([&] {
                allocations = 0;
                first_failing = nth;
                last_failing = nth + number - 1;
                status = program_main();
                last_failing = 0;
                made = allocations;
            });
            EXPECT_TRUE(status == 0 ? state().contains("zoneinfo") : said.ends_with(gave_up))
                << "allocation " << nth << ": " << said;
        }
        EXPECT_GT(made, 30); // as a whole start does
    }
}

TEST(icu, cannot_be_compared_with_zoneinfo_or_walk_a_path_that_is_too_long) {
    EXPECT_EQ(warnings_of([] { EXPECT_FALSE(kiv_icu().compatible_schema(kiv_zoneinfo())); }),
              "kiv_icu::compatible_schema: could not dynamic_cast other component\n");
    const auto path = "/" + std::string(1 << 16, 'x');
    EXPECT_EQ(warnings_of([&] { EXPECT_THROW(kiv_icu{path}, int); }),
              "tz_icu::initialize: fts_open of " + path + "/icutz failed, File name too long\n");
}

} // namespace
} // namespace test
} // namespace tz
