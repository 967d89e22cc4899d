/**
 * The method of TALVO_PowerManagementService, through the built library.
 */
#include "Expected.h"
#include "ProviderLibrary.h"
#include "RequestFixture.h"

#include <stdexcept>

namespace OrvTest {
namespace {

constexpr const char* operation = "PowerManagementService_InvokeMethod";

class RequestPowerStateChange : public RequestFixture {
protected:
    RequestPowerStateChange() { haveNodes({"a"}); }

    CMPIStatus invoke(const char* method = "RequestPowerStateChange") {
        return mi->ft->invokeMethod(mi, context, result, ref, method, in, nullptr);
    }

    void request(CMPIUint16 powerState) {
        broker.setArg(in, "PowerState", uint16Value(powerState));
        broker.setArg(in, "ManagedElement", referenceValue(element));
    }

    static std::string message(int level, const std::string& text) {
        return serviceSource.message(level, operation, text);
    }

    /** What precedes the arguments. */
    static Lines opened() {
        return lines(serviceSource.entry(operation), "ref.getClassName() -> ref.class",
                     Agent::instance().nodes.empty() ? failedDiscovery() : discovery());
    }

    /** The arguments up to and with the power state. */
    static Lines powerStateRead(const std::string& value) {
        return lines("in.getArg(TimeoutPeriod) -> not found", "in.getArg(Time) -> not found",
                     "in.getArg(PowerState) -> " + value);
    }

    static std::string powerStateShown(const std::string& value) {
        return serviceSource.variable(operation, "powerState", value);
    }

    /** The common exit. */
    static Lines answered() {
        return lines(serviceSource.exit(operation), "result.returnData(CMPI_uint32, 0)", "result.returnDone()");
    }

    const std::string acting = message(3000, "Entering try catch block to execute Shutdown/Reboot as requested");

    ProviderLibrary library;
    CMPIMethodMI* mi = library.methodMI("PowerManagementServiceProvider", broker);
    CMPIContext* context = broker.context("context");
    CMPIResult* result = broker.result("result");
    CMPIArgs* in = broker.args("in");
    CMPIObjectPath* element = broker.path("element", "root/cimv2", "TALVO_ComputerSystem");
};

void expectOk(const CMPIStatus& status) {
    EXPECT_EQ(status.rc, CMPI_RC_OK);
    EXPECT_EQ(status.msg, nullptr);
}

struct Change {
    const char* name;
    CMPIUint16 requested;
    const char* written;
    const char* failure;
};

void PrintTo(const Change& change, std::ostream* out) {
    *out << change.name;
}

class RequestPowerStateChanges : public RequestPowerStateChange, public testing::WithParamInterface<Change> {
protected:
    RequestPowerStateChanges() { request(GetParam().requested); }

    std::string requested = std::to_string(GetParam().requested);
    std::string written = std::string("instrumentation.setProperty(123, ") + GetParam().written + ") -> ";
};

INSTANTIATE_TEST_SUITE_P(Service, RequestPowerStateChanges,
                         testing::Values(Change{"Reboot", 5, "9", "setProperty() falied to Reboot"},
                                         Change{"Shutdown", 8, "12", "setProperty() falied to Shutdown"}),
                         [](const auto& tested) { return tested.param.name; });

TEST_P(RequestPowerStateChanges, WritesToTheNodeAndReturns0) {
    expectOk(invoke());
    EXPECT_CALLS(opened(), powerStateRead(requested), powerStateShown(requested),
                 "in.getArg(ManagedElement) -> element", "Instrumentation()", "instrumentation.selectNode(40) -> true",
                 acting, written + "true", "element.release()", "~Instrumentation()", answered());
}

TEST_P(RequestPowerStateChanges, ARefusedWriteIsLoggedAndReturns0) {
    agent.acceptsWrites = false;
    expectOk(invoke());
    EXPECT_CALLS(opened(), powerStateRead(requested), powerStateShown(requested),
                 "in.getArg(ManagedElement) -> element", "Instrumentation()", "instrumentation.selectNode(40) -> true",
                 acting, written + "false", message(3000, GetParam().failure), "element.release()",
                 "~Instrumentation()", answered());
}

TEST_P(RequestPowerStateChanges, TheWriteIsTriedWithoutANodeAndReturns0) {
    agent.nodes.clear();
    agent.acceptsWrites = false;
    expectOk(invoke());
    EXPECT_CALLS(opened(), powerStateRead(requested), powerStateShown(requested),
                 "in.getArg(ManagedElement) -> element", "Instrumentation()", "instrumentation.selectNode(40) -> false",
                 message(3000, "No Instrumentation node found. "), acting, written + "false",
                 message(3000, GetParam().failure), "element.release()", "~Instrumentation()", answered());
}

TEST_P(RequestPowerStateChanges, WithoutManagedElementNothingIsDoneAndTheBrokersStatusReturned) {
    in = broker.args("in");
    broker.setArg(in, "PowerState", uint16Value(GetParam().requested));
    EXPECT_EQ(invoke().rc, CMPI_RC_ERR_NOT_FOUND);
    EXPECT_CALLS(opened(), powerStateRead(requested), powerStateShown(requested),
                 "in.getArg(ManagedElement) -> not found", answered());
}

TEST_P(RequestPowerStateChanges, AManagedElementThatHoldsNothingIsNone) {
    element->hdl = nullptr;
    expectOk(invoke());
    EXPECT_CALLS(opened(), powerStateRead(requested), powerStateShown(requested),
                 "in.getArg(ManagedElement) -> element", answered());
}

TEST_P(RequestPowerStateChanges, AnExceptionOfTheWritePassesAndNothingIsLeft) {
    agent.faults.at("setProperty", 1, throws(std::runtime_error("the tree is gone")));
    EXPECT_THROW(invoke(), std::runtime_error);
    EXPECT_CALLS(opened(), powerStateRead(requested), powerStateShown(requested),
                 "in.getArg(ManagedElement) -> element", "Instrumentation()", "instrumentation.selectNode(40) -> true",
                 acting, std::string("instrumentation.setProperty(123, ") + GetParam().written + ") throws",
                 "~Instrumentation()");
    EXPECT_EQ(agent.messageBuffers, 0);
}

class UnsupportedPowerStates : public RequestPowerStateChange, public testing::WithParamInterface<CMPIUint16> {};

TEST_P(UnsupportedPowerStates, AreRefusedWithoutValueAndWithoutClosing) {
    request(GetParam());
    expectOk(invoke());
    const std::string value = std::to_string(GetParam());
    EXPECT_CALLS(opened(), powerStateRead(value), powerStateShown(value),
                 message(6000, "Requested Power State change Not Supported"));
}

INSTANTIATE_TEST_SUITE_P(Service, UnsupportedPowerStates, testing::Values(0, 1, 2, 3, 4, 6, 7, 9, 10, 12, 65535));

TEST_F(RequestPowerStateChange, AMissingPowerStateIsRefusedWithTheBrokersStatus) {
    EXPECT_EQ(invoke().rc, CMPI_RC_ERR_NOT_FOUND);
    EXPECT_CALLS(opened(), powerStateRead("not found"), powerStateShown("0"),
                 message(6000, "Requested Power State change Not Supported"));
}

TEST_F(RequestPowerStateChange, ThePowerStatesTypeAndNullStateAreNotLookedAt) {
    request(5);
    CMPIData data = uint16Value(8);
    data.type = CMPI_string;
    data.state = CMPI_nullValue;
    broker.setArg(in, "PowerState", data);
    expectOk(invoke());
    EXPECT_CALLS(opened(), powerStateRead("null"), powerStateShown("8"), "in.getArg(ManagedElement) -> element",
                 "Instrumentation()", "instrumentation.selectNode(40) -> true", acting,
                 "instrumentation.setProperty(123, 12) -> true", "element.release()", "~Instrumentation()", answered());
}

TEST_F(RequestPowerStateChange, ATimeoutPeriodIsRefusedBeforeAnythingElseIsRead) {
    request(5);
    broker.setArg(in, "TimeoutPeriod", dateTimeValue(broker.dateTime("period")));
    broker.setArg(in, "Time", dateTimeValue(broker.dateTime("time")));
    expectOk(invoke());
    EXPECT_CALLS(opened(), "in.getArg(TimeoutPeriod) -> period", "in.getArg(TimeoutPeriod) -> period",
                 message(6000, "Use Of Timeout Period Not Supported"));
}

TEST_F(RequestPowerStateChange, ATimeIsRefusedBeforeThePowerStateIsRead) {
    request(5);
    broker.setArg(in, "Time", dateTimeValue(broker.dateTime("time")));
    expectOk(invoke());
    EXPECT_CALLS(opened(), "in.getArg(TimeoutPeriod) -> not found", "in.getArg(Time) -> time",
                 "in.getArg(Time) -> time", message(6000, "Use Of Time Property Not Supported"));
}

TEST_F(RequestPowerStateChange, TimesThatHoldNothingAreNone) {
    request(8);
    CMPIDateTime* period = broker.dateTime("period");
    period->hdl = nullptr;
    CMPIDateTime* time = broker.dateTime("time");
    time->hdl = nullptr;
    broker.setArg(in, "TimeoutPeriod", dateTimeValue(period));
    broker.setArg(in, "Time", dateTimeValue(time));
    expectOk(invoke());
    EXPECT_CALLS(opened(), "in.getArg(TimeoutPeriod) -> period", "in.getArg(TimeoutPeriod) -> period",
                 "in.getArg(Time) -> time", "in.getArg(Time) -> time", "in.getArg(PowerState) -> 8",
                 powerStateShown("8"), "in.getArg(ManagedElement) -> element", "Instrumentation()",
                 "instrumentation.selectNode(40) -> true", acting, "instrumentation.setProperty(123, 12) -> true",
                 "element.release()", "~Instrumentation()", answered());
}

TEST_F(RequestPowerStateChange, ATimeOfAnotherTypeIsRefusedToo) {
    const CMPIData text = stringValue(broker.string("text", "20261120120000.000000+000"));
    for (const CMPIData& value : {text, uint16Value(60)}) {
        in = broker.args("in");
        request(5);
        broker.setArg(in, "TimeoutPeriod", value);
        transcript.clear();
        expectOk(invoke());
        EXPECT_EQ(transcript.calls().back(), message(6000, "Use Of Timeout Period Not Supported"));
        in = broker.args("in");
        request(5);
        broker.setArg(in, "Time", value);
        transcript.clear();
        expectOk(invoke());
        EXPECT_EQ(transcript.calls().back(), message(6000, "Use Of Time Property Not Supported"));
    }
}

TEST_F(RequestPowerStateChange, AnyObjectIsAManagedElement) {
    request(5);
    broker.setArg(in, "ManagedElement", stringValue(broker.string("name", "system")));
    expectOk(invoke());
    EXPECT_CALLS(opened(), powerStateRead("5"), powerStateShown("5"), "in.getArg(ManagedElement) -> \"system\"",
                 "Instrumentation()", "instrumentation.selectNode(40) -> true", acting,
                 "instrumentation.setProperty(123, 9) -> true", "name.release()", "~Instrumentation()", answered());
}

TEST_F(RequestPowerStateChange, ANumberIsNoManagedElement) {
    request(5);
    broker.setArg(in, "ManagedElement", uint16Value(1));
    expectOk(invoke());
    EXPECT_CALLS(opened(), powerStateRead("5"), powerStateShown("5"), "in.getArg(ManagedElement) -> 1", answered());
}

TEST_F(RequestPowerStateChange, NullTimesAreNone) {
    request(8);
    broker.setArg(in, "TimeoutPeriod", nullValue(CMPI_dateTime));
    broker.setArg(in, "Time", nullValue(CMPI_dateTime));
    expectOk(invoke());
    EXPECT_THAT(transcript.calls(), testing::Contains("instrumentation.setProperty(123, 12) -> true"));
}

TEST_F(RequestPowerStateChange, ARefusalReturnsTheStatusOfTheArgument) {
    request(5);
    const Fault fault = reports(CMPI_RC_ERR_TYPE_MISMATCH, broker.string("reason", "no"));
    broker.faults.at("getArg", 2, fault);
    broker.setArg(in, "TimeoutPeriod", dateTimeValue(broker.dateTime("period")));
    const CMPIStatus status = invoke();
    EXPECT_EQ(status.rc, CMPI_RC_ERR_TYPE_MISMATCH);
    EXPECT_EQ(status.msg, fault.message);
    EXPECT_TRUE(broker.returned(result).data.empty());
    EXPECT_EQ(broker.returned(result).closed, 0);
}

TEST_F(RequestPowerStateChange, TheStatusReturnedIsThatOfTheLastArgument) {
    request(5);
    broker.faults.at("getArg", 4, reports(CMPI_RC_ERR_ACCESS_DENIED));
    EXPECT_EQ(invoke().rc, CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_EQ(broker.returned(result).data.size(), 1);
}

TEST_F(RequestPowerStateChange, TheStatusesOfResultAndReleaseAreIgnored) {
    request(5);
    for (const char* slot : {"returnData", "returnDone", "release"}) {
        broker.faults.always(slot, reports(CMPI_RC_ERR_FAILED));
    }
    expectOk(invoke());
}

struct OtherRequest {
    const char* name;
    const char* className;
    const char* method;
};

void PrintTo(const OtherRequest& request, std::ostream* out) {
    *out << request.name;
}

class OtherRequests : public RequestPowerStateChange, public testing::WithParamInterface<OtherRequest> {};

TEST_P(OtherRequests, DoNothingAndReturn0) {
    request(5);
    ref = broker.path("ref", "root/cimv2", GetParam().className);
    expectOk(invoke(GetParam().method));
    EXPECT_CALLS(opened(), answered());
}

INSTANTIATE_TEST_SUITE_P(
    Service, OtherRequests,
    testing::Values(OtherRequest{"AnotherMethod", "TALVO_PowerManagementService", "StopService"},
                    OtherRequest{"TheMethodInAnotherCase", "TALVO_PowerManagementService", "requestPowerStateChange"},
                    OtherRequest{"TheMethodWithMore", "TALVO_PowerManagementService", "RequestPowerStateChange2"},
                    OtherRequest{"NoMethod", "TALVO_PowerManagementService", ""},
                    OtherRequest{"AnotherClass", "CIM_PowerManagementService", "RequestPowerStateChange"},
                    OtherRequest{"TheClassInAnotherCase", "talvo_powermanagementservice", "RequestPowerStateChange"},
                    OtherRequest{"Neither", "TALVO_ComputerSystem", "StopService"}),
    [](const auto& tested) { return tested.param.name; });

TEST_F(RequestPowerStateChange, WithoutMethodOrClassNothingIsDone) {
    request(5);
    expectOk(invoke(nullptr));
    EXPECT_CALLS(opened(), answered());
    broker.faults.always("getClassName", nullObject(CMPI_RC_ERR_FAILED));
    EXPECT_EQ(invoke().rc, CMPI_RC_ERR_FAILED);
    EXPECT_THAT(transcript.calls(), testing::Not(testing::Contains(testing::HasSubstr("setProperty(123"))));
}

TEST_F(RequestPowerStateChange, AnotherMethodReturnsTheStatusOfTheClassName) {
    broker.faults.always("getClassName", reports(CMPI_RC_ERR_INVALID_CLASS));
    EXPECT_EQ(invoke("StopService").rc, CMPI_RC_ERR_INVALID_CLASS);
    EXPECT_EQ(broker.returned(result).data.size(), 1);
    EXPECT_EQ(broker.returned(result).closed, 1);
}

TEST_F(RequestPowerStateChange, ExceptionsPassAndNothingIsLeft) {
    request(5);
    for (const char* call : {"getClassName", "getArg", "release", "returnData", "returnDone"}) {
        broker.faults.clear();
        broker.faults.at(call, 1, throws(std::runtime_error(call)));
        EXPECT_THROW(invoke(), std::runtime_error) << call;
        EXPECT_EQ(agent.instrumentations, 0) << call;
        EXPECT_EQ(agent.messageBuffers, 0) << call;
    }
}

TEST_F(RequestPowerStateChange, AnExceptionOfTheCursorPasses) {
    request(5);
    agent.faults.at("Instrumentation", 2, throws(std::runtime_error("no tree")));
    EXPECT_THROW(invoke(), std::runtime_error);
    EXPECT_CALLS(opened(), powerStateRead("5"), powerStateShown("5"), "in.getArg(ManagedElement) -> element",
                 "Instrumentation() throws");
}

} // namespace
} // namespace OrvTest
