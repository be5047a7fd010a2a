// SPDX-License-Identifier: BSD-2-Clause
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <iostream>
#include <string>
#include <system_error>
#include <vector>

#include <CLI/CLI.hpp>
#include <fcntl.h>
#include <unistd.h>

#include "ctl/cleanup.h"
#include "ctl/install.h"
#include "ctl/make.h"
#include "ctl/root.h"
#include "ctl/status.h"
#include "ctl/text.h"
#include "ctl/use.h"
#include "fs/descriptor.h"
#include "platform/process.h"

namespace {

namespace files = std::filesystem;

enum exit_status { done = 0, failed = 1, wrong_usage = 2 };

struct command_line {
    std::string root;
    bool json = false;
    bool forced = false;
    bool rehearsal = false;
    std::string dataset;
    std::string version;
};

void enter_root_if_any(const std::string& root) {
    if (!root.empty()) {
        tz::enter_root(root);
    }
}

// A dataset is looked for in the image first, and then where the command was given.
void install(const command_line& given) {
    std::error_code missing;
    const tz::fs::descriptor outside(
        ::open(given.dataset.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    const auto outside_path = files::canonical(given.dataset, missing);
    enter_root_if_any(given.root);
    const auto inside_path = files::canonical(given.dataset, missing);
    if (!missing) {
        tz::install(inside_path, inside_path.filename(), given.forced);
    } else if (outside.is_open() && ::fchdir(outside.number()) == 0) {
        tz::install(".", outside_path.filename(), given.forced);
    } else {
        throw std::system_error(missing, given.dataset);
    }
}

void run(const CLI::App& app, const command_line& given) {
    if (app.got_subcommand("make")) {
        if (!given.root.empty()) {
            throw CLI::ValidationError("make works where it is told to, and takes no --root");
        }
        tz::make(app.get_subcommand("make")->remaining());
    }
    if (app.got_subcommand("install")) {
        install(given);
        return;
    }
    enter_root_if_any(given.root);
    if (app.got_subcommand("use")) {
        tz::use(given.version);
    } else if (app.got_subcommand("cleanup")) {
        tz::clean_up(given.rehearsal);
    } else {
        tz::print_status(given.json);
    }
}

void declare(CLI::App& app, command_line& given) {
    app.set_version_flag("--version", "tzctl " TZCTL_VERSION);
    app.add_option("--root", given.root, "Work on the system image in DIR")->type_name("DIR");
    app.require_subcommand(0, 1);
    app.fallthrough();

    auto* const status = app.add_subcommand(
        "status",
        "Tell which time-zone data is live, and what the next start will do (the default)");
    status->add_flag("--json", given.json, "Print a JSON object, for programs");

    auto* const install = app.add_subcommand(
        "install", "Install a dataset as an update, for the next start to adopt");
    install->add_option("DATASET", given.dataset, "A directory that \"tzctl make update\" has made")
        ->required();
    install->add_flag("--force", given.forced, "Install it even if no start would adopt it");

    auto* const use =
        app.add_subcommand("use", "Make an installed update, or the system's own data, "
                                  "current now, and let the next start keep it");
    use->add_option("VERSION", given.version, "Its version, or \"system\"")->required();

    auto* const cleanup = app.add_subcommand("cleanup", "Delete the updates that are not in use");
    cleanup->add_flag("--dry-run", given.rehearsal, "Only say what would be deleted");

    app.add_subcommand("make", "Make a dataset: see make-dataset(8)")->prefix_command();
}

// What was printed may still be lost.
int finish(int status) {
    errno = 0;
    std::cout.flush();
    if (!std::cout) {
        std::cerr << "tzctl: standard output: " << std::strerror(errno) << '\n';
        return failed;
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
            return finish(done);
        } catch (const CLI::ParseError& error) {
            return finish(app.exit(error) == 0 ? done : wrong_usage);
        }
    } catch (const std::exception& error) {
        std::cout.flush();
        std::cerr << "tzctl: " << tz::printable(error.what()) << '\n';
        return failed;
    }
}
