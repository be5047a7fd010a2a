// SPDX-License-Identifier: BSD-2-Clause
#include <cerrno>

#include "fs/operations.h"
#include "platform/warn.h"
#include "private_root.h"

namespace tz::test {
namespace {

using std::string_literals::operator""s;

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
    for (const auto* unreadable : {"fifo", "/", "missing"}) {
        EXPECT_EQ(fs::read_word(unreadable), "");
    }
}

TEST(warning, is_whole_however_long_and_keeps_its_reason_for_the_next) {
    const std::string name(1 << 20, '%');
    const auto twice = [&] {
        errno = ENOENT;
        warn("%s", name.c_str());
        warn("%s", name.c_str());
    };
    const auto line = name + ": No such file or directory\n";
    EXPECT_EQ(warnings_of(twice, true), line + line);
}

} // namespace
} // namespace tz::test
