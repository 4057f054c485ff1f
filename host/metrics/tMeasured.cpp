#include "metrics/tMeasured.h"

#include "maths/median.h"
#include "text/quantity.h"

#include <algorithm>
#include <cmath>
#include <numeric>
#include <stdexcept>

namespace dravikHost {

namespace {

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

bool isLocked(const tRecordedSummary& /*summary*/) { return false; }

template <typename Measurement>
std::vector<const Measurement*> select(const std::vector<Measurement>& all,
                                       const tSelection& selection)
{
    const auto locked =
        std::find_if(all.begin(), all.end(), [](const Measurement& one) { return isLocked(one); });
    const int64_t lockNs = locked == all.end() ? 0 : locked->elapsedNs;
    const int64_t fromNs = selection.fromNs.value_or(lockNs);
    std::vector<const Measurement*> selected;
    for (const Measurement& one : all) {
        if (one.elapsedNs < fromNs) continue;
        if (selection.toNs && one.elapsedNs > *selection.toNs) break;
        selected.push_back(&one);
    }
    return selected;
}

// Across a new stretch there is none. 0: no spacing at all.
template <typename Measurement>
int64_t medianSpacingNs(const std::vector<const Measurement*>& selected)
{
    std::vector<int64_t> spacings;
    spacings.reserve(selected.size());
    for (size_t i = 1; i < selected.size(); ++i) {
        if (selected[i]->beginsStretch) continue;
        spacings.push_back(selected[i]->elapsedNs - selected[i - 1]->elapsedNs);
    }
    return spacings.empty() ? 0 : median(std::move(spacings));
}

// Moments are rounded in logs, so half of the spacing more or less is still the same one.
template <typename Measurement>
tSeries longestStretch(const std::vector<const Measurement*>& pairs,
                       const std::vector<double>& errors)
{
    const int64_t spacingNs = medianSpacingNs(pairs);
    if (spacingNs == 0) return {};
    size_t start = 0;
    size_t bestStart = 0;
    size_t bestEnd = 0;
    for (size_t i = 1; i <= pairs.size(); ++i) {
        const bool goes =
            i < pairs.size() && !pairs[i]->beginsStretch &&
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

void requireSome(size_t count, const tRecording& recording)
{
    if (count == 0) throw std::runtime_error(recording.name + " has no measurement in that time");
}

tMeasured measureSummaries(const tRecording& recording, const tSelection& selection)
{
    const auto summaries = select(recording.summaries, selection);
    requireSome(summaries.size(), recording);
    tMeasured measured;
    measured.what = "summaries of measured errors";
    measured.fromSeconds = secondsOf(summaries.front()->elapsedNs);
    measured.toSeconds = secondsOf(summaries.back()->elapsedNs);
    for (const tRecordedSummary* const summary : summaries) {
        measured.errors.push_back(secondsOf(summary->rmsNs));
        measured.greatest.push_back(secondsOf(summary->greatestNs));
        measured.times.push_back(secondsOf(summary->elapsedNs));
    }
    measured.series = longestStretch(summaries, measured.errors);
    measured.series.phase.clear(); // an RMS is no phase
    return measured;
}

} // namespace

tMeasured measure(const tRecording& recording, const tSelection& selection)
{
    if (recording.pairs.empty()) return measureSummaries(recording, selection);
    const auto pairs = select(recording.pairs, selection);
    requireSome(pairs.size(), recording);
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

void tMeasured::removeSlope()
{
    if (!greatest.empty()) throw std::runtime_error("summaries have no slope");
    if (errors.size() < 2) throw std::runtime_error("one measurement has no slope");
    const double first = errors.front();
    const double slope = (errors.back() - first) / (times.back() - times.front());
    for (size_t i = 0; i < errors.size(); ++i)
        errors[i] -= first + slope * (times[i] - times.front());
    series = withoutSlope(series);
}

std::optional<double> tMeasured::mean() const
{
    if (!greatest.empty()) return std::nullopt;
    return std::accumulate(errors.begin(), errors.end(), 0.0) / static_cast<double>(errors.size());
}

// Of summaries, too: each stands for as many measurements, so their squares are averaged.
double tMeasured::rms() const
{
    const double squares = std::inner_product(errors.begin(), errors.end(), errors.begin(), 0.0);
    return std::sqrt(squares / static_cast<double>(errors.size()));
}

double tMeasured::peak() const
{
    const auto& values = greatest.empty() ? errors : greatest;
    const auto extremes = std::minmax_element(values.begin(), values.end());
    return std::max(-*extremes.first, *extremes.second);
}

std::optional<double> tMeasured::peakToPeak() const
{
    if (!greatest.empty()) return std::nullopt;
    const auto extremes = std::minmax_element(errors.begin(), errors.end());
    return *extremes.second - *extremes.first;
}

} // namespace dravikHost
