#pragma once

#include <functional>
#include <vector>

namespace dravikHost {

// Looks for the place where a function is least, without derivatives: goes along each axis in turn
// by its step, and halves the steps where that does not help.
//   place     where to start; becomes where the least was found
//   step      along each axis
//   halvings  after which it ends
// Returns the least value.
double patternSearch(const std::function<double(const std::vector<double>&)>& function,
                     std::vector<double>& place, std::vector<double> step, int halvings);

} // namespace dravikHost
