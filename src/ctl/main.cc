// SPDX-License-Identifier: BSD-2-Clause
#include <cerrno>
#include <csignal>
#include <filesystem>
#include <iostream>
#include <string>
#include <system_error>
#include <vector>

#include <CLI/CLI.hpp>
#include <fcntl.h>
#include <unistd.h>

#include "ctl/text.h"
#include "ctl/verbs.h"
#include "fs/descriptor.h"
#include "platform/failure.h"
#include "platform/process.h"
#include "platform/root.h"

namespace {

namespace files = std::filesystem;

struct command_line {
    std::string root;
    std::string dataset;
    std::string version;
    bool json = false;
    bool forced = false;
    bool rehearsed = false;
};

void enter_root_if_any(const std::string& root) {
    if (!root.empty()) {
        tz::enter_root(root);
    }
}

// Becomes make-dataset, with these arguments.
[[noreturn]] void make(std::vector<std::string> words) {
    // Sought from where this program is, as a prefix may be chosen as late as at the installation.
    const auto here = files::read_symlink("/proc/self/exe").parent_path();
    std::string program = here / MAKE_DATASET;
    if (!files::exists(program)) {
        program = here / "../../tools/make-dataset"; // in a checkout
    }
    std::vector<char*> pointers{program.data()};
    for (auto& word : words) {
        pointers.push_back(word.data());
    }
    pointers.push_back(nullptr);
    (void)std::signal(SIGPIPE, SIG_DFL); // which is ignored here only
    ::execv(program.c_str(), pointers.data());
    throw std::system_error(errno, std::generic_category(), program);
}

// A dataset is looked for where the command was given if its path is relative; and otherwise, or if
// nothing is there, in the image first.
void install(const command_line& given) {
    std::error_code missing;
    const files::path outside = files::canonical(given.dataset, missing);
    const tz::fs::descriptor there(::open(outside.c_str(), O_DIRECTORY | O_CLOEXEC));
    enter_root_if_any(given.root);
    const files::path inside = files::canonical(given.dataset, missing);
    if (there.is_open() && (missing || files::path(given.dataset).is_relative())) {
        tz::install(there, outside.filename(), given.forced);
    } else {
        const tz::fs::descriptor here(::open(inside.c_str(), O_DIRECTORY | O_CLOEXEC));
        tz::check(here.number(), given.dataset);
        tz::install(here, inside.filename(), given.forced);
    }
}

void declare(CLI::App& app, command_line& given) {
    app.set_version_flag("--version", "tzctl " TZCTL_VERSION);
    const auto not_empty = [](const std::string& text) {
        return std::string(text.empty() ? "an empty text" : "");
    };
    app.add_option("--root", given.root, "Work on the system image in this directory")
        ->check(not_empty);
    app.failure_message([](const CLI::App* asked, const CLI::Error& error) {
        return "tzctl: " + CLI::FailureMessage::simple(asked, error);
    });
    app.require_subcommand(0, 1);
    app.fallthrough();

    app.add_subcommand("status", "Tell what is live and what the next start will do (default)")
        ->add_flag("--json", given.json, "Print a JSON object, for programs");
    auto* const install = app.add_subcommand("install", "Install an update for the next start");
    install->add_option("DATASET", given.dataset, "Directory that tzctl make has made")
        ->required()
        ->check(not_empty);
    install->add_flag("--force", given.forced, "Install it even if no start would adopt it");
    app.add_subcommand("use", "Make an installed update current now, and keep it")
        ->add_option("VERSION", given.version, "Its version; \"system\" for the system's own data")
        ->required()
        ->check(not_empty);
    app.add_subcommand("cleanup", "Delete the updates that are not in use")
        ->add_flag("--dry-run", given.rehearsed, "Only say what would be deleted");
    app.add_subcommand("make", "Make a dataset: see make-dataset(8)")
        ->prefix_command()
        ->fallthrough(false);
}

void run(const CLI::App& app, const command_line& given) {
    if (app.got_subcommand("make")) {
        if (!given.root.empty()) {
            throw CLI::ValidationError("make", "writes where it is told to, and takes no --root");
        }
        make(app.get_subcommand("make")->remaining());
    }
    if (app.got_subcommand("install")) {
        install(given);
        return;
    }
    enter_root_if_any(given.root);
    if (app.got_subcommand("use")) {
        tz::use(given.version);
    } else if (app.got_subcommand("cleanup")) {
        tz::clean_up(given.rehearsed);
    } else {
        tz::print_status(given.json);
    }
}

// What was printed may still be lost.
int finish(int status) {
    if (!std::cout.flush()) {
        std::cerr << "tzctl: cannot write to standard output\n";
        return 1;
    }
    return status;
}

} // namespace

int main(int count, char** words) {
    tz::platform::prepare_process();
    try {
        CLI::App app("Tells which time-zone data is live and why, and looks after updates.",
                     "tzctl");
        command_line given;
        declare(app, given);
        try {
            app.parse(count, words);
            run(app, given);
            return finish(0);
        } catch (const CLI::ParseError& error) {
            return finish(app.exit(error) == 0 ? 0 : 2);
        }
    } catch (const std::exception& error) {
        std::cout.flush();
        std::cerr << "tzctl: " << tz::printable(error.what()) << '\n';
        return 1;
    }
}
