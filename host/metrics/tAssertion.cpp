#include "metrics/tAssertion.h"

#include "text/quantity.h"
#include "traces/fields.h"

#include <fmt/format.h>

#include <stdexcept>

tAssertion::tAssertion(const std::string& assertion) : text(assertion)
{
    const size_t at = text.find_first_of("<>");
    if (at == std::string::npos)
        throw std::invalid_argument(fmt::format("'{}' is not FIGURE<LIMIT", text));
    figure = parseFigure(text.substr(0, at));
    less = text[at] == '<';
    orEqual = text.compare(at + 1, 1, "=") == 0;
    const std::string value = text.substr(at + (orEqual ? 2 : 1));
    if (figure.isTime) {
        limit = parseQuantity(value, kDuration) * 1e-9;
        return;
    }
    const auto number = numberIn<double>(value);
    if (!number) throw std::invalid_argument(fmt::format("'{}' is no plain number", value));
    limit = *number;
}

std::string tAssertion::failure(const tMeasured& measured) const
{
    const auto found = valueOf(figure, measured);
    if (!found) return fmt::format("{} cannot be told from these data", text);
    const bool holds = (less ? *found < limit : *found > limit) || (orEqual && *found == limit);
    if (holds) return "";
    return fmt::format("{} does not hold: it is {}", text,
                       figure.isTime ? durationText(*found * 1e9) : fmt::format("{:.4g}", *found));
}
