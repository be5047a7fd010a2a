// SPDX-License-Identifier: BSD-2-Clause
#include "private_root.h"

#include <filesystem>
#include <fstream>
#include <iterator>
#include <regex>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace fs = std::filesystem;

namespace tz::test {
namespace {

const std::string state_directory = "/var/db/timezone/";
const std::string updates = state_directory + "tz/";

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

void lay_out(const tree& entries) {
    for (const auto& inhabitant : fs::directory_iterator("/")) {
        fs::remove_all(inhabitant.path());
    }
    fs::create_directories(state_directory);
    fs::current_path(state_directory);
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
    ::alarm(60); // ends a test that hangs
}

tree state() {
    tree entries;
    for (auto entry = fs::recursive_directory_iterator("/var/db"); entry != end(entry); ++entry) {
        entries[entry->path().lexically_relative(state_directory)] = described(*entry);
        if (entry.depth() == 2) { // an update
            entry.disable_recursion_pending();
        }
    }
    return entries;
}

std::string warnings_of(const std::function<void()>& action) {
    const int saved = ::dup(STDERR_FILENO);
    const int file = ::open("/said", O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0600);
    ::dup2(file, STDERR_FILENO);
    action();
    ::dup2(saved, STDERR_FILENO);
    ::close(file);
    ::close(saved);

    std::string warnings;
    std::ifstream said("/said");
    for (std::string line; std::getline(said, line);) {
        line.erase(0, line.find(": ") + 2);
        warnings += line.substr(0, line.rfind(": ")) + "\n";
    }
    return warnings;
}

} // namespace tz::test

int main(int count, char** arguments) {
    if (::geteuid() != 0) { // an ordinary user becomes root in a user namespace
        std::string unshare = "unshare";
        std::string option = "--map-root-user";
        std::vector<char*> command{unshare.data(), option.data()};
        command.insert(command.end(), arguments, arguments + count + 1);
        ::execvp(command[0], command.data());
    }
    testing::InitGoogleTest(&count, arguments);
    std::string root = fs::temp_directory_path() / "tzreconcile-XXXXXX";
    const int outside = ::open("/", O_DIRECTORY | O_CLOEXEC);
    ::umask(022);
    if (::mkdtemp(root.data()) == nullptr || ::chroot(root.c_str()) != 0 || ::chdir("/") != 0) {
        std::perror("cannot enter a private root");
        return 1;
    }
    const int result = RUN_ALL_TESTS();
    // Leak detection and coverage need the former root.
    const bool is_back = ::fchdir(outside) == 0 && ::chroot(".") == 0;
    fs::remove_all(root);
    return is_back ? result : 1;
}
