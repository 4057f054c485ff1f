#include "text/tOutputFile.h"

#include <cerrno>
#include <stdexcept>
#include <system_error>

namespace {

[[noreturn]] void fail(const std::string& name)
{
    const std::string reason = std::generic_category().message(errno);
    throw std::runtime_error("cannot write " + name + ": " + reason);
}

} // namespace

tOutputFile::tOutputFile(const std::string& path)
    : name(path), owned(std::fopen(path.c_str(), "we")), file(owned.get())
{
    if (file == nullptr) fail(name);
}

tOutputFile::tOutputFile(std::FILE* stream, const char* streamName) : name(streamName), file(stream)
{}

void tOutputFile::write(std::string_view text)
{
    if (std::fwrite(text.data(), 1, text.size(), file) != text.size()) fail(name);
}

void tOutputFile::flush()
{
    if (std::fflush(file) != 0) fail(name);
}

// What matters was flushed before; a run that failed already says so.
void tOutputFile::tCloser::operator()(std::FILE* stream) const { (void)std::fclose(stream); }
