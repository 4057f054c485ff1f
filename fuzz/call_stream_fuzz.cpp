// A stream of exported calls on a clock that fails now and then, compared call by call with the
// plain servo: what the clock was told, what the caller was told, and the document in force.

#include "plainServo.h"
#include "require.h"
#include "tExactStatus.h"
#include "zvckmservo/servo.h"

#include <algorithm>
#include <fuzzer/FuzzedDataProvider.h>
#include <optional>

namespace {

tScriptedClock* real = nullptr; // the operations carry no context

// One operation of the real clock: its result, or its failure by way of the status.
template <class Operation> void operate(zverr_Status* status, const Operation& operation)
{
    try {
        operation();
        status->code = 5; // of no consequence
    } catch (int32_t failure) {
        status->code = failure;
    }
}

int32_t highest(zverr_Status* status)
{
    int32_t ppb = 0;
    operate(status, [&] { ppb = real->getMaxFrequencyOffset(); });
    return ppb;
}

int32_t lowest(zverr_Status* status)
{
    int32_t ppb = 0;
    operate(status, [&] { ppb = real->getMinFrequencyOffset(); });
    return ppb;
}

zvckmservo_HostTable hostTable()
{
    zvckmservo_HostTable table{};
    table.getTime = [](uint64_t* timeNs, zverr_Status* status) {
        operate(status, [&] { *timeNs = real->getTime(); });
    };
    table.stepTime = [](int64_t deltaNs, zverr_Status* status) {
        operate(status, [&] { real->stepTime(deltaNs); });
    };
    table.getFrequency = [](int32_t* ppb, zverr_Status* status) {
        operate(status, [&] { *ppb = real->getFrequency(); });
    };
    table.setFrequency = [](int32_t ppb, zverr_Status* status) {
        operate(status, [&] { real->setFrequency(ppb); });
    };
    table.getMaxFrequencyOffset = highest;
    table.getMinFrequencyOffset = lowest;
    return table;
}

// What a document may say of a key, and the number that it is; without one it is no number.
struct tValue {
    const char* text;
    std::optional<double> number;
};
const tValue kValues[] = {
    {"1", 1},
    {"0.55", 0.55},
    {"2", 2},
    {"3", 3},
    {"0", 0},
    {"-1", -1},
    {"1e-6", 1e-6},
    {"2.5e-8", 2.5e-8},
    {"0.1", 0.1},
    {"1e-8", 1e-8},
    {"9e-9", 9e-9},
    {"1e-9", 1e-9},
    {"10", 10},
    {"10.5", 10.5},
    {"-10", -10},
    {"-10.5", -10.5},
    {"100", 100},
    {"100.9", 100.9},
    {"101", 101},
    {"1.9", 1.9},
    {"1.001", 1.001},
    {"1.0000001", 1.0000001},
    {"5e-7", 5e-7},
    {"1e-5", 1e-5},
    {"0.3", 0.3},
    {"4294967298", 4294967298.0},
    {"1e999", HUGE_VAL},
    {"true", {}},
    {"\"1\"", {}},
    {"null", {}},
    {"[1]", {}},
};

// The two servos, each with its clock, and what comes after a call.
class tComparison
{
public:
    explicit tComparison(FuzzedDataProvider& bytes) : bytes(bytes) {}
    tComparison(const tComparison&) = delete;
    tComparison& operator=(const tComparison&) = delete;
    ~tComparison() { zvckmservo_finalize(&table); }

    void run()
    {
        initialize();
        if (bytes.ConsumeBool()) write({kSpikeFilterOn});
        while (bytes.remaining_bytes() > 0) {
            call(bytes.ConsumeIntegral<uint8_t>());
        }
    }

private:
    struct tMember {
        size_t key;
        tValue value;
    };
    static constexpr tMember kSpikeFilterOn = {tPlainServo::kFilter, {"1", 1}};

    void call(uint8_t choice)
    {
        if (choice < 200) return pair(choice);
        if (choice < 205) return extremePair();
        if (choice < 225) return write(someMembers());
        if (choice < 230) return startOver();
        if (choice < 235) return readTime();
        if (choice < 240) return metaData();
        if (choice < 245) return settled(choice);
        if (choice < 250) return willFail(choice - 244);
        anotherServo();
    }

    // Runs the call on both and compares.
    template <class Real, class Plain> void both(const Real& callReal, const Plain& callPlain)
    {
        real = &realClock;
        tExactStatus status;
        callReal(&status);
        int32_t expected = 0;
        try {
            callPlain();
        } catch (int32_t failure) {
            expected = failure;
        }
        REQUIRE(status.code == expected);
        REQUIRE(realClock.notes == plainClock.notes);
        REQUIRE(realClock.offsetPpb == plainClock.offsetPpb);
        for (tScriptedClock* const clock : {&realClock, &plainClock}) {
            clock->notes.clear();
            clock->untilFailure = 0;
        }
    }

    void initialize()
    {
        zvckmservo_finalize(&table);
        REQUIRE(table.servoHandle == nullptr);
        plain.reset();
        both([&](zverr_Status* status) { zvckmservo_initialize(&table, status); },
             [&] { plain.emplace(plainClock); });
        REQUIRE((table.servoHandle != nullptr) == plain.has_value());
    }

    // Another servo, on a clock with other limits, at a second try if the clock fails at the first.
    void anotherServo()
    {
        static constexpr int32_t kLimits[] = {500000, 0, 100, -100, INT32_MAX, INT32_MIN};
        const int32_t limit = kLimits[bytes.ConsumeIntegralInRange<size_t>(0, 5)];
        realClock.maxPpb = plainClock.maxPpb = limit;
        realClock.untilFailure = plainClock.untilFailure = bytes.ConsumeIntegralInRange(0, 3);
        initialize();
        if (!plain) initialize();
    }

    void pair(uint8_t noise)
    {
        reference += intervalNs;
        const double passed =
            static_cast<double>(intervalNs) * 1e-9 * (drift + plainClock.offsetPpb);
        aheadNs += static_cast<uint64_t>(static_cast<int64_t>(std::clamp(passed, -1e18, 1e18)));
        adjust(reference, reference + aheadNs + static_cast<uint64_t>((noise - 100) * noiseNs));
    }

    void extremePair()
    {
        const auto first = bytes.ConsumeIntegral<uint64_t>();
        adjust(first, bytes.ConsumeBool() ? first : bytes.ConsumeIntegral<uint64_t>());
    }

    void adjust(uint64_t referenceNs, uint64_t localNs)
    {
        both([&](zverr_Status* s) { zvckmservo_adjustTime(&table, referenceNs, localNs, s); },
             [&] {
                 const bool stepping = plain->state == tPlainServo::kSnapTime;
                 plain->pair(referenceNs, localNs);
                 if (stepping) aheadNs = 0;
             });
    }

    std::vector<tMember> someMembers()
    {
        std::vector<tMember> members;
        for (int n = bytes.ConsumeIntegralInRange(1, 4); n > 0; --n) {
            members.push_back(
                {bytes.ConsumeIntegralInRange<size_t>(0, 10),
                 kValues[bytes.ConsumeIntegralInRange<size_t>(0, std::size(kValues) - 1)]});
        }
        return members;
    }

    void write(const std::vector<tMember>& members)
    {
        std::string document = "{";
        for (const tMember& member : members) {
            document += document.size() > 1 ? ",\"" : "\"";
            document += tPlainServo::kBounds[member.key].key;
            document += std::string("\":") + member.value.text;
        }
        document += "}";
        both([&](zverr_Status* s) { zvckmservo_writeServoConfigJson(&table, document.c_str(), s); },
             [&] { apply(members); });
        read();
    }

    // In the order of the keys; the first of a key counts.
    void apply(const std::vector<tMember>& members)
    {
        for (size_t key = 0; key < plain->values.size(); ++key) {
            const auto member = std::find_if(members.begin(), members.end(),
                                             [&](const tMember& m) { return m.key == key; });
            if (member == members.end()) continue;
            const std::optional<double> number = member->value.number;
            if (!number || !plain->set(key, *number)) throw int32_t{-52005};
        }
    }

    void read()
    {
        std::string text(1024, '\0');
        both(
            [&](zverr_Status* s) {
                REQUIRE(zvckmservo_readServoConfigJson(&table, text.data(), text.size(), s) == 0);
            },
            [] {});
        text.resize(text.find('\0'));
        REQUIRE(text == plain->document());
    }

    void startOver()
    {
        both([&](zverr_Status* s) { zvckmservo_clearHistory(&table, s); },
             [&] { plain->startOver(); });
    }

    void readTime()
    {
        realClock.timeNs = plainClock.timeNs = reference;
        uint64_t found = 7;
        uint64_t expected = 7;
        both([&](zverr_Status* s) { zvckmservo_getTime(&table, &found, s); },
             [&] { expected = plainClock.getTime(); });
        REQUIRE(found == expected);
    }

    void metaData()
    {
        const bool good = bytes.ConsumeBool();
        const char* const text =
            good ? R"({"selectedTRInstID":"a","TRs":{"a":{"type":"other"}}})" : "{";
        both([&](zverr_Status* s) { zvckmservo_applyMetaData(&table, text, s); },
             [&] {
                 if (!good) throw int32_t{-52005};
             });
    }

    // The pairs to come.
    void settled(uint8_t choice)
    {
        static constexpr uint64_t kIntervals[] = {1000000000, 125000000, 1, 0, UINT64_MAX};
        intervalNs = kIntervals[choice - 240];
        noiseNs = bytes.ConsumeIntegralInRange(0, 20);
        drift = bytes.ConsumeIntegralInRange(-600000, 600000);
    }

    void willFail(int operation)
    {
        realClock.untilFailure = plainClock.untilFailure = operation;
        realClock.failure = plainClock.failure = bytes.ConsumeBool() ? -77 : INT32_MIN;
        pair(100);
    }

    FuzzedDataProvider& bytes;
    tScriptedClock realClock, plainClock;
    zvckmservo_HostTable table = hostTable();
    std::optional<tPlainServo> plain;
    uint64_t reference = 1700000000000000000U;
    uint64_t intervalNs = 1000000000;
    uint64_t aheadNs = 5000000; // modulo 2^64, as timestamps are
    int noiseNs = 2;
    double drift = 12000; // parts per billion
};

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    FuzzedDataProvider bytes(data, size);
    tComparison(bytes).run();
    return 0;
}
