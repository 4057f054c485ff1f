#pragma once

#include "zverr/status.h"

// The operations on a status record. None of them throws by itself; a reallocJson that comes from
// a host could, and the record then has its code and the text written until then.

// The standard reallocJson: malloc, at least 512 bytes, sizes in powers of two. Its address goes to
// hosts in the records that their operations are given.
extern "C" bool zverr_defaultReallocJson(zverr_Status* status, uint32_t size);

// An empty record as the plug-in makes it for itself: no code, no buffer, the standard reallocJson.
inline zverr_Status zverr_emptyStatus() { return {0, 0, zverr_defaultReallocJson, nullptr}; }

// Sees to a buffer of at least that size. A reallocJson that grants it and does not give it counts
// as one that refuses.
bool zverr_ensureCapacity(zverr_Status* status, uint32_t size);

// Puts `text` into the buffer in place of what was there; null stands for "{}". `text` lies outside
// the buffer. False if there is no room to be had for it; the old text then stays.
bool zverr_setJson(zverr_Status* status, const char* text);

// The one rule for a new code: a failure stays, a failure replaces a warning, a warning stays until
// a failure comes, 0 never replaces anything.
bool zverr_codeReplaces(int32_t newCode, int32_t code);

// Sets the code by that rule. True if it was taken; a payload that was there is then wiped to "{}".
bool zverr_setCode(zverr_Status* status, int32_t code);

// Carries `source` over if its code is taken. Between records of the same reallocJson the buffer
// moves and the source is left without; otherwise the text is copied, "{}" for none.
bool zverr_takeStatus(zverr_Status* target, zverr_Status* source);

// As zverr_takeStatus, but always copies and leaves `source` whole.
bool zverr_copyStatus(zverr_Status* target, const zverr_Status* source);

// Gives the buffer back at the end of a record. A foreign reallocJson that throws loses its buffer
// and disturbs nothing else.
void zverr_releaseJson(zverr_Status* status) noexcept;
