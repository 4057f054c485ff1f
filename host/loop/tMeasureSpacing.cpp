#include "loop/tMeasureSpacing.h"

bool tMeasureSpacing::holdsBack(int64_t elapsedNs) const
{
    return openedNs && elapsedNs - *openedNs < spacingNs;
}

// A pair that ended something else, a lock or an attempt, is spent: the next one opens.
void tMeasureSpacing::given(int64_t elapsedNs, tLockEvent event, bool measuring)
{
    if (measuring && event == kNothingNew && !openedNs) {
        openedNs = elapsedNs;
    } else if (!measuring || event != kNothingNew) {
        openedNs.reset();
    }
}
