#pragma once

// Watches the allocations of the code under test (malloc and calloc in the plug-in's objects,
// operator new everywhere) and makes a chosen one fail.
namespace allocator {

long allocations(); // so far in this process
long liveBlocks();  // allocated and not yet freed

// While it lives, the nth allocation from its construction on fails, and no other.
class tFailNth
{
public:
    explicit tFailNth(long n);
    ~tFailNth();
    tFailNth(const tFailNth&) = delete;
    tFailNth& operator=(const tFailNth&) = delete;

    bool fired() const;
};

} // namespace allocator
