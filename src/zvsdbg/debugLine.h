#pragma once

#include <cstdarg>
#include <cstddef>
#include <cstdint>

// Debug lines in the system log:
//
//     [    dravik|                   dravik/tServo|0434] Reading servo configuration from: /x
//
// A line is built on the stack, allocates nothing and cannot fail; what does not fit is cut. Any
// thread may write.

// Where a line comes from. One constant for each place that writes.
struct tDebugLocation {
    const char* file; // source unit
    int32_t line;
    const char* lineEnd; // closes the line, and always fits
};

static_assert(offsetof(tDebugLocation, line) == sizeof(void*), "file comes first");
static_assert(offsetof(tDebugLocation, lineEnd) == 2 * sizeof(void*), "lineEnd comes last");

// Writes a line of this level, or drops it: the lowest level that is written is 4096.
void zvsdbg_line(int32_t level, const tDebugLocation* location, const char* format, ...)
    __attribute__((format(printf, 3, 4)));

// The same without a level.
void zvsdbg_vline(const tDebugLocation* location, const char* format, va_list arguments)
    __attribute__((format(printf, 2, 0)));

// Copies a text into a buffer with `remaining` bytes left and gives the place of its terminator,
// which is always inside; with none left, that is the byte before the cursor.
char* write_text(char* cursor, size_t remaining, const char* text);

// The same with a text brought to a width: its last characters if it is longer, filled up on the
// left if it is shorter. A width of 0 leaves it as it is.
char* write_field(char* cursor, size_t remaining, const char* text, int32_t width, char fill);
