// SPDX-License-Identifier: BSD-2-Clause
#include <fcntl.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include "dataset/kiv_icu.h"
#include "dataset/kiv_zoneinfo.h"
#include "platform/data_protection.h"
#include "private_root.h"

int program_main(); // main of the program, renamed

namespace tz {

// Instead of the platform's own: notes the inodes for which a class was asked, and the class.
std::vector<std::pair<ino_t, int>> requests;

int platform::set_protection_class(int descriptor, int protection_class) {
    struct stat status {};
    ::fstat(descriptor, &status);
    requests.emplace_back(status.st_ino, protection_class);
    return -1;
}

int platform::open_dprotected_np(const char* path, int flags, int protection_class,
                                 int /*protection_flags*/, mode_t mode) {
    const int descriptor = ::open(path, flags, mode);
    set_protection_class(descriptor, protection_class);
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
    "tz/2016f/icutz/a/icutz44l.dat=, tz/2016g/icutz/icutz44l.dat->/usr/share/icu/icutz46l.dat, "
    "tz/2016h/icutz|, tz/2016i/icutz/icutz44l.dat=, tz/9999999999a/, ";

const std::string bad = "Bad zoneinfo link ";
const std::string invalid = "Invalid current symlinks; resetting to system partition\n";
const std::string dropped = "Symlink points at data incompatible with installed system\n";
const std::string refused = "New update not compatible or older version: ";
const std::string failed = "Unable to locate data; resetting to system partition\n";
const std::string unlinked = "remove: could not remove /var/db/timezone/zoneinfo\n"
                             "Unlink of zoneinfo softlink failed\n"
                             "create_symlink: from /var/db/timezone/zoneinfo to "
                             "/usr/share/zoneinfo.default\n";
const std::string unlinked_icu = "remove: could not remove /var/db/timezone/icutz\n"
                                 "unlink of ICU softlink failed\n";
const std::string no_icu = "No ICU schema found for /var/db/timezone/tz/";
const std::string correcting = "Correcting localtime link to /var/db/timezone/zoneinfo";
const std::string resetting = "localtime link invalid; resetting to America/Los_Angeles\n";
const std::string unmigrated = "Could not migrate /var/db/icutz to /var/db/timezone/icutz\n";
const std::string gave_up = "Could not set all time-zone links\n";

const std::string system_data = "zoneinfo->/usr/share/zoneinfo.default";
const std::string los_angeles = "localtime->/var/db/timezone/zoneinfo/America/Los_Angeles";
const std::string d = "zoneinfo->@2016d/zoneinfo, icutz->@2016d/icutz, ";

const struct {
    std::string given; // beside what there was before
    std::string warnings;
    std::string changes; // made by the start
    int status = 0;
} starts[] = {
    {"", "", ""},
    {"needs_cleanup=x, /var/db/icu/, TZVersionDiffRecord=x", "", "needs_cleanup!, /var/db/icu!"},
    {"needs_cleanup/x=, /var/db/icu/x=", "", ""},

    // The current update is kept, and so is its lack of an ICU link; or it is dropped.
    {"zoneinfo->@2016c.1.0/zoneinfo", "", ""},
    {d + "tz_latest->@2016d", refused + "2016d vs. 2016d\n", ""},
    {"zoneinfo->@2016a/x, /var/db/icutz->/none", dropped,
     system_data + ", needs_cleanup=, /var/db/icutz!"},
    {"zoneinfo->@2016e/x, icutz->@2016e/icutz", dropped, system_data + ", icutz!, needs_cleanup="},
    {"zoneinfo->@2016b.1/x, tz_latest->@2016a", dropped + refused + "2016a vs. 2016b.1\n",
     system_data + ", needs_cleanup="},

    // The latest update is adopted if newer than what the current link named; or refused.
    {"tz_latest->@2016d, TZVersionDiffRecord=longer than what replaces it", "",
     d + "TZVersionDiffRecord=2016c.1.0_2016d"},
    {"zoneinfo->@2016c.1.0/x, tz_latest->@2016d, TZVersionDiffRecord|", "", d + "needs_cleanup="},
    {"zoneinfo->@2016c.1.0/x, tz_latest->@2016d, needs_cleanup/x=",
     "Cannot touch file /var/db/timezone/needs_cleanup\n",
     d + "TZVersionDiffRecord=2016c.1.0_2016d"},
    {"zoneinfo->@2016d/x, tz_latest->@2016i", "",
     "zoneinfo->@2016i/zoneinfo, icutz->@2016i/icutz, needs_cleanup=, "
     "TZVersionDiffRecord=2016d_2016i"},
    {"zoneinfo->@2016a/x, tz_latest->@2016b.1", dropped,
     "zoneinfo->@2016b.1/zoneinfo, icutz->@2016b.1/icutz, needs_cleanup=, "
     "TZVersionDiffRecord=2016c.1.0_2016b.1"},
    {"tz_latest->@2016c.1.0", refused + "2016c.1.0 vs. 2016c.1.0\n", ""},
    {"tz_latest->@2016e", refused + "2016e vs. 2016c.1.0\n", ""},
    {"tz_latest->@2016f", no_icu + "2016f\n" + refused + "2016f vs. 2016c.1.0\n", ""},
    {"tz_latest->@2016g", no_icu + "2016g\n" + refused + "2016g vs. 2016c.1.0\n", ""},
    {"tz_latest->@2016h", no_icu + "2016h\n" + refused + "2016h vs. 2016c.1.0\n", ""},

    // Without a current link that makes sense, the system's data is current.
    {"zoneinfo!", bad + "\n" + invalid, system_data},
    {"zoneinfo!, tz_latest->@2016a", bad + "\n" + invalid + refused + "2016a vs. 2016c.1.0\n",
     system_data},
    {"zoneinfo->@/zoneinfo, tz_latest->@2016d", bad + "/var/db/timezone/tz//zoneinfo\n" + invalid,
     d + "TZVersionDiffRecord=2016c.1.0_2016d"},
    {"zoneinfo->@2016d", bad + "/var/db/timezone/tz/2016d\n" + invalid, system_data},
    {system_data + "/", bad + "/usr/share/zoneinfo.default/\n" + invalid, system_data},
    {"zoneinfo=x", "read_symlink: /var/db/timezone/zoneinfo\n" + invalid, system_data},
    {"zoneinfo->@x/", // the shortest that makes sense
     "Cannot parse version string x, results.size() = 0\nCannot parse version string x\n" + no_icu +
         "x\n" + dropped,
     system_data + ", needs_cleanup="},

    // Whatever fails ends with the system's data; what was done before that stays.
    {d + "tz_latest=x", "read_symlink: /var/db/timezone/tz_latest\n" + failed,
     system_data + ", icutz!"},
    {"zoneinfo!, tz_latest=x", "read_symlink: /var/db/timezone/tz_latest\n" + failed, system_data},
    {"zoneinfo->@2016a/x, tz_latest->@9999999999a", dropped + failed,
     system_data + ", needs_cleanup="},
    {d + "tz_latest->@", "kiv_dataset::create_components: bad path /var/db/timezone/tz/\n" + failed,
     system_data + ", icutz!"},
    {"tz_latest->%s%n\xff", "kiv_dataset::create_components: bad path %s%n\xff\n" + failed, ""},
    {"tz_latest->@2016d, icutz/x=, /var/db/icutz->/none",
     unlinked_icu +
         "create_symlink: from /var/db/timezone/icutz to /var/db/timezone/tz/2016d/icutz\n" +
         failed + unlinked_icu,
     ""}, // the legacy link was not attempted
    {"zoneinfo/, localtime!",
     "read_symlink: /var/db/timezone/zoneinfo\n" + invalid + unlinked + failed + unlinked + gave_up,
     "", 1}, // the local-time link is not reached

    // The local-time link is kept, corrected or replaced.
    {"localtime->/var/db/timezone/zoneinfo.x", "", ""},
    {"localtime->/usr/share/zoneinfo/Europe/Paris", correcting + "/Europe/Paris\n",
     "localtime->/var/db/timezone/zoneinfo/Europe/Paris"},
    {"localtime->/usr/share/zoneinfo.x", correcting + ".x\n" + resetting, los_angeles},
    {"localtime->/usr/share/zoneinfo" + std::string(1100, 'x'),
     correcting + std::string(1005, 'x') + "\n" + resetting, los_angeles},
    {"localtime->/var/db/timezone/zoneinf", resetting, los_angeles},
    {"localtime!", resetting, los_angeles},
    {"localtime/", "read_symlink: /var/db/timezone/localtime\n" + resetting, los_angeles},
    {"localtime/x=",
     "read_symlink: /var/db/timezone/localtime\n" + resetting +
         "create_symlink: from /var/db/timezone/localtime to "
         "/var/db/timezone/zoneinfo/America/Los_Angeles\n" +
         gave_up,
     "", 1},

    // The legacy ICU link is moved.
    {"/var/db/icutz->../db", "", "/var/db/icutz!, icutz->../db"},
    {"/var/db/icutz->/none", "", ""},
    {"/var/db/icutz->/var, icutz->/usr", "", "/var/db/icutz!"},
    {"/var/db/icutz->/var, icutz->/none",
     "create_symlink: from /var/db/timezone/icutz to /var\n" + unmigrated, "/var/db/icutz!"},
    {"/var/db/icutz/",
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
}

TEST(start, changes_what_it_should_and_says_so) {
    for (const auto& row : starts) {
        prepare(row.given);
        tree expected = state();
        for (const auto& [path, what] : parsed(row.changes)) {
            expected[path] = what;
        }
        std::erase_if(expected, [](const auto& entry) { return entry.second == "!"; });
        EXPECT_EQ(warnings_of([&] { EXPECT_EQ(program_main(), row.status); }), row.warnings);
        EXPECT_EQ(state(), expected) << "given " << row.given;
    }
}

#ifdef PROGRAM_IS_STATIC
TEST(start, of_the_built_program_needs_nothing_else_in_its_root) {
    prepare("localtime!");
    EXPECT_EQ(warnings_of([] { EXPECT_EQ(run_program(), 0); }), resetting);
}
#endif

TEST(start, gives_later_lines_the_reason_of_the_first) {
    prepare("zoneinfo/");
    const auto warnings = warnings_of([] { program_main(); }, true);
    for (const auto* line : {"partition: Invalid argument\n", "softlink failed: Is a directory\n",
                             "time-zone links: File exists\n"}) {
        EXPECT_NE(warnings.find(line), std::string::npos) << warnings;
    }
}

TEST(start, makes_the_standard_descriptors_valid) {
    prepare("");
    int status = ::fork();
    if (status == 0) {
        ::close_range(STDIN_FILENO, STDERR_FILENO, 0);
        program_main();
        ::_exit(::dup(STDIN_FILENO) != -1 && ::dup(STDOUT_FILENO) != -1 &&
                        ::dup(STDERR_FILENO) != -1
                    ? 0
                    : 1);
    }
    ::wait(&status);
    EXPECT_EQ(status, 0);
}

TEST(start, takes_data_protection_off) {
    prepare("zoneinfo->@2016a/x");
    requests.clear();
    EXPECT_EQ(warnings_of([] { program_main(); }), dropped);
    std::vector<std::pair<ino_t, int>> expected;
    for (const auto* path : {".", "tz", "needs_cleanup"}) {
        struct stat status {};
        ::stat(path, &status);
        expected.emplace_back(status.st_ino, 4);
    }
    EXPECT_EQ(requests, expected);
}

TEST(icu, is_compatible_with_icu_only_and_counts_public_files_only) {
    lay_out(parsed("/u/icutz/icutz44l.dat=, /usr/share/icu/icutzformat.txt=44l"));
    EXPECT_TRUE(kiv_icu("/u").compatible_schema(kiv_icu()));
    EXPECT_TRUE(kiv_zoneinfo().compatible_schema(kiv_icu()));
    EXPECT_EQ(warnings_of([] { EXPECT_FALSE(kiv_icu().compatible_schema(kiv_zoneinfo())); }),
              "kiv_icu::compatible_schema: could not dynamic_cast other component\n");
    ::chmod("/u/icutz/icutz44l.dat", 0773);
    EXPECT_EQ(warnings_of([] { EXPECT_FALSE(kiv_icu("/u").compatible_schema(kiv_icu())); }),
              "No ICU schema found for /u\n");
}

} // namespace
} // namespace test
} // namespace tz
