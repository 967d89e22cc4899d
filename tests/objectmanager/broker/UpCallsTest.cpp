#include "RequestTest.h"

#include <functional>
#include <thread>
#include <tuple>

namespace ObjectManager {
namespace {

using testing::_;
using testing::AllOf;
using testing::ElementsAre;
using testing::Field;
using testing::Optional;
using testing::Return;
using testing::Throw;

class OperationsMock : public Operations {
public:
    MOCK_METHOD(void, enumerateInstanceNames, (const Invocation&, const ObjectPath&, const PathSink&), (override));
    MOCK_METHOD(void, enumerateInstances,
                (const Invocation&, const ObjectPath&, const PropertyList&, const InstanceSink&), (override));
    MOCK_METHOD(Instance, getInstance, (const Invocation&, const ObjectPath&, const PropertyList&), (override));
    MOCK_METHOD(ObjectPath, createInstance, (const Invocation&, const ObjectPath&, const Instance&), (override));
    MOCK_METHOD(void, modifyInstance, (const Invocation&, const ObjectPath&, const Instance&, const PropertyList&),
                (override));
    MOCK_METHOD(void, deleteInstance, (const Invocation&, const ObjectPath&), (override));
    MOCK_METHOD(void, execQuery,
                (const Invocation&, const ObjectPath&, const std::string&, const std::string&, const InstanceSink&),
                (override));
    MOCK_METHOD(MethodResult, invokeMethod,
                (const Invocation&, const ObjectPath&, const std::string&, const std::vector<NamedValue>&), (override));
    MOCK_METHOD(std::vector<Associated<Instance>>, associators,
                (const Invocation&, const ObjectPath&, const AssociationFilter&, const PropertyList&), (override));
    MOCK_METHOD(std::vector<Associated<ObjectPath>>, associatorNames,
                (const Invocation&, const ObjectPath&, const AssociationFilter&), (override));
    MOCK_METHOD(std::vector<Instance>, references,
                (const Invocation&, const ObjectPath&, const AssociationFilter&, const PropertyList&), (override));
    MOCK_METHOD(std::vector<ObjectPath>, referenceNames,
                (const Invocation&, const ObjectPath&, const AssociationFilter&), (override));
};

class UpCallsTest : public testing::Test {
protected:
    /** An action that passes objects to the sink, the call's last argument. */
    template <typename Object>
    static auto giving(const std::vector<Object>& objects) {
        return [objects](const auto&... arguments) {
            const auto& sink = std::get<sizeof...(arguments) - 1>(std::tie(arguments...));
            for (Object object : objects) {
                sink(std::move(object));
            }
        };
    }

    static ObjectPath disk(const std::string& name) {
        return {"", "root/cimv2", "Test_Disk", {{"Name", stringValue(name)}}};
    }

    testing::StrictMock<OperationsMock> operations;
    OneClass classes;
    Broker broker{&operations, &classes};
    Request request{broker};
    const CMPIBroker* mb = broker.handle();
    CMPIStatus status{CMPI_RC_ERROR, nullptr};
    const CMPIContext* context =
        request.context({{CMPIPrincipal, stringValue("root")}, {CMPIInvocationFlags, unsignedValue(CMPI_uint32, 3)}});
    const CMPIObjectPath* path = request.objectPath(disk("a"));
    std::array<const char*, 2> properties = {"Size", nullptr};
};

TEST_F(UpCallsTest, NamesComeAsAnEnumerationOfPaths) {
    EXPECT_CALL(operations,
                enumerateInstanceNames(AllOf(Field(&Invocation::principal, "root"), Field(&Invocation::flags, 3U)),
                                       disk("a"), _))
        .WillOnce(giving<ObjectPath>({disk("x"), disk("y")}));
    CMPIEnumeration* names = CBEnumInstanceNames(mb, context, path, &status);
    ASSERT_EQ(CMPI_RC_OK, status.rc);
    std::vector<std::string> found;
    while (CMHasNext(names, nullptr)) {
        const CMPIData data = CMGetNext(names, &status);
        EXPECT_EQ(CMPI_ref, data.type);
        EXPECT_EQ(CMPI_RC_OK, status.rc);
        found.push_back(textOf(CMGetKey(data.value.ref, "Name", nullptr).value.string));
    }
    EXPECT_THAT(found, ElementsAre("x", "y"));
    EXPECT_TRUE(CMIsNullValue(CMGetNext(names, &status)));
    EXPECT_EQ(CMPI_RC_ERR_NOT_FOUND, status.rc);
    EXPECT_EQ(2U, CMGetArrayCount(CMToArray(names, nullptr), nullptr));
}

TEST_F(UpCallsTest, InstancesComeAsAnEnumerationOfInstances) {
    EXPECT_CALL(operations, enumerateInstances(_, disk("a"), Optional(ElementsAre("Size")), _))
        .WillOnce(giving<Instance>({{disk("x"), {{"Size", stringValue("large")}}}}));
    const CMPIEnumeration* found = CBEnumInstances(mb, context, path, properties.data(), &status);
    ASSERT_EQ(CMPI_RC_OK, status.rc);
    const CMPIInstance* instance = CMGetNext(found, nullptr).value.inst;
    EXPECT_EQ("large", textOf(CMGetProperty(instance, "Size", nullptr).value.string));
    EXPECT_FALSE(CMHasNext(found, nullptr));
}

TEST_F(UpCallsTest, AnEnumerationMayBeEmpty) {
    EXPECT_CALL(operations, enumerateInstances(_, _, testing::Eq(std::nullopt), _)).WillOnce(giving<Instance>({}));
    const CMPIEnumeration* found = CBEnumInstances(mb, context, path, nullptr, &status);
    ASSERT_NE(nullptr, found);
    EXPECT_FALSE(CMHasNext(found, nullptr));
}

TEST_F(UpCallsTest, GettingAnInstanceReturnsIt) {
    EXPECT_CALL(operations, getInstance(_, disk("a"), Optional(ElementsAre("Size"))))
        .WillOnce(Return(Instance{disk("a"), {}}));
    const CMPIInstance* instance = CBGetInstance(mb, context, path, properties.data(), &status);
    ASSERT_EQ(CMPI_RC_OK, status.rc);
    EXPECT_EQ(1U, CMGetKeyCount(CMGetObjectPath(instance, nullptr), nullptr));
}

TEST_F(UpCallsTest, InstancesAreCreatedModifiedAndDeleted) {
    const CMPIInstance* instance = request.instance({disk("b"), {{"Size", stringValue("large")}}});
    const auto sameInstance = Field(&Instance::path, disk("b"));
    EXPECT_CALL(operations, createInstance(_, disk("a"), sameInstance)).WillOnce(Return(disk("c")));
    EXPECT_CALL(operations, modifyInstance(_, disk("a"), sameInstance, Optional(ElementsAre("Size"))));
    EXPECT_CALL(operations, deleteInstance(_, disk("a")));
    const CMPIObjectPath* created = CBCreateInstance(mb, context, path, instance, &status);
    ASSERT_EQ(CMPI_RC_OK, status.rc);
    EXPECT_EQ("c", textOf(CMGetKey(created, "Name", nullptr).value.string));
    EXPECT_EQ(CMPI_RC_OK, CBModifyInstance(mb, context, path, instance, properties.data()).rc);
    EXPECT_EQ(CMPI_RC_OK, CBDeleteInstance(mb, context, path).rc);
}

TEST_F(UpCallsTest, QueriesAreExecuted) {
    EXPECT_CALL(operations, execQuery(_, disk("a"), "SELECT * FROM Test_Disk", "DMTF:CQL", _))
        .WillOnce(giving<Instance>({{disk("x"), {}}}));
    const CMPIEnumeration* found = CBExecQuery(mb, context, path, "SELECT * FROM Test_Disk", "DMTF:CQL", &status);
    EXPECT_TRUE(CMHasNext(found, nullptr));
    EXPECT_EQ(CMPI_RC_OK, status.rc);
}

TEST_F(UpCallsTest, MethodsReturnAValueAndArguments) {
    const MethodResult result{unsignedValue(CMPI_uint32, 4), {{"Job", stringValue("started")}}};
    EXPECT_CALL(operations, invokeMethod(_, disk("a"), "Format", ElementsAre(Field(&NamedValue::name, "Quick"))))
        .WillOnce(Return(result));
    const CMPIArgs* in = request.arguments({{"Quick", booleanValue(true)}});
    CMPIArgs* out = request.arguments({});
    const CMPIData value = CBInvokeMethod(mb, context, path, "Format", in, out, &status);
    EXPECT_EQ(CMPI_RC_OK, status.rc);
    EXPECT_EQ(CMPI_uint32, value.type);
    EXPECT_EQ(4U, value.value.uint32);
    EXPECT_EQ("started", textOf(CMGetArg(out, "Job", nullptr).value.string));
}

/** The names of the disks in an enumeration of their instances or paths. */
std::vector<std::string> diskNames(const CMPIEnumeration* enumeration) {
    std::vector<std::string> names;
    while (CMHasNext(enumeration, nullptr)) {
        const CMPIData data = CMGetNext(enumeration, nullptr);
        const CMPIObjectPath* found =
            data.type == CMPI_instance ? CMGetObjectPath(data.value.inst, nullptr) : data.value.ref;
        names.push_back(textOf(CMGetKey(found, "Name", nullptr).value.string));
    }
    return names;
}

auto isFilter(const std::string& associationClass, const std::string& resultClass, const std::string& role,
              const std::string& resultRole) {
    return AllOf(Field(&AssociationFilter::associationClass, associationClass),
                 Field(&AssociationFilter::resultClass, resultClass), Field(&AssociationFilter::role, role),
                 Field(&AssociationFilter::resultRole, resultRole));
}

TEST_F(UpCallsTest, AssociatedObjectsComeAsOneEnumeration) {
    EXPECT_CALL(operations, associators(_, disk("a"), isFilter("A", "C", "R", "S"), Optional(ElementsAre("Size"))))
        .WillOnce(Return(
            std::vector<Associated<Instance>>{{"A", {{disk("x"), {}}, {disk("y"), {}}}}, {"B", {{disk("x"), {}}}}}));
    EXPECT_CALL(operations, associatorNames(_, disk("a"), isFilter("A", "", "", "S")))
        .WillOnce(Return(std::vector<Associated<ObjectPath>>{{"A", {disk("y")}}, {"B", {disk("z")}}}));
    EXPECT_THAT(diskNames(CBAssociators(mb, context, path, "A", "C", "R", "S", properties.data(), &status)),
                ElementsAre("x", "y", "x"));
    EXPECT_EQ(CMPI_RC_OK, status.rc);
    EXPECT_THAT(diskNames(CBAssociatorNames(mb, context, path, "A", nullptr, nullptr, "S", &status)),
                ElementsAre("y", "z"));
    EXPECT_EQ(CMPI_RC_OK, status.rc);
}

TEST_F(UpCallsTest, ReferencesComeAsAnEnumeration) {
    EXPECT_CALL(operations, references(_, disk("a"), isFilter("A", "", "R", ""), testing::Eq(std::nullopt)))
        .WillOnce(Return(std::vector<Instance>{{disk("x"), {}}}));
    EXPECT_CALL(operations, referenceNames(_, disk("a"), isFilter("", "", "", "")))
        .WillOnce(Return(std::vector<ObjectPath>{disk("y"), disk("x")}));
    EXPECT_THAT(diskNames(CBReferences(mb, context, path, "A", "R", nullptr, &status)), ElementsAre("x"));
    EXPECT_EQ(CMPI_RC_OK, status.rc);
    EXPECT_THAT(diskNames(CBReferenceNames(mb, context, path, nullptr, nullptr, &status)), ElementsAre("y", "x"));
    EXPECT_EQ(CMPI_RC_OK, status.rc);
}

TEST_F(UpCallsTest, AFailureIsTheStatus) {
    EXPECT_CALL(operations, enumerateInstanceNames)
        .WillOnce(Throw(CimError(CMPI_RC_ERR_INVALID_CLASS, "no such class")));
    EXPECT_EQ(nullptr, CBEnumInstanceNames(mb, context, path, &status));
    EXPECT_EQ(CMPI_RC_ERR_INVALID_CLASS, status.rc);
    EXPECT_EQ("no such class", textOf(status.msg));
    EXPECT_CALL(operations, associatorNames).WillOnce(Throw(CimError(CMPI_RC_ERR_ACCESS_DENIED, "not for you")));
    EXPECT_EQ(nullptr, CBAssociatorNames(mb, context, path, nullptr, nullptr, nullptr, nullptr, &status));
    EXPECT_EQ(CMPI_RC_ERR_ACCESS_DENIED, status.rc);
    EXPECT_CALL(operations, invokeMethod).WillOnce(Throw(CimError(CMPI_RC_ERR_METHOD_NOT_FOUND, "no such method")));
    const CMPIData value =
        CBInvokeMethod(mb, context, path, "Format", request.arguments({}), request.arguments({}), &status);
    EXPECT_TRUE(CMIsNullValue(value));
    EXPECT_EQ(CMPI_RC_ERR_METHOD_NOT_FOUND, status.rc);
}

TEST_F(UpCallsTest, NeedAContextAndAPath) {
    EXPECT_EQ(nullptr, CBEnumInstanceNames(mb, nullptr, path, &status));
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, status.rc);
    EXPECT_EQ(nullptr, CBEnumInstances(mb, context, nullptr, nullptr, &status));
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, status.rc);
    EXPECT_EQ(nullptr, CBGetInstance(mb, context, nullptr, nullptr, &status));
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, status.rc);
    EXPECT_EQ(nullptr, CBCreateInstance(mb, context, path, nullptr, &status));
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, status.rc);
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, CBModifyInstance(mb, context, path, nullptr, nullptr).rc);
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, CBDeleteInstance(mb, context, nullptr).rc);
    CBInvokeMethod(mb, context, path, "Format", nullptr, nullptr, &status);
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, status.rc);
}

TEST_F(UpCallsTest, FailIfTheyNestTooDeeply) {
    unsigned int depth = 0;
    const auto askAgain = [&] {
        ++depth;
        const Request nested(broker);
        CMPIStatus inner{CMPI_RC_OK, nullptr};
        CBEnumInstanceNames(mb, context, path, &inner);
        if (inner.rc != CMPI_RC_OK) {
            throw CimError(inner.rc, textOf(inner.msg));
        }
    };
    EXPECT_CALL(operations, enumerateInstanceNames).WillRepeatedly(askAgain);
    EXPECT_EQ(nullptr, CBEnumInstanceNames(mb, context, path, &status));
    EXPECT_EQ(CMPI_RC_ERR_FAILED, status.rc);
    EXPECT_EQ("requests of providers nest deeper than 16 levels: does a provider ask for itself?", textOf(status.msg));
    EXPECT_EQ(Broker::maximumDepth - 1, depth);
}

class AttachTest : public UpCallsTest {
protected:
    /** Runs `body` in a thread that is attached with a context that prepareAttachThread made. */
    void inAttachedThread(const std::function<void(const CMPIContext*)>& body) {
        CMPIContext* prepared = CBPrepareAttachThread(mb, context);
        ASSERT_NE(nullptr, prepared);
        std::thread([&] {
            EXPECT_EQ(CMPI_RC_OK, CBAttachThread(mb, prepared).rc);
            body(prepared);
            EXPECT_EQ(CMPI_RC_OK, CBDetachThread(mb, prepared).rc);
            EXPECT_EQ(nullptr, Request::current());
        }).join();
    }
};

TEST_F(AttachTest, AnAttachedThreadMakesObjectsAndUpCalls) {
    EXPECT_CALL(operations, enumerateInstanceNames(Field(&Invocation::principal, "root"), _, _))
        .WillOnce(giving<ObjectPath>({disk("x")}));
    inAttachedThread([&](const CMPIContext* own) {
        CMPIObjectPath* all = CMNewObjectPath(mb, "root/cimv2", "Test_Disk", nullptr);
        const CMPIEnumeration* names = CBEnumInstanceNames(mb, own, all, nullptr);
        EXPECT_TRUE(CMHasNext(names, nullptr));
    });
}

TEST_F(AttachTest, AThreadIsAttachedOnce) {
    inAttachedThread([&](const CMPIContext* own) { EXPECT_EQ(CMPI_RC_ERR_FAILED, CBAttachThread(mb, own).rc); });
    EXPECT_EQ(CMPI_RC_ERR_FAILED, CBAttachThread(mb, context).rc);
    EXPECT_EQ(CMPI_RC_ERR_FAILED, CBDetachThread(mb, context).rc);
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, CBAttachThread(mb, nullptr).rc);
    EXPECT_EQ(nullptr, CBPrepareAttachThread(mb, nullptr));
}

TEST_F(AttachTest, MisuseInAnAttachedThreadIsLogged) {
    std::vector<std::string> messages;
    broker.setMessageSink([&](const BrokerMessage& message) { messages.push_back(message.text); });
    inAttachedThread([&](const CMPIContext*) {
        CMPIString* string = CMNewString(mb, "text", nullptr);
        CMRelease(string);
        CMRelease(string);
    });
    EXPECT_THAT(messages, ElementsAre("a provider's thread released a CMPIString twice"));
    EXPECT_EQ("", request.misuse());
}

TEST_F(AttachTest, AThreadThatEndsAttachedLeavesNothingBehind) {
    const Arena::Usage before = Arena::usage();
    CMPIContext* prepared = CBPrepareAttachThread(mb, context);
    std::thread([&] {
        CBAttachThread(mb, prepared);
        CMNewString(mb, "text", nullptr);
    }).join();
    EXPECT_EQ(before.chunksInUse, Arena::usage().chunksInUse);
    CMRelease(prepared);
}

} // namespace
} // namespace ObjectManager
