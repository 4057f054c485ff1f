#pragma once

#include <cstdio>
#include <memory>
#include <string>
#include <string_view>

// A text file that tells what it could not write: every operation throws std::runtime_error with
// the name and the reason.
class tOutputFile
{
public:
    explicit tOutputFile(const std::string& path);
    tOutputFile(std::FILE* stream, const char* streamName); // stdout or stderr

    void write(std::string_view text);
    void flush();

private:
    struct tCloser {
        void operator()(std::FILE* stream) const;
    };
    std::string name;
    std::unique_ptr<std::FILE, tCloser> owned;
    std::FILE* file;
};
