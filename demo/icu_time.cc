// SPDX-License-Identifier: BSD-2-Clause
// Prints what the ICU library makes of a moment (seconds since 1970) in a zone, and of which
// release the time-zone data is that it found. Linked statically for the demo's root directory.
#include <cstdlib>
#include <iostream>
#include <string>

#include <unicode/smpdtfmt.h>
#include <unicode/timezone.h>

int main(int count, char** arguments) {
    if (count != 3) {
        std::cerr << "usage: icu_time ZONE SECONDS\n";
        return 2;
    }
    UErrorCode error = U_ZERO_ERROR;
    icu::SimpleDateFormat format("EEE dd MMM yyyy HH:mm:ss, 'UTC' xx (z)", icu::Locale::getUS(),
                                 error);
    const char* release = icu::TimeZone::getTZDataVersion(error);
    if (U_FAILURE(error)) {
        std::cerr << "icu_time: " << u_errorName(error) << '\n';
        return 1;
    }
    format.adoptTimeZone(icu::TimeZone::createTimeZone(arguments[1]));
    icu::UnicodeString text;
    format.format(std::strtod(arguments[2], nullptr) * 1000, text); // milliseconds
    std::string bytes;
    std::cout << text.toUTF8String(bytes) << ", data of " << release << '\n';
}
