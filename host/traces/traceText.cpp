#include "traces/traceText.h"

#include "text/files.h"

#include <fmt/format.h>

#include <array>
#include <cerrno>
#include <stdexcept>
#include <string_view>
#include <system_error>

namespace dravikHost {

namespace {

constexpr size_t kMebibyte = 1'048'576;
constexpr size_t kMostText = 512 * kMebibyte; // months of a log
constexpr size_t kMostOfLine = kMebibyte;

struct tBeginning {
    std::string_view bytes;
    const char* what;
};
constexpr std::array<tBeginning, 9> kNoText = {{
    {"\x1f\x8b", "is compressed; give 'zcat FILE | dravik-host ... -'"},
    {"\xfd"
     "7zXZ",
     "is compressed; give 'xzcat FILE | dravik-host ... -'"},
    {"\x28\xb5\x2f\xfd", "is compressed; give 'zstdcat FILE | dravik-host ... -'"},
    {"BZh", "is compressed; give 'bzcat FILE | dravik-host ... -'"},
    {"PK\x03\x04", "is an archive or a spreadsheet; save it as CSV"},
    {"LPKSHHRH", "is a journal; give 'journalctl -o short-monotonic | dravik-host ... -'"},
    {"\xff\xfe", "is text in UTF-16; convert it to UTF-8"},
    {"\xfe\xff", "is text in UTF-16; convert it to UTF-8"},
    {"\x7f"
     "ELF",
     "is a program"},
}};
constexpr std::string_view kByteOrderMark = "\xef\xbb\xbf";

void refuseNoText(const std::string& text, const std::string& name)
{
    for (const tBeginning& beginning : kNoText) {
        if (text.compare(0, beginning.bytes.size(), beginning.bytes) == 0)
            throw std::runtime_error(fmt::format("{} {}", name, beginning.what));
    }
}

std::string readBounded(std::FILE* file, const std::string& name)
{
    std::string text;
    std::array<char, 65536> block{};
    size_t lineAt = 0;
    while (const size_t count = std::fread(block.data(), 1, block.size(), file)) {
        text.append(block.data(), count);
        if (text.size() == count) refuseNoText(text, name);
        const size_t end = std::string_view(text).substr(lineAt).rfind('\n');
        if (end != std::string_view::npos) lineAt += end + 1;
        if (text.size() - lineAt > kMostOfLine) {
            throw std::runtime_error(
                fmt::format("{} has a line of more than {} MiB, which no trace has", name,
                            kMostOfLine / kMebibyte));
        }
        if (text.size() > kMostText) {
            throw std::runtime_error(fmt::format("{} has more than {} MiB; give a part of it", name,
                                                 kMostText / kMebibyte));
        }
    }
    if (std::ferror(file) != 0) {
        throw std::runtime_error(
            fmt::format("cannot read {}: {}", name, std::generic_category().message(errno)));
    }
    if (text.compare(0, kByteOrderMark.size(), kByteOrderMark) == 0)
        text.erase(0, kByteOrderMark.size());
    return text;
}

} // namespace

std::string readTraceText(const std::string& path)
{
    if (path == "-") return readBounded(stdin, "the standard input");
    const tFile file(std::fopen(path.c_str(), "re"));
    if (file == nullptr) {
        throw std::runtime_error(
            fmt::format("cannot read {}: {}", path, std::generic_category().message(errno)));
    }
    return readBounded(file.get(), path);
}

} // namespace dravikHost
