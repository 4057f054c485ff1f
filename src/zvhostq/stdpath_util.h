#pragma once

#include "zverr/status.h"
#include "zvktl/err/vector.h"

namespace zvhostq {

// Reads a file: its bytes and one zero byte behind them, which the content's size counts. Fails
// with zvplaterr_resourceNotFound if it cannot be opened; with zvplaterr_osFault if it is a folder
// or has no size, and then nothing is read, or if less than its size can be read, and then
// `content` has that.
void read_whole_file(const char* filename, zvktl::err::vector<char>* content, zverr_Status* status);

} // namespace zvhostq
