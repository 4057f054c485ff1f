// Any bytes as a stream of calls on one servo, with a host that answers and refuses as the bytes
// say. Each call does what the plain servo does: the same operations on the clock, in the same
// order with the same arguments, the same ratios to the last bit, the same states entered, the same
// code, the same text given out.
//
// Most pairs are a customary interval apart and a little noise off, so that the loop does lock.

#include "dravik/tServo.h"
#include "plainServo.h"
#include "support/hostParts.h"
#include "support/systemLog.h"
#include "tBytes.h"
#include "tDrawnDocument.h"
#include "tExactStatus.h"

#include <cmath>
#include <cstdio>
#include <new>
#include <optional>

namespace {

tScriptedHost* asked = nullptr; // the operations carry no context

// A refusal with one of these codes is thrown, which comes to the same code.
void answer(int32_t code, zverr_Status* status)
{
    if (code == zvplaterr_memoryFull) throw std::bad_alloc();
    if (code == zvplaterr_softwareFaultPLATInternalUseOnly) throw code;
    status->code = code;
}

zvckmservo_HostTable tableOfOperations()
{
    return hostTable(
        [](uint64_t* timeNs, zverr_Status* status) { answer(asked->getTime(*timeNs), status); },
        [](int64_t deltaNs, zverr_Status* status) { answer(asked->stepTime(deltaNs), status); },
        [](int32_t* offsetPpb, zverr_Status* status) {
            answer(asked->getFrequency(*offsetPpb), status);
        },
        [](int32_t offsetPpb, zverr_Status* status) {
            answer(asked->setFrequency(offsetPpb), status);
        },
        [](zverr_Status* status) {
            int32_t ppb = 0;
            answer(asked->getMaxFrequencyOffset(ppb), status);
            return ppb;
        },
        [](zverr_Status* status) {
            int32_t ppb = 0;
            answer(asked->getMinFrequencyOffset(ppb), status);
            return ppb;
        });
}

// The product, telling the ratios that it sets and the states that it enters.
struct tWatchedServo : zvckmDravik::tServo {
    using tServo::tServo;

protected:
    void setFrequency(double ratio) override
    {
        asked->noteRatio(ratio);
        tServo::setFrequency(ratio);
    }
    void setState(zvckmDravik::tServoStateId id) override
    {
        asked->noteState(id);
        tServo::setState(id);
    }
};

// The default files that the system log tells as missing, as the plain servo tells them.
std::string missedFiles()
{
    std::string names;
    for (const std::string& line : takeSystemLog()) {
        REQUIRE(line.find("Unable to read configuration from: ") != std::string::npos);
        const size_t name = line.rfind('/') + 1;
        names += ", " + line.substr(name, line.find('\n', name) - name);
    }
    return names;
}

class tCallStream
{
public:
    tCallStream(const uint8_t* data, size_t size) : bytes(data, size), table(tableOfOperations())
    {
        asked = &host;
    }
    tCallStream(const tCallStream&) = delete;
    tCallStream& operator=(const tCallStream&) = delete;
    ~tCallStream() { zvckmservo_finalize(&table); }

    void run()
    {
        const int opening = bytes.byte() % 8;
        initialize();
        if (opening == 1) write();
        if (opening > 1) turnFilterOn(opening > 5 ? 10.0 : 1e-6);
        if (opening > 0) lockIn();
        while (!bytes.empty())
            next();
    }

private:
    // The call in question on the product, then on the plain servo. Both give what the call gives
    // out as text, the second by its argument, and the second gives its code.
    template <typename Product, typename Plain>
    void compare(const std::string& call, Product onProduct, Plain onPlain)
    {
        tExactStatus status;
        status.code = entryCode;
        const std::string given = onProduct(&status);
        const std::string got = outcome(status.code, given, host.calls + missedFiles());

        std::string expectedGiven;
        int32_t code = entryCode;
        if (entryCode >= 0) {
            const int32_t failure = onPlain(expectedGiven);
            if (failure < 0) code = failure;
        }
        const std::string expected = outcome(code, expectedGiven, plainHost.calls + plain->log);
        if (got != expected) {
            (void)std::fprintf(stderr, "call %u: %s\nexpected %s\ngot      %s\n", callNumber,
                               call.c_str(), expected.c_str(), got.c_str());
        }
        REQUIRE(got == expected);
        endCall();
    }

    static std::string outcome(int32_t code, const std::string& given, const std::string& effects)
    {
        return "code " + std::to_string(code) + effects + (given.empty() ? "" : ", gave " + given);
    }

    // Refusal and code on entry are for one call.
    void endCall()
    {
        ++callNumber;
        entryCode = 0;
        host.refused = plainHost.refused = 0;
        host.calls.clear();
        plainHost.calls.clear();
        plain->log.clear();
    }

    // One to a call, but for what only sets the scene of the next.
    void next()
    {
        const int kind = bytes.byte() % 32;
        if (table.servoHandle == nullptr && kind < 27) {
            initialize();
        } else if (kind < 14) {
            near();
        } else if (kind < 17) {
            edge();
        } else if (kind == 17) {
            pair(reference, clock);
        } else if (kind == 18) {
            pair(extreme(), extreme());
        } else if (kind < 21) {
            write();
        } else if (kind < 23) {
            read();
        } else if (kind == 23) {
            applyMetaData();
        } else if (kind == 24) {
            getTime();
        } else if (kind == 25) {
            clearHistory();
        } else if (kind == 26) {
            writeOdd();
        } else if (kind == 27) {
            finalize();
        } else if (kind == 28) {
            REQUIRE(zvckmservo_isSeeded(&table) == 0 && host.calls.empty());
        } else if (kind == 29) {
            moveClock();
        } else if (kind == 30) {
            refuse();
        } else {
            static const int32_t kCodes[] = {7, -9, 1, INT32_MIN};
            entryCode = bytes.oneOf(kCodes);
        }
    }

    void initialize()
    {
        static const int32_t kLimits[][2] = {
            {500000, -500000}, {100000, -100000}, {INT32_MAX, INT32_MIN},
            {0, -500000},      {500000, 0},       {INT32_MAX, INT32_MIN},
            {-100, 100},       {2000, -1000},
        };
        const auto& limits = bytes.oneOf(kLimits);
        host.maxPpb = plainHost.maxPpb = limits[0];
        host.minPpb = plainHost.minPpb = limits[1];
        plain.emplace(plainHost);
        compare(
            "initialize", // gives whether there is a servo
            [this](zverr_Status* status) {
                zvckmservo_initialize(&table, status);
                if (status->code >= 0) watch();
                return std::string(table.servoHandle != nullptr ? "a servo" : "");
            },
            [this](std::string& given) {
                const int32_t code = plainInitialize(*plain);
                if (code >= 0) given = "a servo";
                return code;
            });
    }

    // Puts one that can be watched in the place of the servo just made.
    void watch()
    {
        const std::string calls = host.calls;
        zvckmservo_finalize(&table);
        table.servoHandle = static_cast<zvckmDravik::tServo*>(new tWatchedServo(&table));
        host.calls = calls;
    }

    void finalize()
    {
        zvckmservo_finalize(&table);
        REQUIRE(table.servoHandle == nullptr && host.calls.empty());
        endCall();
    }

    void clearHistory()
    {
        compare(
            "clearHistory",
            [this](zverr_Status* status) {
                zvckmservo_clearHistory(&table, status);
                return std::string();
            },
            [this](std::string&) { return plainClearHistory(*plain); });
    }

    void pair(uint64_t referenceTime, uint64_t clockTime)
    {
        reference = referenceTime;
        clock = clockTime;
        compare(
            "adjustTime " + std::to_string(reference) + " " + std::to_string(clock),
            [this](zverr_Status* status) {
                zvckmservo_adjustTime(&table, reference, clock, status);
                return std::string();
            },
            [this](std::string&) { return plainAdjustTime(*plain, reference, clock); });
    }

    // A pair with the clock this far off, but for what it has been stepped.
    void pairAfter(int64_t intervalNs, int64_t errorNs)
    {
        const uint64_t referenceTime = reference + static_cast<uint64_t>(intervalNs);
        pair(referenceTime,
             referenceTime + clockOffset + host.steppedNs + static_cast<uint64_t>(errorNs));
    }

    // To phase lock and through its first pairs, but for what the limits or a document hinder.
    void lockIn()
    {
        for (const int64_t errorNs : {0, 0, 0, 20, 50, -10})
            pairAfter(1000000000, errorNs);
    }

    int64_t interval()
    {
        static const int64_t kIntervals[] = {1000000000, 125000000,   1000000000, 100000000,
                                             2500000000, 1000000000,  62500000,   1000000000,
                                             0,          -1000000000, 1,          125000000};
        return bytes.oneOf(kIntervals);
    }

    void near()
    {
        static const int64_t kScales[] = {1, 1, 3, 7, 1, 5, 10, 1000, 1, 2, 10000000, 1000000};
        const int64_t scale = bytes.oneOf(kScales);
        const int64_t intervalNs = interval();
        pairAfter(intervalNs, scale * static_cast<int8_t>(bytes.byte()));
    }

    // At the threshold to the nanosecond, or just beside it.
    void edge()
    {
        const auto threshold = std::llround(plain->parameter[kSnapTimeThreshold] * 1e9);
        const int64_t error = threshold - 1 + bytes.byte() % 3;
        const bool ahead = bytes.byte() % 2 == 0;
        const uint64_t referenceTime = reference + static_cast<uint64_t>(interval());
        pair(referenceTime, referenceTime + static_cast<uint64_t>(ahead ? error : -error));
    }

    uint64_t extreme()
    {
        const uint64_t times[] = {0, 1, INT64_MAX, 1ULL << 63U, UINT64_MAX, reference};
        const uint8_t choice = bytes.byte() % 8;
        return choice < 6 ? times[choice] : bytes.word();
    }

    void getTime()
    {
        host.timeNs = plainHost.timeNs = extreme();
        compare(
            "getTime",
            [this](zverr_Status* status) {
                const uint64_t untouched = ~host.timeNs;
                uint64_t time = untouched;
                zvckmservo_getTime(&table, &time, status);
                return time == untouched ? std::string() : std::to_string(time);
            },
            [this](std::string& given) {
                uint64_t time = 0;
                const int32_t code = plainGetTime(*plain, time);
                if (code >= 0) given = std::to_string(time);
                return code;
            });
    }

    void write()
    {
        const tDrawnDocument document(bytes);
        writeText(document.text.c_str(), [&] { return plainWrite(*plain, document.members); });
    }

    // Up to a threshold of seconds, where the ratio shows the last bit of the law.
    void turnFilterOn(double threshold)
    {
        const std::string text =
            R"({"spikeFilterEnabled": 1, "snapTimeThreshold": )" + std::to_string(threshold) + "}";
        const std::vector<tPlainMember> members = {{kFilterEnabled, true, 1.0},
                                                   {kSnapTimeThreshold, true, threshold}};
        writeText(text.c_str(), [&] { return plainWrite(*plain, members); });
    }

    // What is no document.
    void writeOdd()
    {
        struct tOdd {
            const char* text;
            int32_t code;
        };
        static const tOdd kOdd[] = {
            {nullptr, zvplaterr_softwareFaultPLATInternalUseOnly},
            {"", zvplaterr_invalidParameter},
            {"{\"phaseLockGain\": 3,", zvplaterr_invalidParameter},
            {"[\"phaseLockGain\", 3]", 0},
            {"{} \"phaseLockGain\": 3", 0},
        };
        const tOdd& odd = bytes.oneOf(kOdd);
        writeText(odd.text, [&] { return odd.code; });
    }

    template <typename Plain> void writeText(const char* text, Plain onPlain)
    {
        compare(
            std::string("writeServoConfigJson ") + (text != nullptr ? text : "null"),
            [&](zverr_Status* status) {
                const int result = zvckmservo_writeServoConfigJson(&table, text, status);
                REQUIRE(result == (status->code < 0 ? 1 : 0));
                return std::string();
            },
            [&](std::string&) { return onPlain(); });
    }

    void read()
    {
        const size_t size = size_t{4} * bytes.byte();
        compare(
            "readServoConfigJson " + std::to_string(size),
            [&](zverr_Status* status) {
                std::vector<char> buffer(size, '?');
                const int result =
                    zvckmservo_readServoConfigJson(&table, buffer.data(), size, status);
                REQUIRE(result == (status->code < 0 ? 1 : 0));
                const std::string text(buffer.begin(), buffer.end());
                return text.substr(0, text.find_last_not_of('?') + 1);
            },
            [&](std::string& given) {
                given = plainRead(*plain).substr(0, size);
                return 0;
            });
    }

    void applyMetaData()
    {
        struct tMetaData {
            const char* text; // null: does nothing
            int32_t code;
            const char* type;
        };
        static const tMetaData kMetaData[] = {
            {R"({"selectedTRInstID":"a","TRs":{"a":{"type":"IEEE 1588-2008 BC"}}})", 0,
             "IEEE 1588-2008 BC"},
            {R"({"selectedTRInstID":"a","TRs":{"b":1,"A":{"type":"IEEE 802.1AS-2011 TAB"}}})", 0,
             "IEEE 802.1AS-2011 TAB"},
            {R"({"selectedTRInstID":"a","TRs":{"a":{"type":"ieee 1588-2008 bc"}}})", 0,
             "ieee 1588-2008 bc"},
            {R"({"selectedTRInstID":"a","TRs":{"a":{"type":null}}})", 0, ""},
            {R"({"selectedTRInstID":"b","TRs":{"a":{"type":"IEEE 1588-2008 BC"}}})", 0, ""},
            {R"({"TRs":1})", 0, ""},
            {R"({"selectedTRInstID":"a","TRs":1})", jsonErrorsNotAnObject, ""},
            {R"({"selectedTRInstID":"a","TRs":{"a":{"type":1}}})", jsonErrorsTypeMismatch, ""},
            {R"({"selectedTRInstID":)", jsonErrorsInvalidJSON, ""},
            {nullptr, 0, ""},
        };
        const tMetaData& metaData = bytes.oneOf(kMetaData);
        compare(
            std::string("applyMetaData ") + (metaData.text != nullptr ? metaData.text : "null"),
            [&](zverr_Status* status) {
                zvckmservo_applyMetaData(&table, metaData.text, status);
                return std::string();
            },
            [&](std::string&) {
                if (metaData.text == nullptr || metaData.code < 0) return metaData.code;
                return plainApplyType(*plain, metaData.type);
            });
    }

    // Something else changes the clock's rate, or its time and the reference's.
    void moveClock()
    {
        static const int32_t kOffsets[] = {0,           1000,      -99999,   499999,
                                           -1000000000, INT32_MAX, INT32_MIN};
        if (bytes.byte() % 2 == 0) {
            host.offsetPpb = plainHost.offsetPpb = bytes.oneOf(kOffsets);
        } else {
            reference = extreme();
            clockOffset = bytes.word();
        }
    }

    // The first or second operation of the next call is refused, or gives a warning.
    void refuse()
    {
        static const int32_t kCodes[] = {-77,
                                         -1,
                                         5,
                                         INT32_MIN,
                                         zvplaterr_memoryFull,
                                         zvplaterr_softwareFaultPLATInternalUseOnly};
        host.refused = plainHost.refused = 1 + bytes.byte() % 2;
        host.code = plainHost.code = bytes.oneOf(kCodes);
    }

    tBytes bytes;
    tScriptedHost host;
    zvckmservo_HostTable table;
    tScriptedHost plainHost;
    std::optional<tPlainServo> plain;

    uint64_t reference = 1000000000000;
    uint64_t clock = 0;
    uint64_t clockOffset = 20000; // clock minus reference, before any step
    int32_t entryCode = 0;        // in the status of the next call
    unsigned callNumber = 1;
};

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    takeSystemLog(); // what loading may have written
    tCallStream(data, size).run();
    return 0;
}
