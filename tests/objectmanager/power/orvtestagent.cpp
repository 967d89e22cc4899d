/* An agent without a machine: it logs the records that a test gives it, and keeps the user that it is told. */
#include "Norv/Machine.h"
#include "OrvLog/Observer.h"

#include <string>
#include <string_view>

namespace {

const OrvLog::Observer1* observer = nullptr;
std::string node = "blade1";
std::string principal;

} // namespace

void orvLogObserve1(const OrvLog::Observer1* given) {
    observer = given;
}

int orvInstrumentationMachine1() {
    return Norv::SIMULATED_MACHINE;
}

const char* orvInstrumentationPowerNode1() {
    return node.c_str();
}

void orvInstrumentationOnBehalfOf1(const char* whom) {
    principal = whom == nullptr ? "nobody" : whom;
}

/** Logs a record. */
extern "C" void TestAgent_say(int kind, const char* text) {
    constexpr std::string_view category = "Test.Agent";
    constexpr int level = 10000;
    const OrvLog::ObservedRecord1 record{
        kind, level, category.data(), category.size(), text, std::string_view(text).size()};
    if (observer != nullptr) {
        observer->record(observer->context, &record);
    }
}

int orvInstrumentationCancelRequest1() {
    TestAgent_say(OrvLog::POWER_REQUEST_REFUSED_RECORD, "nothing is under way");
    return 0;
}

/** The user on whose behalf the agent was last told to act. */
extern "C" const char* TestAgent_principal() {
    return principal.c_str();
}
