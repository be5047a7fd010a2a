// SPDX-License-Identifier: BSD-2-Clause
// Adds what <fcntl.h> declares on platforms with data-protection classes.
#include <fcntl.h>
#define F_SETPROTECTIONCLASS 64
extern "C" int open_dprotected_np(const char* path, int flags, int protection_class,
                                  int protection_flags, ...);
