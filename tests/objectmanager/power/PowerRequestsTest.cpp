#include "power/PowerRequests.h"

#include "CimErrors.h"

#include <dlfcn.h>

#include <cstddef>
#include <cstdlib>
#include <new>
#include <stdexcept>

namespace {

constinit thread_local bool memoryIsShort = false;

} // namespace

void* operator new(std::size_t size) {
    void* const memory = memoryIsShort ? nullptr : std::malloc(size);
    if (memory == nullptr) {
        throw std::bad_alloc();
    }
    return memory;
}

void operator delete(void* memory) noexcept {
    std::free(memory);
}

void operator delete(void* memory, std::size_t) noexcept {
    std::free(memory);
}

namespace ObjectManager {
namespace {

/** Test_Service is derived from the class of power management services; no other class has a superclass. */
class Classes final : public ClassInformation {
public:
    bool isA(std::string_view className, std::string_view superClassName) const override {
        return className == superClassName ||
               (className == "Test_Service" && superClassName == powerManagementServiceClass);
    }
    std::span<const std::string> keyNames(std::string_view /*className*/) const override { return {}; }
    const std::string* declaredName(std::string_view /*className*/) const override { return nullptr; }
    std::span<const ReferenceEnd> references(std::string_view /*className*/) const override { return {}; }
};

/** Returns the systems that are associated with a service; every other operation throws. */
class Systems final : public Operations {
public:
    std::vector<ObjectPath> systems;
    AssociationFilter asked;

    std::vector<Associated<ObjectPath>> associatorNames(const Invocation& /*invocation*/, const ObjectPath& /*source*/,
                                                        const AssociationFilter& filter) override {
        asked = filter;
        return {{"Test_AssociatedService", systems}};
    }

    void enumerateInstanceNames(const Invocation&, const ObjectPath&, const PathSink&) override { refuse(); }
    void enumerateInstances(const Invocation&, const ObjectPath&, const PropertyList&, const InstanceSink&) override {
        refuse();
    }
    Instance getInstance(const Invocation&, const ObjectPath&, const PropertyList&) override { refuse(); }
    ObjectPath createInstance(const Invocation&, const ObjectPath&, const Instance&) override { refuse(); }
    void modifyInstance(const Invocation&, const ObjectPath&, const Instance&, const PropertyList&) override {
        refuse();
    }
    void deleteInstance(const Invocation&, const ObjectPath&) override { refuse(); }
    void execQuery(const Invocation&, const ObjectPath&, const std::string&, const std::string&,
                   const InstanceSink&) override {
        refuse();
    }
    MethodResult invokeMethod(const Invocation&, const ObjectPath&, const std::string&,
                              const std::vector<NamedValue>&) override {
        refuse();
    }
    std::vector<Associated<Instance>> associators(const Invocation&, const ObjectPath&, const AssociationFilter&,
                                                  const PropertyList&) override {
        refuse();
    }
    std::vector<Instance> references(const Invocation&, const ObjectPath&, const AssociationFilter&,
                                     const PropertyList&) override {
        refuse();
    }
    std::vector<ObjectPath> referenceNames(const Invocation&, const ObjectPath&, const AssociationFilter&) override {
        refuse();
    }

private:
    [[noreturn]] static void refuse() { throw std::logic_error("nobody may ask for this"); }
};

class PowerRequests : public testing::Test {
protected:
    PowerRequests() { operations.systems = {system("machine")}; }
    ~PowerRequests() override { dlclose(agent); }

    static ObjectPath system(const std::string& name) {
        return {{}, "root/cimv2", "Test_System", {{"Name", stringValue(name)}}};
    }

    static ObjectPath service(const std::string& node) {
        return {{}, "root/cimv2", "Test_Service", {{"Name", stringValue("PowerStateManagement_" + node)}}};
    }

    static std::vector<NamedValue> arguments(Value element) {
        return {{"PowerState", unsignedValue(CMPI_uint16, 5)}, {"ManagedElement", std::move(element)}};
    }

    /** Lets the agent log a record. */
    void say(OrvLog::RecordKind kind, const char* text) const {
        reinterpret_cast<void (*)(int, const char*)>(dlsym(agent, "TestAgent_say"))(kind, text);
    }

    std::string principal() const { return reinterpret_cast<const char* (*)()>(dlsym(agent, "TestAgent_principal"))(); }

    /** Calls the method; `provider` takes the place of the provider's method. */
    MethodOutcome request(const std::vector<NamedValue>& given, const std::function<void()>& provider,
                          std::uint64_t answer = 0) {
        return rule.call({invocation, target, requestPowerStateChangeMethod, given}, operations, [&] {
            ++calls;
            provider();
            return MethodResult{unsignedValue(CMPI_uint32, answer), {}};
        });
    }

    MethodOutcome request(const std::function<void()>& provider, std::uint64_t answer = 0) {
        return request(arguments(referenceValue(system("machine"))), provider, answer);
    }

    /** Expects that the rule refuses the call before it calls the provider. */
    void expectRefused(const std::vector<NamedValue>& given, const std::string& message) {
        EXPECT_THAT(errorOf([&] { request(given, [] {}); }), isError(CMPI_RC_ERR_INVALID_PARAMETER, message));
        EXPECT_EQ(calls, 0);
    }

    void attach() { log.attach(agent); }

    void* const agent = dlopen(TEST_AGENT, RTLD_NOW | RTLD_LOCAL);
    Classes classes;
    LogTap log;
    PowerRequestRule rule{classes, log};
    Systems operations;
    Invocation invocation;
    ObjectPath target = service("blade1");
    int calls = 0;
};

TEST_F(PowerRequests, AreCallsOfOneMethodOfOneClassAndItsDescendants) {
    EXPECT_TRUE(rule.isAbout(powerManagementServiceClass, "RequestPowerStateChange"));
    EXPECT_TRUE(rule.isAbout("Test_Service", "requestpowerstatechange"));
    EXPECT_FALSE(rule.isAbout("Test_Service", "RequestStateChange"));
    EXPECT_FALSE(rule.isAbout("Test_System", "RequestPowerStateChange"));
}

TEST_F(PowerRequests, AreNotMadeWithoutAStateOrAnElement) {
    expectRefused({{"ManagedElement", referenceValue(system("machine"))}},
                  "found no argument PowerState, expected it since RequestPowerStateChange requires it");
    expectRefused({{"PowerState", nullValue(CMPI_uint16)}, {"ManagedElement", referenceValue(system("machine"))}},
                  "found no argument PowerState, expected it since RequestPowerStateChange requires it");
    expectRefused({{"PowerState", unsignedValue(CMPI_uint16, 5)}},
                  "found no argument ManagedElement, expected it since RequestPowerStateChange requires it");
    expectRefused(arguments(nullValue(CMPI_ref)),
                  "found no argument ManagedElement, expected it since RequestPowerStateChange requires it");
    expectRefused(arguments(stringValue("machine")),
                  "ManagedElement: found no reference, expected the path of an instance");
}

TEST_F(PowerRequests, AreNotMadeForAnElementThatIsNotAssociatedWithTheService) {
    expectRefused(arguments(referenceValue(system("another"))),
                  "ManagedElement: found root/cimv2:Test_System.Name=\"another\", expected an element whose power the "
                  "service manages: root/cimv2:Test_System.Name=\"machine\"");
    EXPECT_EQ(operations.asked.associationClass, associatedPowerManagementServiceClass);
    EXPECT_EQ(operations.asked.role, "ServiceProvided");
    EXPECT_EQ(operations.asked.resultRole, "UserOfService");
    operations.systems.clear();
    expectRefused(arguments(referenceValue(system("machine"))),
                  "ManagedElement: found root/cimv2:Test_System.Name=\"machine\", expected an element whose power the "
                  "service manages: none: the service is associated with no system");
}

TEST_F(PowerRequests, AreNotMadeOfTheServiceOfANodeThatTakesNone) {
    attach();
    target = service("blade2");
    expectRefused(arguments(referenceValue(system("machine"))),
                  "found the service PowerStateManagement_blade2, expected PowerStateManagement_blade1: the agent's "
                  "node blade1 takes all power requests");
}

TEST_F(PowerRequests, SucceedIfTheAgentAcceptsThem) {
    attach();
    const MethodOutcome outcome = request([&] { say(OrvLog::POWER_REQUEST_ACCEPTED_RECORD, "the machine reboots"); });
    EXPECT_EQ(outcome.remark, "the machine reboots");
    EXPECT_TRUE(outcome.isKnown);
    EXPECT_EQ(outcome.result.returnValue, unsignedValue(CMPI_uint32, 0));
}

TEST_F(PowerRequests, SucceedEvenIfThereIsNoMemoryForTheAgentsRecord) {
    attach();
    const MethodOutcome outcome = request([&] {
        memoryIsShort = true;
        say(OrvLog::POWER_REQUEST_ACCEPTED_RECORD, "the machine reboots in an hour and eleven minutes");
        memoryIsShort = false;
    });
    EXPECT_EQ(outcome.remark, "Power request accepted: memory was too short for more");
    EXPECT_TRUE(outcome.isKnown);
    const CimError refused = errorOf([&] {
        request([&] {
            memoryIsShort = true;
            say(OrvLog::POWER_REQUEST_REFUSED_RECORD, "the machine is out of order for an hour and eleven minutes");
            memoryIsShort = false;
        });
    });
    EXPECT_THAT(refused, isError(CMPI_RC_ERR_FAILED, "Power request refused: memory was too short for more"));
}

TEST_F(PowerRequests, FailIfTheAgentRefusesThemThoughTheProviderReturnsZero) {
    attach();
    const CimError error =
        errorOf([&] { request([&] { say(OrvLog::POWER_REQUEST_REFUSED_RECORD, "the machine is busy"); }); });
    EXPECT_THAT(error, isError(CMPI_RC_ERR_FAILED, "the machine is busy"));
    EXPECT_TRUE(error.refused);
}

TEST_F(PowerRequests, FailIfTheAgentLoggedNothingDuringThisCall) {
    attach();
    say(OrvLog::POWER_REQUEST_ACCEPTED_RECORD, "another call, before");
    const CimError error = errorOf([&] { request([&] { say(OrvLog::ORDINARY_RECORD, "accepted"); }); });
    EXPECT_THAT(error, isError(CMPI_RC_ERR_FAILED, "RequestPowerStateChange ended without a failure, but the agent "
                                                   "accepted no power request"));
    EXPECT_TRUE(error.refused);
}

TEST_F(PowerRequests, HaveTheProvidersAnswerIfItReportsAFailure) {
    attach();
    const MethodOutcome outcome = request([] {}, 4);
    EXPECT_EQ(outcome.result.returnValue, unsignedValue(CMPI_uint32, 4));
    EXPECT_EQ(outcome.remark, "");
}

TEST_F(PowerRequests, HaveAnUnknownOutcomeIfTheAgentCannotBeObserved) {
    const MethodOutcome outcome = request([] {});
    EXPECT_FALSE(outcome.isKnown);
    EXPECT_EQ(outcome.remark, "the outcome is not known beyond the return value: the agent cannot be observed");
}

TEST_F(PowerRequests, ThatFailAfterTheyWereAcceptedSayThatTheyWere) {
    attach();
    const CimError after = errorOf([&] {
        request([&] {
            say(OrvLog::POWER_REQUEST_ACCEPTED_RECORD, "the machine reboots");
            throw CimError(CMPI_RC_ERR_FAILED, "Provider threw an exception");
        });
    });
    EXPECT_THAT(after, isError(CMPI_RC_ERR_FAILED, "Provider threw an exception; but before: the machine reboots"));
    const CimError without =
        errorOf([&] { request([&] { throw CimError(CMPI_RC_ERR_FAILED, "Provider threw an exception"); }); });
    EXPECT_THAT(without, isError(CMPI_RC_ERR_FAILED, "Provider threw an exception"));
}

TEST_F(PowerRequests, TellTheAgentTheirUserWhileTheyAreMade) {
    attach();
    const auto seen = [&](const Invocation& whose) {
        std::string whom;
        invocation = whose;
        request([&] {
            whom = principal();
            say(OrvLog::POWER_REQUEST_ACCEPTED_RECORD, "yes");
        });
        EXPECT_EQ(principal(), "nobody");
        return whom;
    };
    EXPECT_EQ(seen({"alice", 0, "192.0.2.7"}), "alice from 192.0.2.7");
    EXPECT_EQ(seen({"", 0, "192.0.2.7"}), "192.0.2.7");
    EXPECT_EQ(seen({"alice", 0, ""}), "nobody");
}

TEST_F(PowerRequests, AreTakenBackInTheAgentsOwnWords) {
    EXPECT_THAT(errorOf([&] { cancelPowerRequest(log); }),
                isError(CMPI_RC_ERR_NOT_SUPPORTED, "the agent cannot be asked to take back a power request"));
    attach();
    const CimError error = errorOf([&] { cancelPowerRequest(log); });
    EXPECT_THAT(error, isError(CMPI_RC_ERR_FAILED, "nothing is under way"));
    EXPECT_TRUE(error.refused);
}

} // namespace
} // namespace ObjectManager
