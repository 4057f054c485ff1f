#include "text/words.h"

#include "text/quantity.h"

#include <algorithm>

namespace dravikHost {

std::string_view takeLine(std::string_view& text)
{
    const size_t end = std::min(text.find('\n'), text.size());
    std::string_view line = text.substr(0, end);
    text.remove_prefix(std::min(end + 1, text.size()));
    if (!line.empty() && line.back() == '\r') line.remove_suffix(1);
    return line;
}

std::string_view takeWord(std::string_view& text)
{
    text.remove_prefix(std::min(text.find_first_not_of(" \t"), text.size()));
    const std::string_view word = text.substr(0, text.find_first_of(" \t"));
    text.remove_prefix(word.size());
    return word;
}

std::string_view takeField(std::string_view& text)
{
    const std::string_view field = text.substr(0, text.find(','));
    text.remove_prefix(std::min(field.size() + 1, text.size()));
    return field;
}

std::optional<int64_t> secondsIn(std::string_view text)
{
    constexpr uint32_t kMostSeconds = 2'000'000'000;
    const size_t point = text.find('.');
    const auto whole = numberIn<uint32_t>(text.substr(0, point));
    if (!whole || *whole > kMostSeconds) return std::nullopt;
    int64_t ns = *whole * kSecondNs;
    if (point == std::string_view::npos) return ns;
    const std::string_view digits = text.substr(point + 1);
    const auto fraction = numberIn<uint32_t>(digits);
    if (!fraction || digits.size() > 9) return std::nullopt;
    int64_t fractionNs = *fraction;
    for (size_t i = digits.size(); i < 9; ++i)
        fractionNs *= 10;
    return ns + fractionNs;
}

} // namespace dravikHost
