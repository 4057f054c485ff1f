#pragma once

#include <string>
#include <vector>

struct tMetric {
    const char* name;
    const char* type; // counter or gauge
    const char* help;
    double value;
};

// A text file of figures for a monitoring agent, in the exposition format that such agents collect.
// It is replaced as a whole, so nobody reads half of it.
class tMetricsFile
{
public:
    explicit tMetricsFile(const std::string& file) : path(file) {} // "": none is written

    // Throws std::runtime_error if it cannot be written.
    void write(const std::vector<tMetric>& metrics) const;

private:
    std::string path;
};
