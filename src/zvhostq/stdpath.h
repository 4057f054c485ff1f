#pragma once

#include "zverr/status.h"

#include <string>

// Where the standard directories of this installation lie. Each getter writes a path and raises
// zverr::Exception, with an empty path, if the table of directories could not be built. Any thread.

namespace zvhostq {

void get_bindir(std::string& path);
void get_localstatedir(std::string& path);
void get_sharedstatedir(std::string& path);
void get_multiarchlibdir(std::string& path);
void get_runstatedir(std::string& path);
void get_sysconfdir(std::string& path);

// The installation's shared directory: what /etc/zvcorp/share/share.dir says, or the usual one if
// that cannot be read.
void getZVSharedDir(std::string& path);

// The same for the holder of a status.
void read_shared_dir(std::string& path, zverr_Status* status);

// Takes white space, slashes and zero bytes from the end and white space from the front.
void trim_path(std::string& path);

} // namespace zvhostq
