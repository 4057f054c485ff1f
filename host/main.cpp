// dravik-host: loads the clock servo plug-in as any other host would, and lets it discipline a
// clock. Each word of the command line is a file in verbs/. simulate, replay and run choose a clock
// and a source of pairs, and share the loop; the others work on documents, traces and the machine.

#include "verbs/verbs.h"

int main(int argc, char** argv)
{
    using namespace dravikHost;
    return runCommandLine(
        argc, argv,
        {{"simulate", "Discipline a simulated clock", addSimulate},
         {"replay", "Run the plug-in on a recorded trace", addReplay},
         {"run", "Discipline a clock in real time", addRun},
         {"tune", "Design a document for a noise", addTune},
         {"check", "Check a document, and advise on its loop", addCheck},
         {"show", "Print the configuration document in force", addShow},
         {"metrics", "Compute the figures of a trace, and hold it to limits", addMetrics},
         {"plot", "Draw a trace", addPlot},
         {"doctor", "Examine the plug-in and the clocks of this machine", addDoctor}});
}
