/* The eleven parameters of the servo, as a table: what a configuration document may hold, in the
 * order in which it is applied and given out. A host that checks, edits or explains documents can
 * take keys, bounds and defaults from here; the plug-in does. Data only: nothing to link. Needs C11
 * or C++11. */
#ifndef ZVCKMSERVO_PARAMETERS_H
#define ZVCKMSERVO_PARAMETERS_H

#include <assert.h>
#include <stdint.h>

/* One line for each parameter, for whoever has to write code for each of them:
 *
 *     PARAMETER(key, Key, Kind, line, lowest, highest, initial, unit, meaning)
 *
 * The columns are explained at zvckmservo_Parameter. `Key` is the key again, to make names of. */
#define ZVCKMSERVO_PARAMETERS(PARAMETER)                                                           \
    PARAMETER(frequencyLockGain, FrequencyLockGain, Double, 77, 1e-9, 10, 1, "",                   \
              "factor on the measured rate; leave it at 1")                                        \
    PARAMETER(phaseLockGain, PhaseLockGain, Double, 98, 1e-9, 10, 0.55, "",                        \
              "g, the gain of the control law")                                                    \
    PARAMETER(phaseLockCoefficientA, PhaseLockCoefficientA, Double, 119, -10, 10, 2, "",           \
              "A, the weight of this pair's error")                                                \
    PARAMETER(phaseLockCoefficientB, PhaseLockCoefficientB, Double, 140, -10, 10, 1, "",           \
              "B, the weight of the last pair's error, subtracted")                                \
    PARAMETER(phaseLockCoefficientC, PhaseLockCoefficientC, Double, 161, -10, 10, 1, "",           \
              "C, the weight of the frequency offset in force")                                    \
    PARAMETER(snapTimeThreshold, SnapTimeThreshold, Double, 182, 1e-8, 10, 1e-6, "s",              \
              "an error as large is stepped, and ends a lock")                                     \
    PARAMETER(spikeFilterEnabled, SpikeFilterEnabled, Bool, 0, 0, 1, 0, "",                        \
              "1 turns the spike filter on")                                                       \
    PARAMETER(spikeFilterHistorySize, SpikeFilterHistorySize, Integer, 235, 2, 100, 5, "pairs",    \
              "how far the spike filter looks back")                                               \
    PARAMETER(spikeFilterMaxThreshold, SpikeFilterMaxThreshold, Double, 256, 1e-9, 10, 1, "s/s",   \
              "highest limit on how fast the error moves")                                         \
    PARAMETER(spikeFilterMinThreshold, SpikeFilterMinThreshold, Double, 277, 1e-9, 10, 2.5e-8,     \
              "s/s", "lowest limit on how fast the error moves")                                   \
    PARAMETER(spikeFilterGrowthFactor, SpikeFilterGrowthFactor, Double, 298, 1.001, 100, 3, "",    \
              "that limit, over the mean rate of the past")

/* The place of a parameter in the table: zvckmservo_kPhaseLockGain and so on. */
typedef enum zvckmservo_ParameterIndex {
#define ZVCKMSERVO_INDEX(key, Key, Kind, line, lowest, highest, initial, unit, meaning)            \
    zvckmservo_k##Key,
    ZVCKMSERVO_PARAMETERS(ZVCKMSERVO_INDEX)
#undef ZVCKMSERVO_INDEX
        zvckmservo_kParameterCount
} zvckmservo_ParameterIndex;

/* How the number in a document is taken. */
typedef enum zvckmservo_ParameterKind {
    zvckmservo_kDouble,
    zvckmservo_kInteger, /* cut toward zero, then compared with the bounds */
    zvckmservo_kBool     /* cut toward zero: 1 is on, anything else off, and none is refused */
} zvckmservo_ParameterKind;

typedef struct zvckmservo_Parameter {
    const char* key;
    zvckmservo_ParameterKind kind;

    /* "line" in the payload of a value that is refused for its bounds, with "file"
     * "dravik/tServo"; 0 for the flag. */
    uint32_t line;

    double lowest, highest; /* allowed themselves */
    double initial;         /* in a new servo */
    const char* unit;       /* "" for a plain number */
    const char* meaning;    /* half a sentence in English */

    /* The numbers as they are best read, as "1e-9 to 10" and "0.55"; no unit. */
    const char* boundsText;
    const char* initialText;
} zvckmservo_Parameter;

#ifdef __cplusplus
#define ZVCKMSERVO_CONSTANT static constexpr
#else
#define ZVCKMSERVO_CONSTANT static const
#endif

ZVCKMSERVO_CONSTANT zvckmservo_Parameter zvckmservo_parameters[] = {
#define ZVCKMSERVO_ROW(key, Key, Kind, line, lowest, highest, initial, unit, meaning)              \
    {#key,    zvckmservo_k##Kind,      line,    lowest, highest, initial, unit,                    \
     meaning, #lowest " to " #highest, #initial},
    ZVCKMSERVO_PARAMETERS(ZVCKMSERVO_ROW)
#undef ZVCKMSERVO_ROW
};

#undef ZVCKMSERVO_CONSTANT

static_assert(zvckmservo_kParameterCount == 11, "eleven parameters");
static_assert(sizeof(zvckmservo_parameters) == 11 * sizeof(zvckmservo_Parameter), "a row for each");

#endif
