#include "metrics/tMeasured.h"

#include "maths/median.h"
#include "text/files.h"
#include "text/quantity.h"
#include "text/words.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <numeric>
#include <stdexcept>

namespace dravikHost {

namespace {

using tPairs = std::vector<const tRecordedPair*>;

bool isLocked(const tRecordedPair& pair) { return pair.locked.value_or(false); }

void lookAtLocks(tMeasured& measured, const std::vector<tRecordedPair>& pairs)
{
    if (!pairs.back().locked) return;
    measured.locksLost = 0;
    for (size_t i = 0; i < pairs.size(); ++i) {
        if (isLocked(pairs[i]) && !measured.timeToLock)
            measured.timeToLock = secondsOf(pairs[i].elapsedNs);
        if (i > 0 && isLocked(pairs[i - 1]) && !isLocked(pairs[i])) ++*measured.locksLost;
    }
}

tPairs select(const std::vector<tRecordedPair>& pairs, const tSelection& selection)
{
    const auto locked = std::find_if(pairs.begin(), pairs.end(), isLocked);
    const int64_t lockNs = locked == pairs.end() ? 0 : locked->elapsedNs;
    const int64_t fromNs = selection.fromNs.value_or(lockNs);
    tPairs selected;
    for (const tRecordedPair& pair : pairs) {
        if (pair.elapsedNs < fromNs) continue;
        if (selection.toNs && pair.elapsedNs > *selection.toNs) break;
        selected.push_back(&pair);
    }
    return selected;
}

int64_t medianSpacingNs(const tPairs& pairs)
{
    std::vector<int64_t> spacings;
    spacings.reserve(pairs.size());
    for (size_t i = 1; i < pairs.size(); ++i)
        spacings.push_back(pairs[i]->elapsedNs - pairs[i - 1]->elapsedNs);
    return median(std::move(spacings));
}

// Moments are rounded in logs, so half of the spacing more or less is still the same one.
tSeries longestStretch(const tPairs& pairs, const std::vector<double>& errors)
{
    if (pairs.size() < 2) return {};
    const int64_t spacingNs = medianSpacingNs(pairs);
    size_t start = 0;
    size_t bestStart = 0;
    size_t bestEnd = 0;
    for (size_t i = 1; i <= pairs.size(); ++i) {
        const bool goes =
            i < pairs.size() &&
            std::llabs(pairs[i]->elapsedNs - pairs[i - 1]->elapsedNs - spacingNs) * 2 <= spacingNs;
        if (goes) continue;
        if (i - start > bestEnd - bestStart) {
            bestStart = start;
            bestEnd = i;
        }
        start = i;
    }
    const auto at = [&errors](size_t i) { return errors.begin() + static_cast<std::ptrdiff_t>(i); };
    const auto lengthNs =
        static_cast<double>(pairs[bestEnd - 1]->elapsedNs - pairs[bestStart]->elapsedNs);
    const double intervalNs = lengthNs / static_cast<double>(bestEnd - bestStart - 1);
    return {secondsOf(intervalNs), {at(bestStart), at(bestEnd)}};
}

} // namespace

tMeasured measure(const tRecording& recording, const tSelection& selection)
{
    const tPairs pairs = select(recording.pairs, selection);
    if (pairs.empty())
        throw std::runtime_error(recording.name + " has no measurement in that time");
    const bool allTrue = std::all_of(pairs.begin(), pairs.end(), [](const tRecordedPair* pair) {
        return pair->trueErrorNs.has_value();
    });
    const bool isTrue = !selection.measured && allTrue;
    tMeasured measured;
    measured.what = isTrue ? "true error" : "measured error";
    measured.fromSeconds = secondsOf(pairs.front()->elapsedNs);
    measured.toSeconds = secondsOf(pairs.back()->elapsedNs);
    measured.errors.reserve(pairs.size());
    measured.times.reserve(pairs.size());
    for (const tRecordedPair* const pair : pairs) {
        measured.errors.push_back(
            secondsOf(isTrue ? pair->trueErrorNs.value_or(0) : pair->errorNs));
        measured.times.push_back(secondsOf(pair->elapsedNs));
    }
    measured.series = longestStretch(pairs, measured.errors);
    lookAtLocks(measured, recording.pairs);
    return measured;
}

tMeasured readNumbers(const std::string& file, double interval, bool frequency)
{
    const std::string text = readText(file);
    std::string_view rest = text;
    tSeries series{interval, {}};
    for (int64_t number = 1; !rest.empty(); ++number) {
        std::string_view line = takeLine(rest);
        const std::string_view word = takeWord(line);
        if (word.empty() || word.front() == '#') continue;
        const auto value = numberIn<double>(word);
        if (!value || !std::isfinite(*value) || !takeWord(line).empty())
            throw std::runtime_error(fmt::format("{}: line {} is not one number", file, number));
        series.phase.push_back(*value);
    }
    if (series.phase.empty()) throw std::runtime_error(file + " has no number");
    tMeasured measured;
    measured.what = frequency ? "phase of the frequency" : "phase";
    measured.series = frequency ? phaseOf(series) : series;
    measured.errors = measured.series.phase;
    for (size_t i = 0; i < measured.errors.size(); ++i)
        measured.times.push_back(static_cast<double>(i) * interval);
    measured.toSeconds = static_cast<double>(measured.errors.size() - 1) * interval;
    return measured;
}

void tMeasured::removeSlope()
{
    if (errors.size() < 2) throw std::runtime_error("one measurement has no slope");
    const double first = errors.front();
    const double slope = (errors.back() - first) / (times.back() - times.front());
    for (size_t i = 0; i < errors.size(); ++i)
        errors[i] -= first + slope * (times[i] - times.front());
    series = withoutSlope(series);
}

double tMeasured::mean() const
{
    return std::accumulate(errors.begin(), errors.end(), 0.0) / static_cast<double>(errors.size());
}

double tMeasured::rms() const
{
    const double squares = std::inner_product(errors.begin(), errors.end(), errors.begin(), 0.0);
    return std::sqrt(squares / static_cast<double>(errors.size()));
}

double tMeasured::peak() const
{
    const auto extremes = std::minmax_element(errors.begin(), errors.end());
    return std::max(-*extremes.first, *extremes.second);
}

double tMeasured::peakToPeak() const
{
    const auto extremes = std::minmax_element(errors.begin(), errors.end());
    return *extremes.second - *extremes.first;
}

} // namespace dravikHost
