/**
 * Tests what the other tests rely on: the transcript hides nothing that matters, and the broker behaves like the broker
 * of an object manager.
 */
#include "RecordingBroker.h"
#include "Transcript.h"

#include "cmpimacs.h"

#include <gmock/gmock.h>

#include <cstring>
#include <sstream>

namespace OrvTest {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

class TranscriptTest : public testing::Test {
protected:
    TranscriptTest() { transcript.clear(); }

    void write(LogRecord record) { transcript.record(std::move(record)); }

    /** A log record, and the trace record that makes a pair with it. */
    static LogRecord logRecord(const std::string& text, int line = 17) {
        return {LogRecord::Kind::log, 6000, "Category", "function", "src/A.cpp", line, text, true};
    }
    static LogRecord traceRecord(const std::string& text, int line = 17) {
        LogRecord record = logRecord(text, line);
        record.kind = LogRecord::Kind::trace;
        return record;
    }

    Transcript& transcript = Transcript::instance();
};

TEST_F(TranscriptTest, APairOfRecordsIsOneLineWithoutItsLineNumber) {
    write(logRecord("MESSAGE [File: src/A.cpp, Line: 17]: text"));
    transcript.reading("something in between");
    write(traceRecord("MESSAGE [File: src/A.cpp, Line: 17]: text"));
    EXPECT_THAT(
        transcript.calls(),
        ElementsAre("log+trace 6000 Category function src/A.cpp: MESSAGE [File: src/A.cpp, Line: <line>]: text"));
}

TEST_F(TranscriptTest, ALineNumberThatIsNotTheRecordsIsKept) {
    write(logRecord("VARIABLE: 'a' has Value 'b' at line 18 in src/A.cpp"));
    write(traceRecord("VARIABLE: 'a' has Value 'b' at line 18 in src/A.cpp"));
    EXPECT_THAT(
        transcript.calls(),
        ElementsAre(
            "log+trace 6000 Category function src/A.cpp:17: VARIABLE: 'a' has Value 'b' at line 18 in src/A.cpp"));
}

TEST_F(TranscriptTest, RecordsThatAreNoPairStayApart) {
    LogRecord unusual = traceRecord("a");
    unusual.usualArguments = false;
    write(traceRecord("a"));
    write(logRecord("a"));
    write(unusual);
    write(logRecord("a"));
    transcript.call("a call in between");
    write(traceRecord("a", 18));
    write(logRecord("b"));
    EXPECT_THAT(transcript.calls(), ElementsAre("trace 6000 Category function src/A.cpp:17: a",
                                                "log 6000 Category function src/A.cpp:17: a",
                                                "trace 6000 Category function src/A.cpp:17: a (unusual arguments)",
                                                "log 6000 Category function src/A.cpp:17: a", "a call in between",
                                                "trace 6000 Category function src/A.cpp:18: a",
                                                "log 6000 Category function src/A.cpp:17: b"));
}

TEST_F(TranscriptTest, AddressesAreNamedWhereTheyAreKnown) {
    const int known = 0;
    const int unknown = 0;
    transcript.name(&known, "known");
    std::ostringstream text;
    text << " known=" << &known << " unknown=" << &unknown << " null=" << static_cast<const void*>(nullptr);
    write(logRecord(text.str()));
    write(traceRecord(text.str()));
    EXPECT_THAT(transcript.calls(),
                ElementsAre("log+trace 6000 Category function src/A.cpp:17:  known=&known unknown=<address> null=0"));
    transcript.forget(&known);
    EXPECT_EQ(transcript.nameOf(&known), "<address>");
    EXPECT_EQ(transcript.nameOf(nullptr), "null");
}

TEST_F(TranscriptTest, NothingIsKeptInAPause) {
    transcript.pause();
    transcript.call("call");
    write(logRecord("a"));
    EXPECT_THAT(transcript.everything(), IsEmpty());
    transcript.clear();
    transcript.call("call");
    EXPECT_THAT(transcript.everything(), ElementsAre("call"));
}

class RecordingBrokerTest : public testing::Test {
protected:
    RecordingBrokerTest() { transcript.clear(); }

    Transcript& transcript = Transcript::instance();
    RecordingBroker broker;
    CMPIObjectPath* path = broker.path("path", "root/cimv2", "CIM_Thing", {{"Name", "a"}});
    CMPIStatus status = {CMPI_RC_ERR_FAILED, nullptr};
};

/** Whether any of the pointers behind the first `offset` bytes of a table is null. */
template <typename Table>
bool hasNullSlot(const Table& table, std::size_t offset) {
    for (std::size_t position = offset; position < sizeof table; position += sizeof(void*)) {
        const void* slot = nullptr;
        std::memcpy(&slot, reinterpret_cast<const char*>(&table) + position, sizeof slot);
        if (slot == nullptr) {
            return true;
        }
    }
    return false;
}

TEST_F(RecordingBrokerTest, HasNoNullSlot) {
    EXPECT_FALSE(hasNullSlot(*broker.bft, offsetof(CMPIBrokerFT, brokerName)));
    EXPECT_FALSE(hasNullSlot(*broker.eft, offsetof(CMPIBrokerEncFT, newInstance)));
    EXPECT_FALSE(hasNullSlot(*broker.xft, offsetof(CMPIBrokerExtFT, resolveFileName)));
    EXPECT_FALSE(hasNullSlot(*broker.mft, offsetof(CMPIBrokerMemFT, mark)));
    EXPECT_FALSE(hasNullSlot(*path->ft, offsetof(CMPIObjectPathFT, release)));
    EXPECT_FALSE(hasNullSlot(*broker.instance("i", path)->ft, offsetof(CMPIInstanceFT, release)));
    EXPECT_FALSE(hasNullSlot(*broker.string("s", "")->ft, offsetof(CMPIStringFT, release)));
    EXPECT_FALSE(hasNullSlot(*broker.args("a")->ft, offsetof(CMPIArgsFT, release)));
    EXPECT_FALSE(hasNullSlot(*broker.dateTime("d")->ft, offsetof(CMPIDateTimeFT, release)));
    EXPECT_FALSE(hasNullSlot(*broker.context("c")->ft, offsetof(CMPIContextFT, release)));
    EXPECT_FALSE(hasNullSlot(*broker.result("r")->ft, offsetof(CMPIResultFT, release)));
    EXPECT_FALSE(hasNullSlot(*CMNewArray(&broker, 1, CMPI_uint16, nullptr)->ft, offsetof(CMPIArrayFT, release)));
    EXPECT_FALSE(hasNullSlot(*CBEnumInstanceNames(&broker, broker.context("c"), path, nullptr)->ft,
                             offsetof(CMPIEnumerationFT, release)));
}

TEST_F(RecordingBrokerTest, AnUnsupportedSlotIsRecordedAndReportsIt) {
    EXPECT_EQ(CMNewDateTimeFromChars(&broker, "20260101000000.000000+000", &status), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_EQ(CBDeleteInstance(&broker, nullptr, path).rc, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_THAT(transcript.calls(),
                ElementsAre("newDateTimeFromChars(broker, \"20260101000000.000000+000\", <address>) is not supported",
                            "deleteInstance(broker, null, path) is not supported"));
}

TEST_F(RecordingBrokerTest, KeysAreFoundWithoutRegardToCaseAndAMissingOneIsReported) {
    const CMPIData key = CMGetKey(path, "NAME", &status);
    EXPECT_EQ(status.rc, CMPI_RC_OK);
    EXPECT_EQ(key.type, CMPI_string);
    EXPECT_STREQ(CMGetCharPtr(key.value.string), "a");
    const CMPIData missing = CMGetKey(path, "Other", &status);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_FOUND);
    EXPECT_EQ(missing.state, CMPI_nullValue | CMPI_notFound);
    EXPECT_EQ(missing.value.string, nullptr);
    EXPECT_THAT(transcript.calls(), ElementsAre("path.getKey(NAME) -> \"a\"", "path.getKey(Other) -> not found"));
}

TEST_F(RecordingBrokerTest, ReferencesAreKeptAsTheyAre) {
    CMPIObjectPath* association = CMNewObjectPath(&broker, "root/cimv2", "CIM_Association", &status);
    const CMPIValue reference = {.ref = path};
    CMAddKey(association, "Antecedent", &reference, CMPI_ref);
    EXPECT_EQ(CMGetKey(association, "Antecedent", nullptr).value.ref, path);
    EXPECT_THAT(transcript.calls(), ElementsAre("broker.newObjectPath(\"root/cimv2\", \"CIM_Association\") -> path#1",
                                                "path#1.addKey(Antecedent, CMPI_ref, path)",
                                                "path#1.getKey(Antecedent) -> path, no status"));
}

TEST_F(RecordingBrokerTest, AFilterKeepsWhatIsWantedAndTheKeys) {
    CMPIInstance* instance = CMNewInstance(&broker, path, &status);
    const char* wanted[] = {"caption", nullptr};
    const char* keys[] = {"Name", nullptr};
    CMSetPropertyFilter(instance, wanted, keys);
    for (const char* property : {"Name", "Caption", "Description"}) {
        CMSetProperty(instance, property, "text", CMPI_chars);
    }
    EXPECT_EQ(CMGetPropertyCount(instance, nullptr), 2);
    EXPECT_EQ(CMGetProperty(instance, "Description", &status).state & CMPI_notFound, CMPI_notFound);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
    EXPECT_STREQ(CMGetCharPtr(CMGetKey(CMGetObjectPath(instance, nullptr), "Name", nullptr).value.string), "text");
}

TEST_F(RecordingBrokerTest, ArraysTakeElementsOfTheirOwnTypeAndPropertiesArraysOfTheirs) {
    const CMPIArray* array = CMNewArray(&broker, 1, CMPI_string, nullptr);
    const CMPIValue text = {.string = broker.string("string", "text")};
    EXPECT_EQ(CMSetArrayElementAt(array, 0, "text", CMPI_chars).rc, CMPI_RC_ERR_TYPE_MISMATCH);
    EXPECT_EQ(CMSetArrayElementAt(array, 1, &text, CMPI_string).rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
    EXPECT_TRUE(CMIsNullValue(CMGetArrayElementAt(array, 0, nullptr)));
    EXPECT_EQ(CMSetArrayElementAt(array, 0, &text, CMPI_string).rc, CMPI_RC_OK);
    EXPECT_EQ(CMGetArrayElementAt(array, 0, nullptr).value.string, text.string);

    CMPIInstance* instance = CMNewInstance(&broker, path, nullptr);
    const CMPIValue value = {.array = const_cast<CMPIArray*>(array)};
    EXPECT_EQ(CMSetProperty(instance, "Texts", &value, CMPI_uint16A).rc, CMPI_RC_ERR_TYPE_MISMATCH);
    EXPECT_EQ(CMSetProperty(instance, "Texts", &value, CMPI_stringA).rc, CMPI_RC_OK);
    EXPECT_EQ(CMGetPropertyCount(instance, nullptr), 1);
}

TEST_F(RecordingBrokerTest, UpCallsYieldWhatTheTestPutThere) {
    CMPIInstance* instance = broker.instance("instance", path);
    broker.instanceNames["CIM_Thing"] = {path};
    broker.instances["CIM_Thing"] = {instance};
    CMPIContext* context = broker.context("context");
    CMPIEnumeration* names = CBEnumInstanceNames(&broker, context, path, &status);
    EXPECT_TRUE(CMHasNext(names, nullptr));
    EXPECT_EQ(CMGetNext(names, &status).value.ref, path);
    EXPECT_FALSE(CMHasNext(names, nullptr));
    CMPIEnumeration* instances = CBEnumInstances(&broker, context, path, nullptr, &status);
    EXPECT_EQ(CMGetNext(instances, &status).value.inst, instance);
    EXPECT_THAT(transcript.calls(), ElementsAre("broker.enumerateInstanceNames(context, path) -> enumeration#1",
                                                "enumeration#1.getNext() -> path",
                                                "broker.enumerateInstances(context, path, null) -> enumeration#2",
                                                "enumeration#2.getNext() -> instance"));
}

TEST_F(RecordingBrokerTest, FaultsComeWhenTheyAreDue) {
    broker.faults.at("newArgs", 2, nullObject(CMPI_RC_ERR_ACCESS_DENIED));
    broker.faults.always("newArgs", objectWithoutHandle());
    EXPECT_EQ(CMNewArgs(&broker, &status)->hdl, nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(CMNewArgs(&broker, &status), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
    broker.faults.at("newArgs", 1, leavesStatus());
    EXPECT_NE(CMNewArgs(&broker, &status)->hdl, nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
    broker.faults.at("newArgs", 1, throws(42));
    EXPECT_THROW(CMNewArgs(&broker, &status), int);
    EXPECT_THAT(transcript.calls(), ElementsAre("broker.newArgs() -> args#1 without handle", "broker.newArgs() -> null",
                                                "broker.newArgs() -> args#2", "broker.newArgs() throws"));
}

TEST_F(RecordingBrokerTest, ResultsKeepWhatIsReturned) {
    CMPIResult* result = broker.result("result");
    const CMPIValue number = {.uint32 = 7};
    CMReturnObjectPath(result, path);
    CMReturnData(result, &number, CMPI_uint32);
    CMReturnDone(result);
    EXPECT_THAT(broker.returned(result).paths, ElementsAre(path));
    ASSERT_EQ(broker.returned(result).data.size(), 1);
    EXPECT_EQ(broker.returned(result).data[0].value.uint32, 7);
    EXPECT_EQ(broker.returned(result).closed, 1);
}

} // namespace
} // namespace OrvTest
