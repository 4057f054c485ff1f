#include "traces/printUnread.h"

#include <fmt/format.h>

#include <cstdio>

void printUnread(const tRecording& recording)
{
    if (recording.unreadLines == 0) return;
    std::string examples;
    for (const tUnreadLine& line : recording.firstUnread)
        examples += fmt::format("{}{} ({})", examples.empty() ? "" : ", ", line.number, line.why);
    const bool all = recording.unreadLines == static_cast<int64_t>(recording.firstUnread.size());
    (void)std::fputs(fmt::format("dravik-host: {}: {} lines are not used, {} {}\n", recording.name,
                                 recording.unreadLines, all ? "lines" : "the first are lines",
                                 examples)
                         .c_str(),
                     stderr);
}
