#include "maths/patternSearch.h"

namespace dravikHost {

double patternSearch(const std::function<double(const std::vector<double>&)>& function,
                     std::vector<double>& place, std::vector<double> step, int halvings)
{
    double least = function(place);
    const auto improve = [&](size_t axis, double by) {
        std::vector<double> next = place;
        next[axis] += by;
        const double value = function(next);
        if (!(value < least)) return false;
        least = value;
        place = next;
        return true;
    };
    while (halvings >= 0) {
        bool improved = false;
        for (size_t axis = 0; axis < place.size(); ++axis)
            improved = improve(axis, step[axis]) || improve(axis, -step[axis]) || improved;
        if (improved) continue;
        for (double& length : step)
            length /= 2;
        --halvings;
    }
    return least;
}

} // namespace dravikHost
