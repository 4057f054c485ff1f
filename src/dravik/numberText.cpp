#include "dravik/numberText.h"

#include <charconv>

namespace {

// As printf's "%1.<digits>g" in the C locale.
std::string withDigits(double value, int digits)
{
    char text[32]; // sign, 17 digits, point, exponent
    const auto end =
        std::to_chars(text, text + sizeof text, value, std::chars_format::general, digits);
    return {text, end.ptr};
}

bool readsBackAs(double value, const std::string& text)
{
    double read = 0;
    std::from_chars(text.data(), text.data() + text.size(), read);
    return read == value;
}

} // namespace

std::string numberText(double value)
{
    std::string text = withDigits(value, 15);
    return readsBackAs(value, text) ? text : withDigits(value, 17);
}
