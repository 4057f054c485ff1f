#pragma once

#include <cstddef>
#include <cstdint>

// What is left of a fuzzer's input; zeros once it is spent.
class tBytes
{
public:
    tBytes(const uint8_t* data, size_t size) : at(data), end(data + size) {}

    bool empty() const { return at == end; }
    uint8_t byte() { return empty() ? 0 : *at++; }
    uint64_t word()
    {
        uint64_t value = 0;
        for (int i = 0; i < 8; ++i)
            value = value << 8U | byte();
        return value;
    }
    template <typename T, size_t count> const T& oneOf(const T (&values)[count])
    {
        return values[byte() % count];
    }

private:
    const uint8_t* at;
    const uint8_t* end;
};
