// SPDX-License-Identifier: BSD-2-Clause
#include <array>
#include <cerrno>
#include <regex>
#include <sstream>
#include <stdexcept>

#include <fcntl.h>
#include <sys/socket.h>
#include <unistd.h>

#include "dataset/kiv_icu.h"
#include "fs/operations.h"
#include "platform/warn.h"
#include "private_root.h"
#include "startup/links.h"
#include "version/data_version.h"

namespace tz::test {
namespace {

using namespace std::string_literals;

std::string shown(const auto& version) {
    std::ostringstream text;
    text << version.year << " " << version.letters << " " << version.minor << " " << version.patch;
    return text.str();
}

void for_every_text(const std::string& alphabet, std::size_t longest,
                    const std::function<void(const std::string&)>& act,
                    const std::string& text = "") {
    act(text);
    for (std::size_t i = 0; text.size() < longest && i < alphabet.size(); ++i) {
        for_every_text(alphabet, longest, act, text + alphabet[i]);
    }
}

void compare_with_regular_expressions(const std::string& text) {
    static const std::regex version(R"(([0-9]+)([a-z]+)(?:\.([0-9]+))?(?:\.([0-9]+))?)");
    static const std::regex icu_name(R"(icutz([0-9]+[lbe])\.dat)");
    static const std::regex link(
        R"(/usr/share/zoneinfo\.default|(/var/db/timezone/tz/[\s\S]+)/[^/]*)");
    std::smatch match;
    const auto pieces = split_version(text);
    EXPECT_EQ(pieces ? shown(*pieces) : "",
              std::regex_match(text, match, version) ? match.format("$1 $2 $3 $4") : "");
    for (const auto& name : {"icutz" + text + ".dat", text + "icutz4l.dat", "icutz4l.dat" + text,
                             text + "tz4l.dat", "icutz4l" + text + "t"}) {
        const bool matches = std::regex_match(name, match, icu_name);
        EXPECT_EQ(icu_schema_in_name(name), matches ? match.str(1) : "") << name;
    }
    for (const auto* start : {"", "/var/db/timezone/tz/", "/usr/share/zoneinfo.default"}) {
        const auto target = start + text;
        if (std::regex_match(target, match, link)) {
            EXPECT_EQ(dataset_path_from_zoneinfo_link(target), match.str(1));
        } else {
            EXPECT_THROW((void)dataset_path_from_zoneinfo_link(target), int) << target;
        }
    }
}

TEST(scanners, read_every_short_text_as_regular_expressions_do) {
    warnings_of([] {
        // With the neighbours of 0, 9, a and z.
        for_every_text("09az./:`{A-\n\0\xe9"s, 3, compare_with_regular_expressions);
        for_every_text("0a.", 8, compare_with_regular_expressions);     // versions
        for_every_text("09lbe./", 5, compare_with_regular_expressions); // schemas and links
    });
}

TEST(version, has_numbers_up_to_the_largest_int_and_is_unknown_if_unreadable) {
    const std::string letters(1 << 20, 'z');
    const std::string digits(1 << 20, '9');
    EXPECT_EQ(shown(data_version("02147483647aa.2147483646.00")), "2147483647 aa 2147483646 0");
    EXPECT_EQ(shown(data_version("1" + letters + ".2147483647")),
              "1 " + letters + " 2147483647 -1");
    for (const auto& text : {"2147483648a"s, "1a.2147483648"s, "1a.1." + digits}) {
        EXPECT_THROW(data_version{text}, std::out_of_range);
    }
    data_version version("1999x.1.1");
    EXPECT_NE(warnings_of([&] { version.parse(digits); }), "");
    EXPECT_EQ(shown(version), "-1  -1 -1");
}

TEST(version, is_ordered_field_by_field) {
    std::vector<data_version> ascending(1); // the unknown version is the oldest
    for (const auto* text :
         {"0a", "999z", "1000a", "2016a", "2016a.0", "2016a.0.0", "2016a.1.9", "2016a.2",
          "2016a.10", "2016aa", "2016b", "2016z", "2016za", "2017a"}) {
        ascending.emplace_back(text);
    }
    for (const auto& left : ascending) {
        for (const auto& right : ascending) {
            EXPECT_EQ(left > right, &left > &right) << shown(left) << " > " << shown(right);
            EXPECT_EQ(left == right, &left == &right) << shown(left) << " == " << shown(right);
        }
    }
}

TEST(word, is_the_first_in_a_regular_file) {
    const std::string page(4096, 'x'); // of which several are read in turn
    const tree words = {
        {" \t\n\v\f\r2016a b", "2016a"},
        {"\xa0\x85 c", "\xa0\x85"},
        {"a\0b c"s, "a\0b"s},
        {page + page, page + page},
        {page + " y", page},
        {std::string(5000, ' ') + "z", "z"},
        {" \n", ""},
    };
    for (const auto& [text, word] : words) {
        lay_out({{"file", "=" + text}, {"fifo", "|"}});
        EXPECT_EQ(fs::read_word("file"), word);
    }
    const int writer = ::open("fifo", O_RDWR); // so that there is something to read
    EXPECT_EQ(::write(writer, "word ", 5), 5);
    EXPECT_EQ(fs::read_word("fifo") + fs::read_word("/") + fs::read_word("missing"), "");
    ::close(writer);
}

TEST(warning, is_one_write_whatever_is_in_it_and_keeps_its_reason_for_the_next) {
    std::array<int, 2> ends{};
    ASSERT_EQ(::socketpair(AF_UNIX, SOCK_SEQPACKET, 0, ends.data()), 0); // one message a write
    const int saved = ::dup(STDERR_FILENO);
    ::dup2(ends[1], STDERR_FILENO);
    const std::string name = "%s\n" + std::string(50000, '%');
    errno = ENOENT;
    warn("%s", name.c_str());
    ::close(STDERR_FILENO);
    warn("nobody hears");
    const int reason = errno;
    ::dup2(saved, STDERR_FILENO);
    EXPECT_EQ(reason, ENOENT);

    std::string text(100000, '\0');
    const auto length = ::recv(ends[0], text.data(), text.size(), MSG_DONTWAIT);
    EXPECT_EQ(text.substr(0, static_cast<std::size_t>(length)),
              "tzreconcile_tests: " + name + ": No such file or directory\n");
}

} // namespace
} // namespace tz::test
