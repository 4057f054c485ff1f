#include "support/tFakeHost.h"

#include "support/hostParts.h"

#include <gtest/gtest.h>
#include <utility>

namespace {

tFakeHost* current = nullptr; // the operations carry no context

} // namespace

struct tFakeOperations {
    static void getTime(uint64_t* timeNs, zverr_Status* status)
    {
        EXPECT_EQ(0U, *timeNs);
        *timeNs = current->timeNs;
        current->answer("getTime", "time", status);
    }
    static void stepTime(int64_t deltaNs, zverr_Status* status)
    {
        current->answer("stepTime", "step " + std::to_string(deltaNs), status);
    }
    static void getFrequency(int32_t* offsetPpb, zverr_Status* status)
    {
        EXPECT_EQ(0, *offsetPpb);
        *offsetPpb = current->offsetPpb;
        current->answer("getFrequency", "get", status);
    }
    static void setFrequency(int32_t offsetPpb, zverr_Status* status)
    {
        current->offsetPpb = offsetPpb;
        current->answer("setFrequency", "set " + std::to_string(offsetPpb), status);
    }
    static int32_t getMaxFrequencyOffset(zverr_Status* status)
    {
        current->answer("getMaxFrequencyOffset", "max", status);
        return current->maxPpb;
    }
    static int32_t getMinFrequencyOffset(zverr_Status* status)
    {
        current->answer("getMinFrequencyOffset", "min", status);
        return current->minPpb;
    }
};

tFakeHost::tFakeHost()
    : table(hostTable(tFakeOperations::getTime, tFakeOperations::stepTime,
                      tFakeOperations::getFrequency, tFakeOperations::setFrequency,
                      tFakeOperations::getMaxFrequencyOffset,
                      tFakeOperations::getMinFrequencyOffset))
{
    current = this;
}

tFakeHost::~tFakeHost()
{
    zvckmservo_finalize(&table);
    current = nullptr;
}

void tFakeHost::answer(const std::string& operation, const std::string& note,
                       zverr_Status* operationStatus)
{
    EXPECT_EQ(0, operationStatus->code) << "each operation has a fresh status";
    EXPECT_EQ(nullptr, operationStatus->json);
    calls += (calls.empty() ? "" : " ") + note;
    if (inOperation) inOperation(operation, operationStatus);
}

void tFakeHost::failIn(const std::string& failing)
{
    inOperation = [failing](const std::string& operation, zverr_Status* operationStatus) {
        operationStatus->code = operation == failing ? -77 : 5;
        const std::string text = R"({"clock":"broken"})";
        if (operationStatus->reallocJson(operationStatus, 64)) {
            text.copy(operationStatus->json, text.size());
        }
    };
}

void tFakeHost::initialize()
{
    status.reset();
    zvckmservo_initialize(&table, &status.record);
}

tOpenServo& tFakeHost::open()
{
    auto* const servo = new tOpenServo(&table);
    table.servoHandle = static_cast<zvckmDravik::tServo*>(servo);
    takeCalls();
    return *servo;
}

void tFakeHost::pair(uint64_t referenceTime, uint64_t clockTime)
{
    status.reset();
    zvckmservo_adjustTime(&table, referenceTime, clockTime, &status.record);
}

void tFakeHost::clearHistory()
{
    status.reset();
    zvckmservo_clearHistory(&table, &status.record);
}

std::string tFakeHost::takeCalls() { return std::exchange(calls, std::string()); }
