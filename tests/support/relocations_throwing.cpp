// A relocation library whose answer is an exception of a class of its own, whose code goes with it.

#include <cstddef>

namespace {

volatile int destroyed = 0;

struct tOwnException {
    ~tOwnException() { destroyed = 1; }
};

} // namespace

extern "C" int get_relocated_dir(const char* /*name*/, char* /*buffer*/, size_t /*size*/)
{
    throw tOwnException();
}
