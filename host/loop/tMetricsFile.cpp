#include "loop/tMetricsFile.h"

#include "text/tOutputFile.h"

#include <fmt/format.h>

#include <cerrno>
#include <cstdio>
#include <stdexcept>
#include <system_error>

void tMetricsFile::write(const std::vector<tMetric>& metrics) const
{
    if (path.empty()) return;
    const std::string draft = path + ".new";
    {
        tOutputFile output(draft);
        for (const tMetric& metric : metrics) {
            output.write(fmt::format("# HELP {0} {1}\n# TYPE {0} {2}\n{0} {3:.9g}\n", metric.name,
                                     metric.help, metric.type, metric.value));
        }
        output.flush();
    }
    if (std::rename(draft.c_str(), path.c_str()) != 0) {
        throw std::runtime_error("cannot write " + path + ": " +
                                 std::generic_category().message(errno));
    }
}
