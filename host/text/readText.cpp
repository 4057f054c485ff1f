#include "text/readText.h"

#include <array>
#include <cerrno>
#include <cstdio>
#include <memory>
#include <stdexcept>
#include <system_error>

namespace {

[[noreturn]] void fail(const std::string& name)
{
    const std::string reason = std::generic_category().message(errno);
    throw std::runtime_error("cannot read " + name + ": " + reason);
}

std::string readToEnd(std::FILE* file, const std::string& name)
{
    std::string text;
    std::array<char, 4096> block{};
    while (const size_t count = std::fread(block.data(), 1, block.size(), file))
        text.append(block.data(), count);
    if (std::ferror(file) != 0) fail(name);
    return text;
}

} // namespace

std::string readText(const std::string& path)
{
    if (path == "-") return readToEnd(stdin, "the standard input");
    const std::unique_ptr<std::FILE, decltype(&std::fclose)> file(std::fopen(path.c_str(), "re"),
                                                                  std::fclose);
    if (file == nullptr) fail(path);
    return readToEnd(file.get(), path);
}
