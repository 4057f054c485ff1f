#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace dravikHost {

// What the lines are, if they are of a kind that is known and cannot be read: its name, and what to
// do instead. "" if they are of none.
std::string knownKindOf(const std::vector<std::string_view>& lines);

} // namespace dravikHost
