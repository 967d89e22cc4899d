#include "dispatch/Dispatcher.h"

#include "TestProviders.h"

namespace ObjectManager {
namespace {

using testing::AllOf;
using testing::ElementsAre;
using testing::Field;
using testing::IsEmpty;

class DispatcherTest : public testing::Test {
protected:
    DispatcherTest() {
        dispatcher.broker().setMessageSink([](const BrokerMessage&) {});
    }

    static Registry registry() {
        std::vector<Registration> registrations;
        for (const char* className : {"Test_Disk",
                                      "Test_Throws",
                                      "Test_ThrowsNumber",
                                      "Test_Fails",
                                      "Test_FailsSilently",
                                      "Test_FailsWithReleasedMessage",
                                      "Test_ReturnsError",
                                      "Test_LeavesOpen",
                                      "Test_LeavesOpenAfterFailureLog",
                                      "Test_ReturnsOneAndLeavesOpen",
                                      "Test_ClosesEmpty",
                                      "Test_ReturnsTwo",
                                      "Test_ReturnsMany",
                                      "Test_ReturnsNull",
                                      "Test_ReturnsReleased",
                                      "Test_ReleasesTwice",
                                      "Test_ReturnsAfterClose",
                                      "Test_ReturnsPath",
                                      "Test_AsksForItself",
                                      "Test_AsksForDisks",
                                      "Test_ShowsContext"}) {
            registrations.push_back(testRegistration(className));
        }
        registrations.push_back(brokenRegistration("NullSlot"));
        return Registry(registrations);
    }

    static ObjectPath path(const std::string& className, const std::vector<NamedValue>& keys = {}) {
        return {"", "root/cimv2", className, keys};
    }

    static ObjectPath disk(const std::string& name) { return path("Test_Disk", {{"Name", stringValue(name)}}); }

    static std::vector<std::string> namesOf(const std::vector<NamedValue>& values) {
        std::vector<std::string> names;
        names.reserve(values.size());
        for (const NamedValue& value : values) {
            names.push_back(value.name);
        }
        return names;
    }

    /** The error of an operation on a class whose provider misbehaves; afterwards a disk is still served. */
    template <typename Call>
    CimError failureOf(Call call) {
        CimError error = errorOf(call);
        EXPECT_EQ(2U, dispatcher.enumerateInstances(invocation, path("Test_Disk"), std::nullopt).size());
        EXPECT_EQ(nullptr, Request::current());
        return error;
    }

    CimError enumerationFailure(const std::string& className) {
        return failureOf([&] { dispatcher.enumerateInstances(invocation, path(className), std::nullopt); });
    }

    CimError getFailure(const std::string& className) {
        return failureOf([&] { dispatcher.getInstance(invocation, path(className), std::nullopt); });
    }

    CimError methodFailure(const std::string& className) {
        return failureOf([&] { dispatcher.invokeMethod(invocation, path(className), "Format", {}); });
    }

    LogTap log;
    Dispatcher dispatcher{registry(), {{testProviders}, nullptr, &log}};
    Invocation invocation{"root", CMPI_FLAG_LocalOnly};
};

TEST_F(DispatcherTest, EnumeratesNamesAndInstances) {
    EXPECT_THAT(dispatcher.enumerateInstanceNames(invocation, path("Test_Disk")), ElementsAre(disk("a"), disk("b")));
    const std::vector<Instance> disks = dispatcher.enumerateInstances(invocation, path("Test_Disk"), std::nullopt);
    ASSERT_EQ(2U, disks.size());
    EXPECT_EQ(disk("b"), disks[1].path);
    EXPECT_THAT(namesOf(disks[1].properties), ElementsAre("Name", "Vendor", "Size"));
}

TEST_F(DispatcherTest, GivesInstancesOneByOne) {
    std::vector<ObjectPath> paths;
    dispatcher.enumerateInstances(invocation, path("Test_Disk"), std::nullopt,
                                  [&](Instance&& instance) { paths.push_back(std::move(instance.path)); });
    EXPECT_THAT(paths, ElementsAre(disk("a"), disk("b")));
}

TEST_F(DispatcherTest, GivesNoObjectsOfAnOperationThatFails) {
    EXPECT_STREQ("TestProvider released a CMPIInstance twice",
                 errorOf([&] {
                     dispatcher.enumerateInstances(invocation, path("Test_ReleasesTwice"), std::nullopt,
                                                   [](const Instance&) { ADD_FAILURE() << "an instance was given"; });
                 }).what());
}

TEST_F(DispatcherTest, PassesThePropertyListOn) {
    const std::vector<Instance> disks =
        dispatcher.enumerateInstances(invocation, path("Test_Disk"), std::vector<std::string>{"Size"});
    EXPECT_THAT(namesOf(disks.at(0).properties), ElementsAre("Name", "Size"));
    EXPECT_THAT(namesOf(dispatcher.getInstance(invocation, disk("a"), std::vector<std::string>{}).properties),
                ElementsAre("Name"));
}

TEST_F(DispatcherTest, GetsCreatesModifiesDeletesAndQueries) {
    EXPECT_EQ(disk("c"), dispatcher.getInstance(invocation, disk("c"), std::nullopt).path);
    const Instance instance{disk("d"), {{"Name", stringValue("d")}}};
    EXPECT_EQ(disk("d"), dispatcher.createInstance(invocation, path("Test_Disk"), instance));
    dispatcher.modifyInstance(invocation, disk("d"), instance, std::vector<std::string>{"Name"});
    EXPECT_THAT(errorOf([&] { dispatcher.modifyInstance(invocation, disk("d"), instance, std::nullopt); }),
                isError(CMPI_RC_ERR_INVALID_PARAMETER, "one property and a list are expected"));
    dispatcher.deleteInstance(invocation, disk("d"));
    const std::vector<Instance> found = dispatcher.execQuery(invocation, path("Test_Disk"), "SELECT", "DMTF:CQL");
    ASSERT_EQ(1U, found.size());
    EXPECT_EQ(disk("SELECT"), found[0].path);
    EXPECT_EQ(stringValue("DMTF:CQL"), find(found[0].properties, "Vendor")->value);
}

TEST_F(DispatcherTest, InvokesMethods) {
    const MethodResult result = dispatcher.invokeMethod(
        invocation, disk("a"), "Format", {{"Quick", booleanValue(true)}, {"Disk", referenceValue(disk("a"))}});
    EXPECT_EQ(unsignedValue(CMPI_uint32, 2), result.returnValue);
    EXPECT_THAT(namesOf(result.outArguments), ElementsAre("Quick", "Disk", "Method"));
    EXPECT_EQ(referenceValue(disk("a")), result.outArguments[1].value);
    EXPECT_EQ(stringValue("Format"), result.outArguments[2].value);
}

TEST_F(DispatcherTest, CallsMethodsForClientsOnlyOfInstancesThatExist) {
    const auto call = [&](const ObjectPath& target) { dispatcher.callMethod(invocation, target, "Format", {}); };
    call(disk("b"));
    call({"host", "ROOT/cimv2", "TEST_DISK", {{"NAME", stringValue("b")}}});
    for (const ObjectPath& wrong : {disk("c"), disk("B")}) {
        EXPECT_THAT(errorOf([&] { call(wrong); }), isError(CMPI_RC_ERR_NOT_FOUND, "there is no such instance"));
    }
    EXPECT_THAT(errorOf([&] {
                    call(path("Test_Fails", {{"Name", stringValue("f")}}));
                }),
                isError(CMPI_RC_ERR_ACCESS_DENIED, "not for you"));
}

TEST_F(DispatcherTest, CallsMethodsForClientsOnlyWithReferencesToInstancesThatExist) {
    const auto call = [&](const Value& argument) {
        return dispatcher.callMethod(invocation, disk("a"), "Format", {{"Disk", argument}}).result.returnValue;
    };
    EXPECT_EQ(unsignedValue(CMPI_uint32, 1), call(referenceValue(disk("b"))));
    EXPECT_EQ(unsignedValue(CMPI_uint32, 1),
              call(arrayValue(CMPI_ref, {referenceValue(disk("a")), nullValue(CMPI_ref)})));
    EXPECT_THAT(errorOf([&] {
                    call(arrayValue(CMPI_ref, {referenceValue(disk("a")), referenceValue(disk("c"))}));
                }),
                isError(CMPI_RC_ERR_NOT_FOUND, "Disk: there is no instance root/cimv2:Test_Disk.Name=\"c\", expected "
                                               "one of those of Test_Disk that are served in that namespace"));
    for (const ObjectPath& unserved :
         {path("Test_Tape", {{"Name", stringValue("t")}}), ObjectPath{"", "root/x", "Test_Disk", disk("a").keys}}) {
        EXPECT_EQ(CMPI_RC_ERR_NOT_FOUND, errorOf([&] { call(referenceValue(unserved)); }).code);
    }
    EXPECT_THAT(errorOf([&] { call(referenceValue(path("Test_Disk"))); }),
                isError(CMPI_RC_ERR_INVALID_PARAMETER,
                        "Disk: found the class Test_Disk, expected the path of an instance, with its keys"));
}

TEST_F(DispatcherTest, GivesTheProviderItsOwnSpellingOfTheClass) {
    EXPECT_THAT(enumerationFailure("TEST_FAILS"), isError(CMPI_RC_ERR_ACCESS_DENIED, "not for you"));
}

TEST_F(DispatcherTest, GivesTheProviderAContext) {
    const std::vector<Instance> shown =
        dispatcher.enumerateInstances(invocation, path("Test_ShowsContext"), std::nullopt);
    ASSERT_EQ(1U, shown.size());
    const std::vector<NamedValue>& entries = shown[0].properties;
    EXPECT_THAT(namesOf(entries), ElementsAre(CMPIInitNameSpace, CMPIInvocationFlags, CMPIPrincipal));
    EXPECT_EQ(stringValue("root/cimv2"), entries[0].value);
    EXPECT_EQ(unsignedValue(CMPI_uint32, CMPI_FLAG_LocalOnly), entries[1].value);
    EXPECT_EQ(stringValue("root"), entries[2].value);
}

TEST_F(DispatcherTest, RefusesClassesNamespacesAndMethodsThatNobodyServes) {
    EXPECT_EQ(CMPI_RC_ERR_INVALID_CLASS, enumerationFailure("Test_Tape").code);
    const ObjectPath elsewhere{"", "root/elsewhere", "Test_Disk", {}};
    EXPECT_EQ(CMPI_RC_ERR_INVALID_NAMESPACE,
              failureOf([&] { dispatcher.enumerateInstanceNames(invocation, elsewhere); }).code);
    EXPECT_EQ(CMPI_RC_ERR_METHOD_NOT_AVAILABLE, methodFailure("Test_NullSlot").code);
    EXPECT_THAT(enumerationFailure("Test_NullSlot").what(), testing::HasSubstr("slot enumerateInstanceNames is null"));
}

struct Misbehaviour {
    const char* className;
    CMPIrc code;
    const char* message;
};

class MisbehaviourTest : public DispatcherTest, public testing::WithParamInterface<Misbehaviour> {};

TEST_P(MisbehaviourTest, CostsItsOwnRequestOnly) {
    EXPECT_THAT(enumerationFailure(GetParam().className), isError(GetParam().code, GetParam().message));
}

INSTANTIATE_TEST_SUITE_P(
    , MisbehaviourTest,
    testing::Values(
        Misbehaviour{"Test_Throws", CMPI_RC_ERR_FAILED, "TestProvider threw an exception: out of disks"},
        Misbehaviour{"Test_ThrowsNumber", CMPI_RC_ERR_FAILED, "TestProvider threw an exception of unknown type"},
        Misbehaviour{"Test_Fails", CMPI_RC_ERR_ACCESS_DENIED, "not for you"},
        Misbehaviour{"Test_FailsSilently", CMPI_RC_ERR_NOT_SUPPORTED,
                     "TestProvider does not support EnumerateInstances"},
        Misbehaviour{"Test_FailsWithReleasedMessage", CMPI_RC_ERR_FAILED,
                     "TestProvider used a CMPIString after it was released"},
        Misbehaviour{"Test_ReturnsError", CMPI_RC_ERR_ACCESS_DENIED, "the disk is on fire"},
        Misbehaviour{"Test_LeavesOpen", CMPI_RC_ERR_FAILED, "TestProvider ended without closing its result"},
        Misbehaviour{"Test_ReturnsNull", CMPI_RC_ERR_FAILED, "TestProvider returned a null CMPIInstance"},
        Misbehaviour{"Test_ReturnsReleased", CMPI_RC_ERR_FAILED,
                     "TestProvider used a CMPIInstance after it was released"},
        Misbehaviour{"Test_ReleasesTwice", CMPI_RC_ERR_FAILED, "TestProvider released a CMPIInstance twice"},
        Misbehaviour{"Test_ReturnsAfterClose", CMPI_RC_ERR_FAILED,
                     "TestProvider returned an instance after it had closed its result"},
        Misbehaviour{"Test_ReturnsPath", CMPI_RC_ERR_FAILED,
                     "TestProvider returned a result of the wrong kind for this operation"},
        Misbehaviour{"Test_AsksForItself", CMPI_RC_ERR_FAILED,
                     "requests of providers nest deeper than 16 levels: does a provider ask for itself?"}));

TEST_F(DispatcherTest, AnEmptyClosedEnumerationIsEmpty) {
    EXPECT_THAT(dispatcher.enumerateInstances(invocation, path("Test_ClosesEmpty"), std::nullopt), IsEmpty());
    EXPECT_THAT(dispatcher.enumerateInstanceNames(invocation, path("Test_ClosesEmpty")), IsEmpty());
}

TEST_F(DispatcherTest, AnOpenEnumerationWithInstancesIsTaken) {
    EXPECT_EQ(1U, dispatcher.enumerateInstances(invocation, path("Test_ReturnsOneAndLeavesOpen"), std::nullopt).size());
}

TEST_F(DispatcherTest, GettingAnInstanceThatIsNotReturnedIsNotFound) {
    EXPECT_THAT(getFailure("Test_LeavesOpen"), isError(CMPI_RC_ERR_NOT_FOUND, "there is no such instance"));
    EXPECT_THAT(getFailure("Test_ClosesEmpty"), isError(CMPI_RC_ERR_NOT_FOUND, "there is no such instance"));
    EXPECT_THAT(getFailure("Test_ReturnsTwo"),
                isError(CMPI_RC_ERR_FAILED, "TestProvider returned 2 instances, expected one"));
}

TEST_F(DispatcherTest, LimitsTheObjectsAndBytesOfARequest) {
    const auto getMany = [&] { dispatcher.enumerateInstances(invocation, path("Test_ReturnsMany"), std::nullopt); };
    dispatcher.broker().setLimits({.objects = 10'000});
    getMany();
    dispatcher.broker().setLimits({.objects = 9'999});
    EXPECT_THAT(failureOf(getMany),
                isError(serverLimitsExceeded,
                        "TestProvider returned more than 9999 objects, which one request may have at most"));
    dispatcher.broker().setLimits({.bytes = 1'000'000});
    EXPECT_THAT(failureOf(getMany),
                isError(serverLimitsExceeded,
                        "TestProvider needed more than 1000000 bytes, which one request may have at most"));
}

/** Counts the bytes that an operation takes, and refuses more than `limit`. */
class Meter final : public MemoryMeter {
public:
    explicit Meter(std::size_t limit = SIZE_MAX) : _limit(limit) {}

    void take(std::size_t bytes) override {
        if (bytes > _limit - now) {
            throw CimError(CMPI_RC_ERR_FAILED, "no room");
        }
        now += bytes;
        most = std::max(most, now);
    }
    void give(std::size_t bytes) noexcept override { now -= bytes; }

    std::size_t now = 0;
    std::size_t most = 0;

private:
    const std::size_t _limit;
};

TEST_F(DispatcherTest, TheMemoryOfAnOperationIsMeasured) {
    Meter meter;
    invocation.meter = &meter;
    std::size_t whileResultsPass = 0;
    dispatcher.enumerateInstances(invocation, path("Test_ReturnsMany"), std::nullopt,
                                  [&](const Instance& /*instance*/) { whileResultsPass = meter.now; });
    constexpr std::size_t bytesOfAnInstance = 200;
    EXPECT_GE(whileResultsPass, 10'000 * bytesOfAnInstance);
    EXPECT_EQ(whileResultsPass, meter.most);
    EXPECT_EQ(0U, meter.now);
}

TEST_F(DispatcherTest, TheMemoryOfUpCallsIsMeasuredWithThatOfTheOperation) {
    Meter alone;
    invocation.meter = &alone;
    dispatcher.enumerateInstances(invocation, path("Test_Disk"), std::nullopt);
    Meter nested;
    invocation.meter = &nested;
    dispatcher.enumerateInstances(invocation, path("Test_AsksForDisks"), std::nullopt);
    EXPECT_EQ(2 * alone.most, nested.most);
    EXPECT_EQ(0U, nested.now);
}

TEST_F(DispatcherTest, AnOperationWhoseMeterRefusesMemoryFails) {
    Meter meter(Arena::chunkBytes);
    invocation.meter = &meter;
    EXPECT_THAT(enumerationFailure("Test_ReturnsMany"),
                isError(CMPI_RC_ERR_FAILED, "TestProvider threw an exception: no room"));
    EXPECT_EQ(0U, meter.now);
}

TEST_F(DispatcherTest, TheOtherInstanceOperationsHaveToCloseTheirResult) {
    const ObjectPath open = path("Test_LeavesOpen");
    const Instance instance{open, {}};
    const auto leftOpen = isError(CMPI_RC_ERR_FAILED, "TestProvider ended without closing its result");
    EXPECT_THAT(failureOf([&] { dispatcher.enumerateInstanceNames(invocation, open); }), leftOpen);
    EXPECT_THAT(failureOf([&] { dispatcher.createInstance(invocation, open, instance); }), leftOpen);
    EXPECT_THAT(failureOf([&] { dispatcher.modifyInstance(invocation, open, instance, std::nullopt); }), leftOpen);
    EXPECT_THAT(failureOf([&] { dispatcher.deleteInstance(invocation, open); }), leftOpen);
    EXPECT_THAT(failureOf([&] { dispatcher.execQuery(invocation, open, "", ""); }), leftOpen);
}

TEST_F(DispatcherTest, CreatingReturnsOnePath) {
    const Instance instance{path("Test_ClosesEmpty"), {}};
    EXPECT_THAT(failureOf([&] { dispatcher.createInstance(invocation, path("Test_ClosesEmpty"), instance); }),
                isError(CMPI_RC_ERR_FAILED, "TestProvider returned 0 object paths, expected one"));
}

TEST_F(DispatcherTest, AMethodThatReturnsNothingAndStaysOpenIsRefused) {
    const CimError error = methodFailure("Test_LeavesOpen");
    EXPECT_THAT(error, isError(CMPI_RC_ERR_FAILED, "Format was refused"));
    EXPECT_TRUE(error.refused);
    EXPECT_THAT(error.reasons, ElementsAre("the provider gave no reason"));
    EXPECT_FALSE(methodFailure("Test_Fails").refused);
}

TEST_F(DispatcherTest, AMethodThatReturnsNothingAndClosesFails) {
    const CimError error = methodFailure("Test_ClosesEmpty");
    EXPECT_THAT(error, isError(CMPI_RC_ERR_FAILED, "TestProvider returned 0 values, expected one"));
    EXPECT_FALSE(error.refused);
}

TEST_F(DispatcherTest, AFailureHasTheReasonsThatWereLogged) {
    const CimError error =
        errorOf([&] { dispatcher.invokeMethod(invocation, path("Test_LeavesOpenAfterFailureLog"), "Format", {}); });
    EXPECT_TRUE(error.refused);
    EXPECT_THAT(error.reasons, ElementsAre("no disk in the bay", "drive bay is open"));
    EXPECT_THAT(enumerationFailure("Test_LeavesOpen").reasons, IsEmpty());
}

TEST_F(DispatcherTest, AllRecordsOfARequestCanBeTaken) {
    log.take();
    errorOf([&] { dispatcher.invokeMethod(invocation, path("Test_LeavesOpenAfterFailureLog"), "Format", {}); });
    EXPECT_THAT(log.take(), ElementsAre(AllOf(Field(&LogRecord::category, "Test.Disk"), Field(&LogRecord::level, 5000),
                                              Field(&LogRecord::text, "looking for disks")),
                                        Field(&LogRecord::level, 6000), Field(&LogRecord::level, 10000)));
}

TEST_F(DispatcherTest, ProvidersAreServedByOthers) {
    const std::vector<Instance> disks =
        dispatcher.enumerateInstances(invocation, path("Test_AsksForDisks"), std::nullopt);
    ASSERT_EQ(2U, disks.size());
    EXPECT_EQ(disk("a"), disks[0].path);
}

TEST_F(DispatcherTest, ChecksItsProviders) {
    EXPECT_TRUE(dispatcher.check(dispatcher.registry().registrations().front()).usable());
    EXPECT_FALSE(dispatcher.check(dispatcher.registry().registrations().back()).usable());
}

} // namespace
} // namespace ObjectManager
