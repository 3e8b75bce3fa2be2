// SPDX-License-Identifier: Apache-2.0
// leftovers.h: temporary names, and what is left under them by commands that were killed. They have
// the form of the library's ("<name>.tmp-<32 hexadecimal digits>", drawn at random), and as there
// the writer holds the lock (flock) of what has one, so that whoever gets the lock may remove it.
#ifndef VESK2_TOOLS_LEFTOVERS_H
#define VESK2_TOOLS_LEFTOVERS_H

#include <string>
#include <string_view>

namespace vesk2_command {

// What the drawn names for `name` begin with, and a new one of them; empty when none can be drawn.
std::string StemOf(const std::string& name);
std::string DrawName(const std::string& stem);
// Whether a name was drawn, by its form.
bool IsLeftover(std::string_view name, const std::string& stem);

// RemoveLeftoverFiles removes the files that the dead left beside `path` on the way to it. What
// cannot be removed stays: it is only a file too many.
void RemoveLeftoverFiles(const std::string& path);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_LEFTOVERS_H
