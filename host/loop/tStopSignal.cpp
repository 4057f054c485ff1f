#include "loop/tStopSignal.h"

namespace {

volatile std::sig_atomic_t stopRaised = 0;

extern "C" void noteStop(int /*signal*/) { stopRaised = 1; }

} // namespace

tStopSignal::tStopSignal() : previousInterrupt{}, previousTerminate{}
{
    stopRaised = 0;
    struct sigaction action = {}; // no SA_RESTART: the sleep is to end
    action.sa_handler = noteStop;
    sigaction(SIGINT, &action, &previousInterrupt);
    sigaction(SIGTERM, &action, &previousTerminate);
}

tStopSignal::~tStopSignal()
{
    sigaction(SIGINT, &previousInterrupt, nullptr);
    sigaction(SIGTERM, &previousTerminate, nullptr);
}

bool tStopSignal::raised() const { return stopRaised != 0; }
