// SPDX-License-Identifier: BSD-2-Clause
// The floor under the time of a start: a program that does nothing but the system calls which that
// start cannot do without. It looks at no answer, except to make sure that it is in the state it
// is the floor of: any other would have it measure calls that fail early. It is linked like
// tzreconcile, static and position-independent, but compiled without hardening: what that costs is
// to be seen.
//
// With ADOPTS 0 that is a settled start: the latest link names the update that is current already.
// With ADOPTS 1 the system's own data is current, and the latest link names a newer update.
#define _GNU_SOURCE
#include <dirent.h>
#include <errno.h>
#include <fcntl.h>
#include <string.h>
#include <sys/stat.h>
#include <unistd.h>

#define STATE "/var/db/timezone"
#define VERSION "2026b.1.0"
#define UPDATE STATE "/tz/" VERSION
#define SYSTEM "/usr/share/zoneinfo.default"

static char buffer[32768];

static void must(int holds) {
    if (!holds) {
        _exit(1);
    }
}

// Data protection is taken off an open directory, where a platform has that.
static void prepare_directory(const char* path) {
    const int directory = open(path, O_RDONLY | O_CLOEXEC);
    must(directory != -1);
    close(directory);
}

// Whether something is there can only be learnt by asking, and removing it asks, too.
static void must_be_absent(int result) {
    must(result == -1 && errno == ENOENT);
}

// The file might be a FIFO or a device: hence non-blocking, and the look at its kind.
static void read_word(const char* path) {
    const int file = open(path, O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY);
    struct stat status;
    must(fstat(file, &status) == 0 && S_ISREG(status.st_mode));
    must(read(file, buffer, sizeof buffer) > 0);
    close(file);
}

static void read_link(const char* path, const char* target) {
    const ssize_t length = readlink(path, buffer, sizeof buffer);
    must(length == (ssize_t)strlen(target) && memcmp(buffer, target, strlen(target)) == 0);
}

// The schema is in the name of a file, which has to be regular and world-readable.
static void find_schema(void) {
    const int directory = open(UPDATE "/icutz", O_RDONLY | O_CLOEXEC | O_DIRECTORY);
    struct stat status;
    must(getdents64(directory, buffer, sizeof buffer) > 0);
    must(fstatat(directory, "icutz44l.dat", &status, AT_SYMLINK_NOFOLLOW) == 0);
    must(S_ISREG(status.st_mode) && (status.st_mode & S_IROTH) != 0);
    close(directory);
}

static void read_system(void) {
    read_word(SYSTEM "/+VERSION");
    read_word("/usr/share/icu/icutzformat.txt");
}

static void read_update(void) {
    read_word(UPDATE "/zoneinfo/+VERSION");
    find_schema();
}

static void write_text(int file, const char* text) {
    must(write(file, text, strlen(text)) == (ssize_t)strlen(text));
}

// A link is replaced by removing the old one and creating the new one.
static void adopt(void) {
    must(unlink(STATE "/zoneinfo") == 0);
    must(symlink(UPDATE "/zoneinfo", STATE "/zoneinfo") == 0);
    must_be_absent(unlink(STATE "/icutz"));
    must_be_absent(unlink("/var/db/icutz"));
    must(symlink(UPDATE "/icutz", STATE "/icutz") == 0);

    const int record = open(STATE "/TZVersionDiffRecord", O_WRONLY | O_CREAT | O_TRUNC, 0666);
    write_text(record, "2026a.1.0_" VERSION);
    close(record);
}

int main(void) {
    prepare_directory(STATE "/");
    prepare_directory(STATE "/tz/");
    must_be_absent(access("/var/db/icutz", F_OK));
    must_be_absent(unlink(STATE "/needs_cleanup"));
    must_be_absent(unlink("/var/db/icu"));

    read_system();
    read_link(STATE "/tz_latest", UPDATE);
    // Every dataset reads its own files, the same as another's or not.
    if (ADOPTS) {
        read_link(STATE "/zoneinfo", SYSTEM);
        read_system();
        read_update();
        adopt();
    } else {
        read_link(STATE "/zoneinfo", UPDATE "/zoneinfo");
        read_update();
        read_update();
        write_text(STDERR_FILENO,
                   "tzreconcile: New update not compatible or older version: " VERSION
                   " vs. " VERSION ": No such file or directory\n");
    }
    read_link(STATE "/localtime", STATE "/zoneinfo/Europe/Paris");
    return 0;
}
