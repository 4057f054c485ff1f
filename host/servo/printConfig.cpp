#include "servo/printConfig.h"

#include "text/tOutputFile.h"

void printConfig(tServoHost& host)
{
    tOutputFile output(stdout, "the standard output");
    output.write(host.readConfig() + "\n");
    output.flush();
}
