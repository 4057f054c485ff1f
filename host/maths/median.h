#pragma once

#include <algorithm>
#include <cstddef>
#include <vector>

namespace dravikHost {

// The middle one of at least one value; of an even count the upper of the two.
template <typename Number> Number median(std::vector<Number> values)
{
    const auto middle = values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2);
    std::nth_element(values.begin(), middle, values.end());
    return *middle;
}

} // namespace dravikHost
