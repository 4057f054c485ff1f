#include "text/files.h"

#include <array>
#include <cerrno>
#include <stdexcept>
#include <system_error>

namespace dravikHost {

namespace {

[[noreturn]] void fail(const char* deed, const std::string& name)
{
    const std::string reason = std::generic_category().message(errno);
    throw std::runtime_error(std::string("cannot ") + deed + " " + name + ": " + reason);
}

} // namespace

std::string readToEnd(std::FILE* file, const std::string& name)
{
    std::string text;
    std::array<char, 4096> block{};
    while (const size_t count = std::fread(block.data(), 1, block.size(), file))
        text.append(block.data(), count);
    if (std::ferror(file) != 0) fail("read", name);
    return text;
}

std::string readText(const std::string& path)
{
    if (path == "-") return readToEnd(stdin, "the standard input");
    const tFile file(std::fopen(path.c_str(), "re"));
    if (file == nullptr) fail("read", path);
    return readToEnd(file.get(), path);
}

tOutputFile::tOutputFile(const std::string& path)
    : name(path == "-" ? "the standard output" : path),
      owned(path == "-" ? nullptr : std::fopen(path.c_str(), "we")),
      file(path == "-" ? stdout : owned.get())
{
    if (file == nullptr) fail("write", name);
}

tOutputFile::tOutputFile(std::FILE* stream, const char* name) : name(name), file(stream) {}

tOutputFile tOutputFile::standardError() { return {stderr, "the standard error output"}; }

void tOutputFile::write(std::string_view text)
{
    if (std::fwrite(text.data(), 1, text.size(), file) != text.size()) fail("write", name);
}

void tOutputFile::flush()
{
    if (std::fflush(file) != 0) fail("write", name);
}

void writeText(const std::string& path, std::string_view text)
{
    tOutputFile output(path);
    output.write(text);
    output.flush();
}

void replaceText(const std::string& path, std::string_view text)
{
    const std::string draft = path + ".new";
    writeText(draft, text);
    if (std::rename(draft.c_str(), path.c_str()) != 0) fail("write", path);
}

} // namespace dravikHost
