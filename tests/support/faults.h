#pragma once

// Makes a chosen call of the system fail, in whatever library of the process makes it. The program
// that links this defines those calls itself and passes them on. Only the thread that chose is
// affected, and only while its tFault lives.
namespace faults {

enum tKind {
    kAllocation,    // malloc and its kin fail once, with ENOMEM
    kExhaustion,    // they fail from there on
    kFile,          // opening, reading, examining a file fails once, with EIO
    kMutex,         // pthread_mutex_init fails once, with EAGAIN
    kHostOperation, // nothing of the system's: asked for by the host, through isDue
};

class tFault
{
public:
    // The nth call of this kind from now on fails.
    tFault(tKind kind, long n);
    ~tFault();
    tFault(const tFault&) = delete;
    tFault& operator=(const tFault&) = delete;

    bool fired() const;
};

// Whether this call is one that is to fail.
bool isDue(tKind kind);

// Blocks of the process that were allocated and not yet freed, from the first call of this on.
long liveBlocks();

} // namespace faults
