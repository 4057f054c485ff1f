#pragma once

#include <unistd.h>

// A file descriptor, closed at the end of the scope.
class tDescriptor
{
public:
    explicit tDescriptor(int opened) : fd(opened) {}
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
