// SPDX-License-Identifier: BSD-2-Clause
#include <algorithm>
#include <cerrno>
#include <csignal>
#include <filesystem>
#include <iostream>
#include <string>
#include <system_error>
#include <vector>

#include <CLI/CLI.hpp>
#include <unistd.h>

#include "ctl/failure.h"
#include "ctl/interruption.h"
#include "ctl/printers.h"
#include "ctl/root.h"
#include "ctl/text.h"
#include "ctl/tree.h"
#include "ctl/verbs.h"
#include "fs/descriptor.h"
#include "platform/process.h"
#include "rehearsal/regular_file.h"

namespace {

namespace files = std::filesystem;

struct command_line {
    std::string root;
    std::string dataset;
    std::string version;
    std::vector<std::string> compared;
    bool json = false;
    bool forced = false;
    bool rehearsed = false;
};

// Replaces this process by make-dataset, with these arguments.
[[noreturn]] void make(std::vector<std::string> words) {
    // Relative to this program, because the prefix may be chosen at installation. A build directory
    // has both programs side by side.
    const auto here = files::read_symlink("/proc/self/exe").parent_path();
    std::string program = here / "make-dataset";
    if (!files::exists(program)) {
        program = here / MAKE_DATASET;
    }
    std::vector<char*> pointers{program.data()};
    for (auto& word : words) {
        pointers.push_back(word.data());
    }
    pointers.push_back(nullptr);
    (void)std::signal(SIGPIPE, SIG_DFL); // tzctl ignores it; make-dataset must not
    ::execv(program.c_str(), pointers.data());
    throw std::system_error(errno, std::generic_category(), program);
}

void enter_root_if_any(const std::string& root) {
    tz::prepare_to_open_regular_files();
    if (!root.empty()) {
        tz::enter_root(root);
    }
}

// The dataset's path is the caller's, so it is opened before the image is entered.
void install(const command_line& given) {
    const auto dataset = tz::tree::open(given.dataset);
    const std::string version = tz::tree::own_name(dataset, given.dataset);
    enter_root_if_any(given.root);
    tz::install(dataset, given.dataset, version, given.forced);
}

void diff(const command_line& given) {
    std::vector<tz::operand> operands(given.compared.begin(), given.compared.end());
    enter_root_if_any(given.root);
    const auto done = tz::compare(std::move(operands));
    given.json ? tz::print_as_json(done) : tz::print_for_people(done);
}

void declare(CLI::App& app, command_line& given) {
    app.set_version_flag("--version", "tzctl " TZCTL_VERSION);
    const auto not_empty = [](const std::string& text) {
        return std::string(text.empty() ? "an empty text" : "");
    };
    app.add_option("--root", given.root, "Work on the system image in this directory")
        ->check(not_empty);
    app.get_formatter()->column_width(20);
    app.add_flag("--json", given.json, "Print a JSON object, for programs (status, diff)");
    app.require_subcommand(0, 1);
    app.fallthrough();

    auto* const status =
        app.add_subcommand("status", "Show what is current and what the next start does (default)");
    auto* const diff =
        app.add_subcommand("diff", "Show which clocks the next start, or a dataset, changes");
    for (const char* name : {"FROM", "TO"}) {
        diff->add_option_function<std::string>(
                name, [&](const std::string& word) { given.compared.push_back(word); },
                "A version, system, current, latest, or a directory with a slash")
            ->check(not_empty);
    }
    for (auto* const verb : {status, diff}) {
        verb->add_flag("--json", given.json, "Print a JSON object, for programs");
    }
    auto* const install = app.add_subcommand("install", "Install an update for the next start");
    install->add_option("DATASET", given.dataset, "Directory that tzctl make has made")
        ->required()
        ->check(not_empty);
    install->add_flag("--force", given.forced, "Install it despite objections, and print them");
    app.add_subcommand("check", "Print one line for a monitoring system");
    app.add_subcommand("use", "Make an installed update current now, and keep it")
        ->add_option("VERSION", given.version, "Its version; \"system\" for the system's own data")
        ->required()
        ->check(not_empty);
    app.add_subcommand("cleanup", "Delete updates that no link in the state directory uses")
        ->add_flag("--dry-run", given.rehearsed, "Only list what would be deleted");
    app.add_subcommand("make", "Make a dataset: update|system TZDATA ICU DIRECTORY,\n"
                               "as make-dataset(8) describes")
        ->prefix_command()
        ->fallthrough(false);
}

int check(const command_line& given) {
    try {
        enter_root_if_any(given.root);
        return tz::print_check();
    } catch (const std::exception& error) {
        return tz::print_unknown(error.what());
    }
}

void refuse_combinations(const CLI::App& app, const command_line& given) {
    const bool prints_json =
        app.get_subcommands().empty() || app.got_subcommand("status") || app.got_subcommand("diff");
    if (given.json && !prints_json) {
        throw CLI::ValidationError("--json", "only for status and diff");
    }
    if (app.got_subcommand("make")) {
        if (!given.root.empty()) {
            throw CLI::ValidationError("make", "takes no --root");
        }
        if (app.get_subcommand("make")->remaining_size() != 4) {
            throw CLI::ValidationError("usage", "tzctl make update|system TZDATA ICU DIRECTORY");
        }
    }
}

void print_status() {
    const auto found = tz::look();
    const auto effect = tz::effect_of_next_start();
    tz::print_for_people(found);
    std::cout << '\n';
    tz::print_effect(effect);
}

// The exit status.
int run(const CLI::App& app, const command_line& given) {
    refuse_combinations(app, given);
    if (app.got_subcommand("make")) {
        make(app.get_subcommand("make")->remaining());
    }
    if (app.got_subcommand("check")) {
        return check(given);
    }
    if (app.got_subcommand("install")) {
        install(given);
        try {
            tz::print_effect(tz::effect_of_next_start());
        } catch (const std::exception& error) { // it is installed all the same
            std::cerr << "tzctl: " << tz::printable(error.what()) << '\n';
        }
        return 0;
    }
    if (app.got_subcommand("diff")) {
        diff(given);
        return 0;
    }
    enter_root_if_any(given.root);
    if (app.got_subcommand("use")) {
        tz::use(given.version);
    } else if (app.got_subcommand("cleanup")) {
        return tz::clean_up(given.rehearsed) ? 0 : 1;
    } else if (given.json) {
        tz::print_as_json(tz::look());
    } else {
        print_status();
    }
    return 0;
}

int refuse_usage(const CLI::App& app, const CLI::ParseError& error) {
    if (error.get_exit_code() == 0) { // --help or --version
        return app.exit(error);
    }
    if (app.got_subcommand("check")) {
        return tz::print_unknown(error.what());
    }
    std::cerr << "tzctl: " << tz::printable(error.what())
              << "\nRun \"tzctl --help\" for more information.\n";
    return 2;
}

// The words in CLI11's order. An empty one follows "--root=", or CLI11 would take the next word for
// the directory.
std::vector<std::string> last_first(int count, char** words) {
    std::vector<std::string> all;
    for (int at = count - 1; at > 0; --at) {
        all.emplace_back(words[at]);
        if (all.back() == "--root=") {
            all.back() = "";
            all.emplace_back("--root");
        }
    }
    return all;
}

int parse_and_run(int count, char** words) {
    CLI::App app("Shows which time-zone data is current and why, and manages updates.", "tzctl");
    command_line given;
    declare(app, given);
    try {
        app.parse(last_first(count, words));
        return run(app, given);
    } catch (const CLI::ParseError& error) {
        return refuse_usage(app, error);
    }
}

} // namespace

int main(int count, char** words) {
    tz::platform::prepare_process();
    int status = 1;
    try {
        status = parse_and_run(count, words);
    } catch (const std::exception& error) {
        std::cerr << "tzctl: " << tz::printable(error.what()) << '\n';
    }
    if (!std::cout.flush()) { // what was printed may still be lost
        std::cerr << "tzctl: cannot write to standard output\n";
        status = std::max(status, 1);
    }
    tz::interruption::end_process_if_any();
    return status;
}
