#pragma once

#include "clocks/tSteeredClock.h"
#include "host/stepFixture.h"
#include "sources/iPairSource.h"

#include <csignal>

namespace dravikHost {

class tFailingClock : public tSteeredClock
{
public:
    using tSteeredClock::tSteeredClock;
    void step(int64_t deltaNs) override { order(), tSteeredClock::step(deltaNs); }
    void setOffsetPpb(double ppb) override { order(), tSteeredClock::setOffsetPpb(ppb); }

    int orders = 0;
    int failsAt = 0;

private:
    void order()
    {
        if (++orders == failsAt) throw std::runtime_error("the clock is gone");
    }
};

// A clock 3 ms ahead, 20 ppm fast and steered within 100 ppm, beside a perfect reference. A second
// passes for each letter of the script; most are plain.
struct tScene : iPairSource {
    tFailingClock clock{kStartNs + 3'000'000, 20'000, 100'000};
    tPair pair{0, kStartNs, kStartNs + 3'000'000, {}};
    const char* script = "";

    const tPair& second(char what = '.')
    {
        clock.pass(kSecondNs);
        if (what == 'u') clock.tSteeredClock::step(2000); // which ends a lock
        if (what == 'm') clock.tSteeredClock::step(1'000'000);
        if (what == 'd') clock.tSteeredClock::step(-100'000'000); // within the limit of sanity
        if (what == 'C') clock.tSteeredClock::step(-300'000'000);
        if (what == 'R') pair.referenceNs += 300'000'000;
        if (what == 'H') (void)raise(SIGHUP);
        pair.elapsedNs += kSecondNs;
        pair.referenceNs += kSecondNs;
        pair.clockNs = clock.timeNs();
        return pair;
    }
    std::optional<tMoment> next() override
    {
        if (*script == '\0') return std::nullopt;
        const bool silent = *script == '~';
        second(*script++);
        return tMoment{pair.elapsedNs, silent ? std::nullopt : std::optional(pair)};
    }
    std::string remarks() const override { return "two left out"; }
};

} // namespace dravikHost
