// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include "ctl/survey.h"

namespace tz {

/// Prints a survey for people: as wide as the terminal, and in colour where that is wanted.
void print_for_people(const survey& found);

/// Prints it for programs: the JSON object that tzctl(8) describes.
void print_as_json(const survey& found);

} // namespace tz
