#include "verbs/replay.h"

#include "loop/tDiscipline.h"
#include "sources/tFreedSource.h"
#include "sources/tRecordedSource.h"
#include "traces/traceOptions.h"

#include <fmt/format.h>

#include <memory>

namespace {

struct tOptions : tDisciplineOptions {
    tTraceOptions trace;
    bool reDiscipline = false;
};

std::string scenarioText(const tRecording& recording, const char* mode, const tOptions& options)
{
    return fmt::format("replay: {}, {} measurements from {};\n        {}; {}", recording.name,
                       recording.pairs.size(), recording.format, mode,
                       tServoLibrary::find(options.library));
}

void replayVerbatim(const tServoLibrary& library, const tRecording& recording,
                    const tOptions& options)
{
    tRecordedClock clock(options.maxFrequencyOffsetPpb);
    tRecordedSource source(recording, clock);
    const char* const mode = "verbatim: errors as recorded, on which the orders have no effect";
    tDiscipline(library, clock, options).run(scenarioText(recording, mode, options), source);
}

void replayReDisciplined(const tServoLibrary& library, const tRecording& recording,
                         const tOptions& options)
{
    tFreedClock clock(recording.pairs[0].clockNs, options.maxFrequencyOffsetPpb);
    tFreedSource source(recording, clock);
    const char* const mode = "re-disciplined: recorded corrections undone, the loop closed anew";
    tDiscipline(library, clock, options).run(scenarioText(recording, mode, options), source);
}

void replay(const tOptions& options)
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

tVerb addReplay(CLI::App& app)
{
    CLI::App* const verb = app.add_subcommand("replay", "Run the plug-in on a recorded trace");
    const auto options = std::make_shared<tOptions>();
    addTraceOptions(*verb, options->trace)->required();
    verb->add_flag("--re-discipline", options->reDiscipline,
                   "Undo the recorded corrections and close the\n"
                   "loop; else pairs as recorded, verbatim");
    addFreeRunningOption(*verb, options->trace);
    addDisciplineOptions(*verb, *options);
    return {verb, [options] { replay(*options); }};
}
