#include "sources/tSignals.h"

namespace dravikHost {

namespace {

volatile std::sig_atomic_t stopped = 0;
volatile std::sig_atomic_t reload = 0;

extern "C" void noteSignal(int signal)
{
    if (signal == SIGHUP) {
        reload = 1;
    } else {
        stopped = 1;
    }
}

} // namespace

tSignals::tSignals() : previousInterrupt{}, previousTerminate{}, previousHangUp{}
{
    stopped = 0;
    reload = 0;
    struct sigaction action = {};
    action.sa_handler = noteSignal;
    action.sa_flags = SA_RESTART; // of writes; nanosleep and poll end all the same
    sigaction(SIGINT, &action, &previousInterrupt);
    sigaction(SIGTERM, &action, &previousTerminate);
    sigaction(SIGHUP, &action, &previousHangUp);
}

tSignals::~tSignals()
{
    sigaction(SIGINT, &previousInterrupt, nullptr);
    sigaction(SIGTERM, &previousTerminate, nullptr);
    sigaction(SIGHUP, &previousHangUp, nullptr);
}

bool tSignals::stopRaised() const { return stopped != 0; }

bool tSignals::takeReload()
{
    if (reload == 0) return false;
    reload = 0;
    return true;
}

} // namespace dravikHost
