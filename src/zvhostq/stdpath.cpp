#include "zvhostq/stdpath.h"

#include "zverr/tLocalStatus.h"
#include "zverr/tStatusGuard.h"
#include "zvhostq/stdpath_table.h"
#include "zvhostq/stdpath_util.h"

#include <algorithm>
#include <cctype>

namespace zvhostq {

namespace {

constexpr const char* kSharedDirFile = "/etc/zvcorp/share/share.dir";
constexpr const char* kSharedDirFallback = "/usr/local/zvcorp/share";

// The table is there once the library is loaded, whoever else asks for it. Nothing is reported, and
// nothing may be thrown out of an initialiser.
[[maybe_unused]] const bool tableIsThere = [] {
    try {
        zverr::tLocalStatus status;
        stdpath_table::instance(&status);
        return true;
    } catch (...) {
        return false;
    }
}();

void getDirectory(const char* name, std::string& path)
{
    path.clear(); // and stays so, however it fails
    zverr::tStatusGuard status;
    const zvktl::err::string row(name, &status);
    zvktl::err::string value;
    const stdpath_table& table = stdpath_table::instance(&status);
    if (status.code >= 0) table.get(row, &value, &status);
    path = value.getText();
}

bool isWhiteSpace(char c) { return std::isspace(static_cast<unsigned char>(c)) != 0; }

bool isTrimmedAtTheEnd(char c) { return isWhiteSpace(c) || c == '/' || c == 0; }

} // namespace

void get_bindir(std::string& path) { getDirectory("bindir", path); }

void get_localstatedir(std::string& path) { getDirectory("localstatedir", path); }

void get_sharedstatedir(std::string& path) { getDirectory("sharedstatedir", path); }

void get_multiarchlibdir(std::string& path) { getDirectory("multiarchlibdir", path); }

void get_runstatedir(std::string& path) { getDirectory("runstatedir", path); }

void get_sysconfdir(std::string& path) { getDirectory("sysconfdir", path); }

void getZVSharedDir(std::string& path)
{
    zverr::tStatusGuard status;
    read_shared_dir(path, &status);
}

void read_shared_dir(std::string& path, zverr_Status* status)
{
    if (status->code < 0) return;
    zvktl::err::vector<char> content;
    zverr::tLocalStatus reading;
    read_whole_file(kSharedDirFile, &content, &reading);
    if (reading.code < 0) {
        path = kSharedDirFallback;
        return;
    }
    path.assign(content.data, content.size);
    trim_path(path);
}

void trim_path(std::string& path)
{
    const auto last = std::find_if_not(path.rbegin(), path.rend(), isTrimmedAtTheEnd);
    path.erase(last.base(), path.end());
    path.erase(path.begin(), std::find_if_not(path.begin(), path.end(), isWhiteSpace));
}

} // namespace zvhostq
