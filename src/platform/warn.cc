// SPDX-License-Identifier: BSD-2-Clause
#include "platform/warn.h"

#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <new>
#include <string>

#include <err.h>
#include <unistd.h>

// The program's name, in the C libraries of Linux and of the BSDs.
extern "C" char* __progname; // NOLINT(bugprone-reserved-identifier,cert-dcl*)

namespace tz {
namespace {

[[gnu::format(printf, 1, 0)]] std::string formatted(const char* format, std::va_list values) {
    std::va_list measured;
    va_copy(measured, values);
    const int length = std::vsnprintf(nullptr, 0, format, measured);
    va_end(measured);
    if (length < 0) {
        throw std::bad_alloc(); // longer than INT_MAX, which is printf's limit
    }

    std::va_list printed;
    va_copy(printed, values);
    std::string text(static_cast<std::size_t>(length), '\0');
    (void)std::vsnprintf(text.data(), text.size() + 1, format, printed);
    va_end(printed);
    return text;
}

} // namespace

void warn(const char* format, ...) {
    const int reason = errno;
    std::va_list values;
    va_start(values, format);
    try {
        std::string line = __progname;
        line.append(": ").append(formatted(format, values));
        line.append(": ").append(std::strerror(reason)).append("\n");
        [[maybe_unused]] const auto written = ::write(STDERR_FILENO, line.data(), line.size());
    } catch (const std::bad_alloc&) {
        errno = reason;
        ::vwarn(format, values); // needs no memory, but makes several writes
    }
    va_end(values);
    errno = reason;
}

} // namespace tz
