#pragma once

#include "plainServo.h"
#include "tBytes.h"

#include <cctype>
#include <cmath>
#include <cstdio>
#include <cstring>

// A configuration document as a fuzzer's bytes draw it: the text and what is in it. Up to eight
// members, also the same key twice, unknown keys, values out of bounds and values that are no
// numbers. Every other document begins by turning the spike filter on.
class tDrawnDocument
{
public:
    explicit tDrawnDocument(tBytes& input) : bytes(input)
    {
        const uint8_t choice = bytes.byte();
        if (choice % 2 == 0) add("spikeFilterEnabled", "1.5", {kFilterEnabled, true, 1.5});
        for (int left = choice / 2 % 8; left > 0; --left)
            drawMember();
        text += "}";
    }

    std::string text = "{";
    std::vector<tPlainMember> members;

private:
    void drawMember()
    {
        const uint8_t choice = bytes.byte();
        const int parameter = choice % (kParameters + 1);
        const bool known = parameter < kParameters;
        std::string key = known ? kPlainBounds[parameter].key : "other";
        if (choice >= 192 && choice < 240) {
            for (char& letter : key)
                letter = static_cast<char>(std::toupper(letter));
        }
        if (!known || choice >= 240) {
            static const char* const kOthers[] = {"null", "true", "\"1\"", "[1]", "{}"};
            add(key, bytes.oneOf(kOthers), {parameter, false, 0.0});
        } else {
            const double number = drawNumber(kPlainBounds[parameter]);
            add(key, textOf(number), {parameter, true, number});
        }
    }

    void add(const std::string& key, const std::string& value, const tPlainMember& member)
    {
        text += std::string(members.empty() ? "" : ", ") + "\"" + key + "\": " + value;
        members.push_back(member);
    }

    // Around the default, around the bounds, or any at all but what is not a number.
    double drawNumber(const tPlainBounds& bounds)
    {
        const int choice = bytes.byte() % 16;
        const double share = bytes.byte() / 255.0;
        if (choice < 5) return bounds.initial;
        if (choice < 7) return bounds.initial * 4 * share;
        if (choice < 9) return std::pow(10.0, -9 + 10 * share);
        if (choice < 11) return bounds.lowest + (bounds.highest - bounds.lowest) * share;
        if (choice == 11) return bounds.lowest;
        if (choice == 12) return bounds.highest;
        if (choice == 13) return std::nextafter(bounds.lowest, -HUGE_VAL);
        if (choice == 14) return std::nextafter(bounds.highest, HUGE_VAL);
        const uint64_t bits = bytes.word();
        double value = 0.0;
        std::memcpy(&value, &bits, sizeof value);
        return std::isnan(value) ? 0.0 : value;
    }

    // Reads back as the same double.
    static std::string textOf(double number)
    {
        if (std::isinf(number)) return number > 0.0 ? "1e999" : "-1e999";
        char digits[32];
        (void)std::snprintf(digits, sizeof digits, "%.17g", number);
        return digits;
    }

    tBytes& bytes;
};
