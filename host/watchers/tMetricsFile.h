#pragma once

#include "loop/tStep.h"
#include "watchers/tConsole.h"

#include <optional>
#include <string>

namespace dravikHost {

// A text file of figures for a monitoring agent, in the exposition format that such agents collect,
// replaced as a whole at most once a second.
class tMetricsFile : public iStepObserver
{
public:
    // "": none is written. The console is borrowed.
    tMetricsFile(const std::string& path, tConsole& console) : path(path), console(console) {}

    // The first file that cannot be written throws std::runtime_error; a later one is noted, and
    // the discipline goes on.
    void see(const tStep& step) override;
    void see(const tSilence& silence) override;
    void end(const std::string& remarks) override;

private:
    void write(const tSilence& now);
    void put(const tSilence& now);
    std::string text(const tSilence& now) const;

    std::string path;
    tConsole& console;
    tStep latest;
    tSilence last{};   // moment, of a pair or of silence
    int64_t pairs = 0; // handed to the servo
    std::optional<int64_t> writtenNs;
    bool wasWritten = false;
    bool failing = false;
};

} // namespace dravikHost
