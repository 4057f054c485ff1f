#pragma once

#include <cstdio>
#include <memory>
#include <string>
#include <string_view>
#include <unistd.h>

namespace dravikHost {

// Files whose failures are std::runtime_error with the name and the reason.

// Closed at the end of the scope. What matters was flushed before.
struct tFileCloser {
    void operator()(std::FILE* file) const { (void)std::fclose(file); }
};
using tFile = std::unique_ptr<std::FILE, tFileCloser>;

// A file descriptor, closed at the end of the scope.
class tDescriptor
{
public:
    explicit tDescriptor(int fd) : fd(fd) {}
    tDescriptor(const tDescriptor&) = delete;
    tDescriptor& operator=(const tDescriptor&) = delete;
    ~tDescriptor()
    {
        if (fd >= 0) close(fd);
    }

    int get() const { return fd; }

private:
    int fd;
};

// From where the file stands to its end.
std::string readToEnd(std::FILE* file, const std::string& name);

// A whole file; "-" is the standard input.
std::string readText(const std::string& path);

// A text file to write. Every operation may throw.
class tOutputFile
{
public:
    explicit tOutputFile(const std::string& path); // "-" is the standard output
    static tOutputFile standardError();

    void write(std::string_view text);
    void flush();

private:
    tOutputFile(std::FILE* stream, const char* name);

    std::string name;
    tFile owned;
    std::FILE* file;
};

// All of a file at once; "-" is the standard output.
void writeText(const std::string& path, std::string_view text);

// As a whole: who reads meanwhile finds the old text or the new one.
void replaceText(const std::string& path, std::string_view text);

} // namespace dravikHost
