// SPDX-License-Identifier: BSD-2-Clause
#include "private_root.h"

#include <filesystem>
#include <fstream>
#include <iterator>
#include <regex>
#include <sstream>

#include <fcntl.h>
#include <sched.h>
#include <sys/mman.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

namespace fs = std::filesystem;

namespace tz::test {
namespace {

const std::string updates = "/var/db/timezone/tz/";
int program = -1; // opened while its path can still be reached

void empty_root() {
    ::umount2("/var/db", MNT_DETACH); // where a test may have mounted
    for (const auto& inhabitant : fs::directory_iterator("/")) {
        fs::remove_all(inhabitant.path());
    }
}

std::string described(const fs::path& path) {
    if (fs::is_symlink(path)) {
        const auto target = fs::read_symlink(path).string();
        return "->" + (target.starts_with(updates) ? "@" + target.substr(updates.size()) : target);
    }
    if (fs::is_regular_file(path)) {
        std::ifstream file(path);
        const bool usual = fs::status(path).permissions() == fs::perms(0644);
        return (usual ? "=" : "odd mode=") + std::string(std::istreambuf_iterator(file), {});
    }
    return fs::is_directory(path) ? "/" : "|";
}

} // namespace

tree parsed(const std::string& text) {
    static const std::regex pattern("(.+?)(->.*?|=.*?|[|!/])(?:, |$)");
    tree entries;
    for (std::sregex_iterator match(text.begin(), text.end(), pattern), end; match != end;
         ++match) {
        entries[match->str(1)] = match->str(2);
    }
    return entries;
}

void add(const tree& entries) {
    for (const auto& [path, what] : entries) {
        fs::create_directories(fs::absolute(path).parent_path());
        if (what.starts_with("->")) {
            fs::create_symlink(what[2] == '@' ? updates + what.substr(3) : what.substr(2), path);
        } else if (what.starts_with("=")) {
            std::ofstream(path) << what.substr(1);
        } else if (what == "|") {
            ::mkfifo(path.c_str(), 0644);
        } else if (what == "/") {
            fs::create_directory(path);
        }
    }
}

void lay_out(const tree& entries) {
    empty_root();
    fs::create_directories("/var/db/timezone");
    fs::current_path("/var/db/timezone");
    add(entries);
}

tree state() {
    tree entries;
    for (auto entry = fs::recursive_directory_iterator("/var/db"); entry != end(entry); ++entry) {
        const std::string path = entry->path();
        if (path == "/var/db/timezone/tz") {
            entry.disable_recursion_pending();
        } else if (path != "/var/db/timezone") {
            const bool inside = path.starts_with("/var/db/timezone/");
            entries[inside ? path.substr(17) : path] = described(path);
        }
    }
    return entries;
}

std::string warnings_of(const std::function<void()>& action, bool with_reasons) {
    const int saved = ::dup(STDERR_FILENO);
    const int memory = ::memfd_create("warnings", 0);
    ::dup2(memory, STDERR_FILENO);
    action();
    ::dup2(saved, STDERR_FILENO);
    ::close(saved);

    std::string text(std::size_t{1} << 22, '\0');
    text.resize(static_cast<std::size_t>(::pread(memory, text.data(), text.size(), 0)));
    ::close(memory);

    std::string warnings;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line);) {
        line.erase(0, line.find(": ") + 2);
        warnings += (with_reasons ? line : line.substr(0, line.rfind(": "))) + "\n";
    }
    return warnings;
}

pid_t start_program(const std::function<void()>& beforehand) {
    const pid_t child = ::fork();
    if (child == 0) {
        ::alarm(20); // outlives the exec: a start that hangs dies of it
        ::close_range(3, ~0U, CLOSE_RANGE_CLOEXEC);
        beforehand();
        std::string name = "tzreconcile";
        char* const arguments[] = {name.data(), nullptr};
        ::fexecve(program, arguments, environ == nullptr ? arguments + 1 : environ);
        ::_exit(127);
    }
    return child;
}

int run_program(const std::function<void()>& beforehand) {
    int status = 0;
    ::waitpid(start_program(beforehand), &status, 0);
    return status;
}

} // namespace tz::test

int main(int count, char** arguments) {
    testing::InitGoogleTest(&count, arguments);
    const auto beside = fs::read_symlink("/proc/self/exe").parent_path();
    tz::test::program = ::open((beside / "tzreconcile").c_str(), O_RDONLY | O_CLOEXEC);

    tz::test::dev_full = ::open("/dev/full", O_WRONLY | O_CLOEXEC);

    std::string root = fs::temp_directory_path() / "tzreconcile-XXXXXX";
    const int outside = ::open("/", O_DIRECTORY | O_CLOEXEC);
    const auto user = ::geteuid();
    const auto group = ::getegid();
    // In a user namespace of their own anybody may enter another root, and mount there.
    if (::unshare(user == 0 ? CLONE_NEWNS : CLONE_NEWUSER | CLONE_NEWNS) == 0 && user != 0) {
        std::ofstream("/proc/self/uid_map") << "0 " << user << " 1";
        std::ofstream("/proc/self/setgroups") << "deny";
        std::ofstream("/proc/self/gid_map") << "0 " << group << " 1";
    }
    ::mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr); // and no one else sees it
    ::umask(022);
    if (::mkdtemp(root.data()) == nullptr || ::chroot(root.c_str()) != 0 || ::chdir("/") != 0) {
        std::perror("cannot enter a private root");
        return 1;
    }
    const int result = RUN_ALL_TESTS();
    tz::test::lay_out({}); // nothing mounted any more
    // Back to where leaks and coverage can be looked into.
    if (::fchdir(outside) != 0 || ::chroot(".") != 0) {
        std::perror("cannot leave the private root");
        return 1;
    }
    fs::remove_all(root);
    return result;
}
