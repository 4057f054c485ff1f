#include "zvhostq/stdpath_util.h"

#include "zverr/payload.h"

#include <cerrno>
#include <climits>
#include <cstdio>
#include <cstring>
#include <memory>
#include <sys/stat.h>

namespace zvhostq {

namespace {

struct tFileCloser {
    void operator()(FILE* file) const { (void)std::fclose(file); }
};
using tFile = std::unique_ptr<FILE, tFileCloser>;

void addErrno(zverr_JsonWriter& writer, int error)
{
    char buffer[256] = "";
    const char* const returned = strerror_r(error, buffer, sizeof buffer);
    // unreached: glibc always gives a text, and in the buffer only for numbers that nothing sets
    const char* const text = buffer[0] != 0 ? buffer : returned;
    writer.addObject("internal_error").addString("api", "errno").addInt("code", error);
    if (text != nullptr) writer.addString("string", text);
    writer.endObject();
}

void reportNotOpened(const char* filename, int error, zverr_Status* status)
{
    zverr_JsonWriter writer = zverr_setFailure(status, zverr::kAtOpenFile);
    addErrno(writer, error);
    writer.addObject("zvhostq_debug")
        .addString("desc", "error opening file")
        .addString("filename", filename)
        .endObject();
}

void reportNotRead(const char* filename, int error, long fileSize, size_t count,
                   zverr_Status* status)
{
    zverr_JsonWriter writer = zverr_setFailure(status, zverr::kAtReadFile);
    addErrno(writer, error);
    writer.addObject("zvhostq_debug")
        .addString("desc", "didn't read full content of file")
        .addUInt("fileSize", static_cast<uint32_t>(fileSize))
        .addUInt("fread_return", static_cast<uint32_t>(count))
        .addString("filename", filename)
        .endObject();
}

bool isFolder(FILE* file)
{
    struct stat information;
    // unreached: false, as an open file can be told about
    return fstat(fileno(file), &information) == 0 && S_ISDIR(information.st_mode);
}

void resize(zvktl::err::vector<char>* content, size_t size, zverr_Status* status)
{
    if (size > content->size) {
        content->insert(content->size, size - content->size, 0, status);
    } else {
        content->size = size;
    }
}

} // namespace

void read_whole_file(const char* filename, zvktl::err::vector<char>* content, zverr_Status* status)
{
    const tFile file(std::fopen(filename, "rb"));
    if (file == nullptr) reportNotOpened(filename, errno, status);
    if (status->code < 0) return;

    // Some file systems would give it as an empty file.
    if (isFolder(file.get())) return reportNotRead(filename, EISDIR, 0, 0, status);
    (void)std::fseek(file.get(), 0, SEEK_END);
    const long fileSize = std::ftell(file.get());
    // A pipe has none, and one that is too large to be true leaves no room for the zero byte.
    // unreached: too large, which few file systems tell and only of folders
    if (fileSize < 0 || fileSize == LONG_MAX) {
        const int error = fileSize < 0 ? errno : EOVERFLOW;
        return reportNotRead(filename, error, fileSize, 0, status);
    }
    std::rewind(file.get());
    const size_t size = static_cast<size_t>(fileSize);
    resize(content, size + 1, status);
    if (status->code < 0) return;
    errno = 0; // a file that has shrunk is no fault of the system's
    const size_t count = std::fread(content->data, 1, size, file.get());
    // unreached: a failing medium, or a file that shrinks between these lines
    if (count != size) reportNotRead(filename, errno, fileSize, count, status);
    content->data[size] = 0;
}

} // namespace zvhostq
