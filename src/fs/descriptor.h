// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <utility>

#include <unistd.h>

namespace tz::fs {

/// Owns what open(2) returned: a file descriptor, or -1 after a failure.
class descriptor {
  public:
    explicit descriptor(int number) : number_(number) {}
    descriptor(const descriptor&) = delete;
    descriptor& operator=(const descriptor&) = delete;
    descriptor(descriptor&& other) noexcept : number_(other.release()) {}
    descriptor& operator=(descriptor&& other) noexcept {
        close();
        number_ = other.release();
        return *this;
    }
    ~descriptor() { close(); }

    [[nodiscard]] int number() const { return number_; }
    [[nodiscard]] bool is_open() const { return number_ != -1; }

    /// Closes early, for callers that need the result: that of close(2), or 0 if not open.
    int close() { return is_open() ? ::close(release()) : 0; }

    /// Hands the descriptor over to the caller.
    [[nodiscard]] int release() { return std::exchange(number_, -1); }

  private:
    int number_;
};

} // namespace tz::fs
