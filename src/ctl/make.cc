// SPDX-License-Identifier: BSD-2-Clause
#include <cerrno>
#include <csignal>
#include <filesystem>
#include <system_error>

#include <unistd.h>

#include "ctl/verbs.h"

namespace tz {

void make(const std::vector<std::string>& arguments) {
    // Sought from where this program is, as a prefix may be chosen as late as at the installation.
    const auto here = std::filesystem::read_symlink("/proc/self/exe").parent_path();
    std::string program = here / MAKE_DATASET;
    if (!std::filesystem::exists(program)) {
        program = here / "../../tools/make-dataset"; // in a checkout
    }
    std::vector<std::string> words = arguments;
    std::vector<char*> pointers{program.data()};
    for (auto& word : words) {
        pointers.push_back(word.data());
    }
    pointers.push_back(nullptr);
    (void)std::signal(SIGPIPE, SIG_DFL); // which is ignored here only
    ::execv(program.c_str(), pointers.data());
    throw std::system_error(errno, std::generic_category(), program);
}

} // namespace tz
