#include "traces/iTraceFormat.h"

#include "traces/lineShape.h"
#include "traces/moments.h"
#include "traces/tableRow.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cctype>
#include <cmath>
#include <stdexcept>

namespace dravikHost {

namespace {

// What counters and programs for stability write: time and time error in columns, or one column of
// phase or fractional frequency, evenly spaced. A header may name the columns with their units, or
// be lines of "Name: value", of which Tau, Type and Unit tell something. Without a unit it is
// seconds.
class tColumnsFormat : public iTraceFormat
{
public:
    explicit tColumnsFormat(const tReadOptions& options)
        : options(options), intervalNs(options.intervalNs), frequency(options.frequency)
    {}

    std::string name() const override
    {
        if (!oneColumn) return "columns of time and time error";
        return frequency ? "a column of fractional frequency" : "a column of phase";
    }
    tLine read(std::string_view line, tRecordingBuilder& builder) override;

private:
    bool readComment(std::string_view line);
    tLine readHeader(std::string_view line);
    void chooseColumns(const std::vector<tTitle>& titles);
    tLine readRow(const std::vector<std::string>& fields, char between, tRecordingBuilder& builder);
    tLine readNumber(double value, tRecordingBuilder& builder);
    double unitOfError(tRecordingBuilder& builder);
    std::optional<int64_t> momentOf(const std::string& field, char between);

    tReadOptions options;
    std::optional<double> intervalNs;
    bool frequency;
    tMoments moments;
    std::optional<char> separator; // of the header
    size_t fieldCount = 0;         // 0: no row or header yet
    size_t timeAt = 0;
    size_t errorAt = 1;
    bool oneColumn = false;
    bool hasRows = false;
    double timeUnitNs = 1e9;
    std::optional<double> errorUnitNs;
    std::string errorTitle = "the error";
    std::string strangeHeader; // in front of the rows, without an error
    size_t strangeTitles{};
    int64_t count = 0;
    double phaseNs = 0; // of a frequency
};

constexpr std::array kTimeNames = {"time",      "t",     "elapsed",  "elapsed_time",
                                   "timestamp", "epoch", "date",     "datetime",
                                   "utc",       "mjd",   "date_time"};
constexpr std::array kErrorNames = {
    "tie",          "te",          "time_error", "time_interval_error", "x",
    "phase",        "phase_error", "offset",     "clock_offset",        "time_offset",
    "phase_offset", "error",       "phase_data"};

template <size_t size>
bool isOneOf(const std::string& name, const std::array<const char*, size>& names)
{
    return std::find(names.begin(), names.end(), name) != names.end();
}

bool isComment(std::string_view line)
{
    return line.empty() || std::string_view("#%!*/;").find(line.front()) != std::string_view::npos;
}

std::string lowerCase(std::string text)
{
    std::transform(text.begin(), text.end(), text.begin(), [](unsigned char character) {
        return static_cast<char>(std::tolower(character));
    });
    return text;
}

// "Tau: 1.0", "# Tau = 1.0" or "TAU 1.0"; returns whether it is a name with a value.
bool tColumnsFormat::readComment(std::string_view line)
{
    const size_t start = line.find_first_not_of("#%!*/; \t");
    if (start == std::string_view::npos) return true;
    line.remove_prefix(start);
    const auto isNamed = [](unsigned char character) {
        return std::isalnum(character) != 0 || character == '_' || character == '(' ||
               character == ')';
    };
    const auto* const nameEnd = std::find_if_not(line.begin(), line.end(), isNamed);
    const auto end = static_cast<size_t>(nameEnd - line.begin());
    if (end == line.size() || std::isalpha(static_cast<unsigned char>(line[0])) == 0) return false;
    if (std::string_view(":= \t").find(line[end]) == std::string_view::npos) return false;
    const std::string name = lowerCase(std::string(line.substr(0, end)));
    const size_t valueAt = line.find_first_not_of(":= \t", end);
    const tWords words = wordsOf(valueAt == std::string_view::npos ? "" : line.substr(valueAt));
    const bool assigns =
        line.substr(end, valueAt - end).find_first_of(":=") != std::string_view::npos;
    const std::string value = words.empty() ? "" : std::string(words[0]);
    if (name == "tau" || name == "tau0") {
        const auto seconds = numberOf(value, kBlanks);
        if (!seconds || !(*seconds > 0)) return false;
        if (intervalNs && std::fabs(*intervalNs - *seconds * 1e9) > *intervalNs * 1e-6) {
            throw std::runtime_error(
                fmt::format("its Tau of {} s is not the interval given", value));
        }
        intervalNs = *seconds * 1e9;
        return true;
    }
    if (name == "type" && lowerCase(value).substr(0, 4) == "freq") frequency = true;
    if (name == "unit" || name == "units") {
        errorUnitNs = unitNsOf(value);
        if (!errorUnitNs) {
            throw std::runtime_error(
                fmt::format("its unit '{}' is none of time", printable(value)));
        }
    }
    return assigns;
}

tLine tColumnsFormat::read(std::string_view line, tRecordingBuilder& builder)
{
    const size_t start = line.find_first_not_of(" \t");
    line.remove_prefix(std::min(start, line.size()));
    if (isComment(line)) {
        if (!hasRows && !readComment(line)) (void)readHeader(line);
        return {tLine::kFrame, ""};
    }
    char between = separator.value_or(separatorOf(line));
    std::vector<std::string> fields = fieldsOf(line, between);
    if (fieldCount > 0 && fields.size() != fieldCount) { // not the separator of the header
        between = separatorOf(line);
        fields = fieldsOf(line, between);
    }
    const bool isData =
        fieldCount > 0
            ? fields.size() == fieldCount && numberOf(fields[oneColumn ? 0 : errorAt], between)
            : fields.size() <= 2 && numberOf(fields.back(), between) &&
                  (numberOf(fields[0], between) || moments.ofIso(fields[0]));
    if (!isData && fieldCount == 0)
        return readComment(line) ? tLine{tLine::kFrame, ""} : readHeader(line);
    if (!strangeHeader.empty() && strangeTitles == fields.size()) {
        throw std::runtime_error(
            fmt::format("its header, '{}', names no time error that is known", strangeHeader));
    }
    if (!isData && oneColumn)
        throw std::runtime_error(fmt::format("line {} is not one number", builder.lineNumber()));
    if (!isData) return tLine::unread(fields.size() < fieldCount ? "cut short" : "no numbers");
    return readRow(fields, between, builder);
}

// Titles of columns, if one of them is an error.
tLine tColumnsFormat::readHeader(std::string_view line)
{
    constexpr size_t kMostTitles = 50;

    const char between = separatorOf(line);
    std::vector<tTitle> titles;
    for (const std::string& title : titlesOf(line, between))
        titles.push_back(titleOf(title));
    const bool known = titles.size() <= kMostTitles &&
                       std::any_of(titles.begin(), titles.end(), [](const tTitle& title) {
                           return isOneOf(title.name, kErrorNames);
                       });
    const bool names = !isComment(line) || (!titles.empty() && isOneOf(titles[0].name, kTimeNames));
    if (!known && strangeHeader.empty() && names) {
        strangeHeader = printable(line);
        strangeTitles = titles.size();
    }
    if (!known) return tLine::foreign("in front of the first row");
    chooseColumns(titles);
    separator = between;
    fieldCount = titles.size();
    return {tLine::kFrame, ""};
}

// Throws std::runtime_error if they can mean several things.
void tColumnsFormat::chooseColumns(const std::vector<tTitle>& titles)
{
    std::optional<size_t> time;
    std::optional<size_t> error;
    for (size_t i = 0; i < titles.size(); ++i) {
        if (isOneOf(titles[i].name, kTimeNames) && !time) time = i;
        if (!isOneOf(titles[i].name, kErrorNames)) continue;
        if (error) {
            throw std::runtime_error(fmt::format("two columns may be the error: {} and {}",
                                                 titles[*error].name, titles[i].name));
        }
        error = i;
    }
    if (!time && titles.size() > 1) throw std::runtime_error("no column of its header is a time");
    oneColumn = titles.size() == 1;
    timeAt = time.value_or(0);
    errorAt = *error;
    errorTitle = fmt::format("the column '{}'", titles[errorAt].name);
    const auto unitOfTitle = [&titles](size_t i) {
        const auto unitNs = unitNsOf(titles[i].unit);
        if (!unitNs && !titles[i].unit.empty()) {
            throw std::runtime_error(fmt::format("the unit '{}' of its header is none of time",
                                                 printable(titles[i].unit)));
        }
        return unitNs;
    };
    errorUnitNs = unitOfTitle(errorAt);
    if (time && titles[timeAt].name == "mjd") {
        timeUnitNs = 86'400e9;
    } else if (time && titles[timeAt].unit != "utc") {
        timeUnitNs = unitOfTitle(timeAt).value_or(1e9);
    }
    if (!errorUnitNs && !options.unitNs && titles[errorAt].name.find("offset") != std::string::npos)
        throw std::runtime_error(errorTitle + " does not tell its unit; say it with --unit");
}

double tColumnsFormat::unitOfError(tRecordingBuilder& builder)
{
    if (!errorUnitNs || options.unitNs == errorUnitNs) builder.useUnit();
    return errorUnitNs ? *errorUnitNs : options.unitNs.value_or(1e9);
}

std::optional<int64_t> tColumnsFormat::momentOf(const std::string& field, char between)
{
    constexpr double kMostNs = 9e18;
    const auto number = numberOf(field, between);
    if (!number) return moments.ofIso(field);
    if (!(std::fabs(*number) * timeUnitNs < kMostNs)) return std::nullopt;
    if (timeUnitNs < 1) return std::llround(*number * timeUnitNs);
    const auto ns = exactNsOf(field, between, std::llround(timeUnitNs));
    return static_cast<int64_t>(ns->whole) + std::llround(ns->fraction);
}

tLine tColumnsFormat::readRow(const std::vector<std::string>& fields, char between,
                              tRecordingBuilder& builder)
{
    if (fieldCount == 0) oneColumn = fields.size() == 1;
    fieldCount = fields.size();
    if (oneColumn) return readNumber(*numberOf(fields[0], between), builder);
    if (intervalNs && !options.intervalNs)
        throw std::runtime_error("it has a Tau and more than one column");
    const bool first = !hasRows;
    const auto momentNs = momentOf(fields[timeAt], between);
    const double errorNs = *numberOf(fields[errorAt], between) * unitOfError(builder);
    if (!momentNs) return tLine::unread("no time in the column of the time");
    if (!(std::fabs(errorNs) < kMostErrorNs)) return tLine::unread("an error of years");

    if (first && !errorUnitNs && !options.unitNs) {
        builder.addNote(errorTitle +
                        " does not tell its unit, so it is seconds; --unit tells another");
    }
    hasRows = true;
    return tLine::added(builder.add("", pairOf(*momentNs, errorNs)));
}

tLine tColumnsFormat::readNumber(double value, tRecordingBuilder& builder)
{
    if (!intervalNs) return tLine::unread("no time, and no --interval");
    builder.useInterval();
    const auto moment = [this] { return std::llround(static_cast<double>(count++) * *intervalNs); };
    if (frequency && count == 0) (void)builder.add("", pairOf(moment(), 0));
    const double errorNs =
        frequency ? phaseNs += value * *intervalNs : value * unitOfError(builder);
    if (!(std::fabs(errorNs) < kMostErrorNs))
        throw std::runtime_error(fmt::format("line {} is an error of years", builder.lineNumber()));
    (void)builder.add("", pairOf(moment(), errorNs));
    hasRows = true;
    return {tLine::kMeasurement, ""};
}

} // namespace

void addColumnsFormat(std::vector<tMakeFormat>& formats)
{
    formats.emplace_back(
        [](const tReadOptions& options) { return std::make_unique<tColumnsFormat>(options); });
}

} // namespace dravikHost
