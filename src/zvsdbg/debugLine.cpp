#include "zvsdbg/debugLine.h"

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <syslog.h>

namespace {

constexpr size_t kBufferSize = 512;
constexpr size_t kDigitsSize = 16;
constexpr int kPriority = LOG_INFO; // facility and ident are the host's

using tFieldWriter = char* (*)(char* cursor, size_t remaining, const tDebugLocation* location);

char* writeOpening(char* cursor, size_t remaining, const tDebugLocation* location);
char* writeComponent(char* cursor, size_t remaining, const tDebugLocation* location);
char* writeSeparator(char* cursor, size_t remaining, const tDebugLocation* location);
char* writeFile(char* cursor, size_t remaining, const tDebugLocation* location);
char* writeLineNumber(char* cursor, size_t remaining, const tDebugLocation* location);
char* writeClosing(char* cursor, size_t remaining, const tDebugLocation* location);
void writeToSyslog(const char* text);

// What a line looks like and where it goes.
struct tLayout {
    int32_t componentWidth;
    int32_t fileWidth;
    void (*lineSink)(const char* text);
    int32_t minimumLevel;
    int32_t lineNumberWidth;
    const tFieldWriter* lineFields; // up to a null
    int (*formatText)(char* out, size_t size, const char* format, va_list arguments);
};

constexpr tFieldWriter kLineFields[] = {writeOpening,   writeComponent,  writeSeparator, writeFile,
                                        writeSeparator, writeLineNumber, writeClosing,   nullptr};
constexpr tLayout kLayout = {10, 32, writeToSyslog, 0x1000, 4, kLineFields, std::vsnprintf};

char* writeOpening(char* cursor, size_t remaining, const tDebugLocation* /*location*/)
{
    return write_text(cursor, remaining, "[");
}

char* writeComponent(char* cursor, size_t remaining, const tDebugLocation* /*location*/)
{
    return write_field(cursor, remaining, "dravik", kLayout.componentWidth, ' ');
}

char* writeSeparator(char* cursor, size_t remaining, const tDebugLocation* /*location*/)
{
    return write_text(cursor, remaining, "|");
}

char* writeFile(char* cursor, size_t remaining, const tDebugLocation* location)
{
    return write_field(cursor, remaining, location->file, kLayout.fileWidth, ' ');
}

// The digits alone; a line of 0 has none and is all fill.
char* writeLineNumber(char* cursor, size_t remaining, const tDebugLocation* location)
{
    char digits[kDigitsSize] = {};
    char* first = digits + kDigitsSize - 1;
    for (int32_t rest = location->line; rest > 0; rest /= 10) {
        *--first = static_cast<char>('0' + rest % 10);
    }
    return write_field(cursor, remaining, first, kLayout.lineNumberWidth, '0');
}

char* writeClosing(char* cursor, size_t remaining, const tDebugLocation* /*location*/)
{
    return write_text(cursor, remaining, "] ");
}

void writeToSyslog(const char* text) { syslog(kPriority, "%s", text); }

} // namespace

// NOLINTNEXTLINE(cert-dcl50-cpp): takes what printf takes, checked by the compiler
void zvsdbg_line(int32_t level, const tDebugLocation* location, const char* format, ...)
{
    if (level < kLayout.minimumLevel) return;
    va_list arguments;
    va_start(arguments, format);
    zvsdbg_vline(location, format, arguments);
    va_end(arguments);
}

void zvsdbg_vline(const tDebugLocation* location, const char* format, va_list arguments)
{
    char buffer[kBufferSize];
    char* const end = buffer + kBufferSize;
    char* cursor = buffer;
    const auto remaining = [&] { return static_cast<size_t>(end - cursor); };
    for (const tFieldWriter* write = kLayout.lineFields; *write != nullptr; ++write) {
        cursor = (*write)(cursor, remaining(), location);
    }
    (void)kLayout.formatText(cursor, remaining(), format, arguments);
    *(end - std::strlen(location->lineEnd) - 1) = 0; // room for it, whatever the message's length
    cursor += std::strlen(cursor);
    write_text(cursor, remaining(), location->lineEnd);
    kLayout.lineSink(buffer);
}

char* write_text(char* cursor, size_t remaining, const char* text)
{
    char* const last = cursor + remaining - 1;
    while (cursor < last && *text != 0) {
        *cursor++ = *text++;
    }
    cursor = std::min(cursor, last);
    *cursor = 0;
    return cursor;
}

char* write_field(char* cursor, size_t remaining, const char* text, int32_t width, char fill)
{
    const size_t length = std::strlen(text);
    const size_t wanted = width > 0 ? static_cast<size_t>(width) : length;
    if (length >= wanted) return write_text(cursor, remaining, text + (length - wanted));
    const size_t filling = std::min(wanted - length, remaining);
    std::memset(cursor, fill, filling);
    return write_text(cursor + filling, remaining - filling, text);
}
