#include "verbs/verbs.h"

#include "loop/tDiscipline.h"
#include "sources/recordedSources.h"
#include "verbs/shared.h"

#include <fmt/format.h>

#include <memory>
#include <stdexcept>

namespace dravikHost {

namespace {

struct tReplay : tDisciplineOptions {
    tTraceOptions trace;
    bool reDiscipline = false;
};

std::string scenarioText(const tRecording& recording, const char* mode, const tReplay& options)
{
    return fmt::format("replay: {}, {} measurements from {};\n        {}; {}; {}", recording.name,
                       recording.pairs.size(), recording.format, mode, tuningText(options),
                       tServoLibrary::find(options.library));
}

void replayVerbatim(const tServoLibrary& library, const tRecording& recording,
                    const tReplay& options)
{
    tRecordedClock clock(options.maxFrequencyOffsetPpb);
    tRecordedSource source(recording, clock);
    const char* const mode = "verbatim: errors as recorded, on which the orders have no effect";
    runInMadeTime(library, clock, source, scenarioText(recording, mode, options), options);
}

void replayReDisciplined(const tServoLibrary& library, const tRecording& recording,
                         const tReplay& options)
{
    tFreeRunningClock clock(recording.pairs[0].clockNs, options.maxFrequencyOffsetPpb);
    tFreeRunningSource source(recording, clock);
    const char* const mode = "re-disciplined: recorded corrections undone, the loop closed anew";
    runInMadeTime(library, clock, source, scenarioText(recording, mode, options), options);
}

void run(const tReplay& options)
{
    const tServoLibrary library(tServoLibrary::find(options.library));
    const tRecording recording = readTrace(options.trace);
    if (options.reDiscipline) {
        replayReDisciplined(library, recording, options);
    } else {
        replayVerbatim(library, recording, options);
    }
}

} // namespace

std::function<void()> addReplay(tOptionSet& options)
{
    const auto replay = std::make_shared<tReplay>();
    addTraceOptions(options, replay->trace).require();
    options.flag("--re-discipline", replay->reDiscipline,
                 "Undo the recorded corrections and close the\n"
                 "loop; else pairs as recorded, verbatim");
    addFreeRunningOption(options, replay->trace);
    addDisciplineOptions(options, *replay);
    options.finally([replay, options] {
        requireOneTuning(options, *replay);
        if (replay->selfTune && !replay->reDiscipline) {
            throw std::invalid_argument(
                "--self-tune: needs --re-discipline, as verbatim the orders "
                "have no effect to learn from");
        }
    });
    return [replay] { run(*replay); };
}

} // namespace dravikHost
