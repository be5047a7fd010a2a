// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include "ctl/diff.h"
#include "ctl/survey.h"

namespace tz {

/// Prints a survey for people: as wide as the terminal, and in colour where that is wanted.
void print_for_people(const survey& found);

/// Prints it for programs: the JSON object that tzctl(8) describes.
void print_as_json(const survey& found);

/// The same for a comparison.
void print_for_people(const comparison& done);
void print_as_json(const comparison& done);

/// Prints for people, in a line or two, what the next start means for local time. `done` compares
/// the current data with that of the next start.
void print_effect(const comparison& done);

} // namespace tz
