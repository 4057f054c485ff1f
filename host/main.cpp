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
         {"tune", "Write the document that suits a noise", addTune},
         {"check", "Tell whether a document is taken, or why not", addCheck},
         {"show", "Print the configuration document in force", addShow},
         {"metrics", "Tell what a trace is worth", addMetrics},
         {"plot", "Draw a trace", addPlot},
         {"doctor", "Look at the plug-in and at the clocks of this machine", addDoctor}});
}
