// SPDX-License-Identifier: BSD-2-Clause
// What <fcntl.h> declares where there are data-protection classes, to compile for such a platform
// where there are none.
#pragma once

#include <fcntl.h>

#define F_SETPROTECTIONCLASS 64
extern "C" int open_dprotected_np(const char* path, int flags, int protection_class,
                                  int protection_flags, ...);
