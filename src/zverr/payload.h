#pragma once

#include "zverr/jsonzWriter.h"
#include "zverr/raisingSites.h"
#include "zverr/status.h"

#include <string>

// The payload of a failure: one JSON object that says what, where and why, edited in place in the
// buffer of the status. Details never change an outcome: what cannot be stored is left out, and the
// code stands.

// Makes sure that the status has a buffer of `extra` + 2 bytes, text included. Gives the closing
// bracket of its text, where members are added; null if there is no such buffer to be had or the
// text, a host's, does not parse.
char* zverr_reserveJson(zverr_Status* status, uint32_t extra);

// Doubles the buffer. Gives the same place in it, or null.
char* zverr_growJson(char* position, zverr_Status* status);

// Adds members one behind the other, in one chain without tests: from the first member that cannot
// be stored on, nothing more is added. Borrows the status.
class zverr_JsonWriter
{
public:
    // Starts at the end of the status's payload, which is made if there is none.
    explicit zverr_JsonWriter(zverr_Status* status);
    // Adds nothing.
    zverr_JsonWriter() : position(nullptr), grower{nullptr, nullptr} {}

    zverr_JsonWriter& addString(const char* key, const char* value);
    zverr_JsonWriter& addString(const char* key, const std::string& value);
    zverr_JsonWriter& addInt(const char* key, int32_t value);
    zverr_JsonWriter& addUInt(const char* key, uint32_t value);
    // What is added next goes into the object, until endObject.
    zverr_JsonWriter& addObject(const char* key);
    zverr_JsonWriter& endObject();
    // "file", "line" and, unless it is null, "component".
    zverr_JsonWriter& addSource(const zverr_SourcePosition& source);

private:
    char* position;
    jsonz_Grower grower;
};

// The one way to raise a failure into a status: the code, and only if it is taken, what and where.
// The site adds its block of reasons to the writer that it gets, which adds nothing if the code was
// not taken.
zverr_JsonWriter zverr_setFailure(zverr_Status* status, const zverr_RaisingSite& site);
