#include "zverr/jsonz.h"

#include <cstring>

void jsonz_formatBuffer(char* buffer, uint32_t size, const char* text)
{
    const size_t length = std::strlen(text);
    std::memcpy(buffer, text, length + 1);
    std::memset(buffer + length + 1, 0, size - length - kJsonzOverhead);
    buffer[size - 1] = kJsonzEndMark;
}
