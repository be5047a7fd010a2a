// SPDX-License-Identifier: BSD-2-Clause
#include <algorithm>
#include <array>
#include <cerrno>
#include <stdexcept>

#include <fcntl.h>
#include <sys/socket.h>
#include <unistd.h>

#include "fs/operations.h"
#include "platform/warn.h"
#include "private_root.h"
#include "version/data_version.h"

namespace tz::test {
namespace {

using namespace std::string_literals;

std::string shown(const data_version& version) {
    return std::to_string(version.year) + " " + version.letters + " " +
           std::to_string(version.minor) + " " + std::to_string(version.patch);
}

TEST(version_text, becomes_numbers_and_letters) {
    const std::string letters(1 << 20, 'z');
    const std::string digits(1 << 20, '9');
    const tree versions = {
        {"2016f", "2016 f -1 -1"},
        {"02016aa.010.00", "2016 aa 10 0"},
        {"2147483647a.2147483646.2147483647", "2147483647 a 2147483646 2147483647"},
        {"1" + letters + ".2", "1 " + letters + " 2 -1"},
        {digits, "-1  -1 -1"},
        {"2016F.1.0", "-1  -1 -1"},
        {digits + "a", "too large"},
        {"2147483648a", "too large"},
        {"1a.2147483648", "too large"},
        {"1a.1.99999999999999999999", "too large"},
    };
    for (const auto& [text, version] : versions) {
        std::string found = "too large";
        const auto warnings = warnings_of([&found, &text = text] {
            try {
                data_version parsed("1999x.1.1");
                parsed.parse(text);
                found = shown(parsed);
            } catch (const std::out_of_range&) {
            }
        });
        EXPECT_EQ(found, version);
        EXPECT_EQ(std::count(warnings.begin(), warnings.end(), '\n'), version[0] == '-' ? 2 : 0);
    }
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
    for (const auto* unreadable : {"fifo", "/", "missing"}) {
        EXPECT_EQ(fs::read_word(unreadable), "");
    }
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
    warn("%s", name.c_str());
    ::dup2(saved, STDERR_FILENO);
    ::close(saved);
    ::close(ends[1]);
    for (int line = 0; line < 2; ++line) {
        std::string text(100000, '\0');
        text.resize(
            static_cast<std::size_t>(std::max(::read(ends[0], text.data(), text.size()), 0L)));
        EXPECT_EQ(text, "tzreconcile_tests: " + name + ": No such file or directory\n");
    }
    ::close(ends[0]);
}

} // namespace
} // namespace tz::test
