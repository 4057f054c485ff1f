#include "printConfig.h"

#include "tOutputFile.h"

void printConfig(tServoHost& host)
{
    tOutputFile output(stdout, "the standard output");
    output.write(host.readConfig() + "\n");
    output.flush();
}
