/* Tests that no slot is null, and what each slot reports for arguments that are null or not supported. */
#include "RequestTest.h"
#include "broker/Objects.h"
#include "broker/Result.h"

#include <cstring>
#include <utility>

namespace ObjectManager {
namespace {

class SlotsTest : public RequestTest {
protected:
    /** The function pointers of a table. `first` is the first of them; the others follow up to the table's end. */
    template <typename Table, typename Function>
    static std::vector<const void*> slots(const Table* table, const Function* first) {
        const auto* begin = reinterpret_cast<const char*>(first);
        const auto* end = reinterpret_cast<const char*>(table) + sizeof(Table);
        std::vector<const void*> functions(static_cast<std::size_t>(end - begin) / sizeof(void*));
        std::memcpy(functions.data(), begin, functions.size() * sizeof(void*));
        return functions;
    }

    template <typename Object>
    static void expectWhole(const Object* object) {
        EXPECT_EQ(CMPIVersion200, object->ft->ftVersion);
        EXPECT_THAT(slots(object->ft, &object->ft->release), testing::Each(testing::NotNull()));
    }

    /** The status that a call wrote to `st`, whatever it returned. */
    CMPIStatus after(const auto&) { return std::exchange(st, {CMPI_RC_ERROR, nullptr}); }

    static void expectInvalid(const char* slot, const CMPIStatus& found) {
        EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, found.rc) << slot;
    }

    CMPIStatus st{CMPI_RC_ERROR, nullptr};
    Result result{request};
    CMPIObjectPath* path = newPath();
    CMPIInstance* instance = newInstance();
    CMPIArgs* args = CMNewArgs(mb, nullptr);
    CMPIContext* context = request.context({});
    CMPIString* string = CMNewString(mb, "text", nullptr);
    CMPIArray* array = CMNewArray(mb, 1, CMPI_uint16, nullptr);
    CMPIDateTime* dateTime = CMNewDateTime(mb, nullptr);
    CMPIError* error =
        CMNewCMPIError(mb, "owner", "id", "text", ErrorSevLow, ErrorProbCauseUnknown, CMPI_RC_ERR_FAILED, nullptr);
};

TEST_F(SlotsTest, NoSlotIsNull) {
    EXPECT_THAT(slots(mb->bft, &mb->bft->prepareAttachThread), testing::Each(testing::NotNull()));
    EXPECT_THAT(slots(mb->eft, &mb->eft->newInstance), testing::Each(testing::NotNull()));
    EXPECT_THAT(slots(mb->xft, &mb->xft->resolveFileName), testing::Each(testing::NotNull()));
    EXPECT_THAT(slots(mb->mft, &mb->mft->mark), testing::Each(testing::NotNull()));
    expectWhole(path);
    expectWhole(instance);
    expectWhole(args);
    expectWhole(context);
    expectWhole(string);
    expectWhole(array);
    expectWhole(dateTime);
    expectWhole(error);
    expectWhole(result.handle());
    const CMPIEnumeration enumeration{nullptr, &enumerationTable};
    expectWhole(&enumeration);
}

TEST_F(SlotsTest, BrokerTablesAreOfVersion200) {
    EXPECT_EQ(CMPIVersion200, mb->bft->brokerVersion);
    EXPECT_STREQ("orv-objectmanager", mb->bft->brokerName);
    EXPECT_EQ(CMPIVersion200, mb->eft->ftVersion);
    EXPECT_EQ(CMPIVersion200, mb->xft->ftVersion);
    EXPECT_EQ(CMPIVersion200, mb->mft->ftVersion);
}

TEST_F(SlotsTest, NullObjectsAreInvalidHandles) {

    const auto* noPath = static_cast<const CMPIObjectPath*>(nullptr);
    const auto* p = path->ft;
    expectInvalid("ObjectPath.release", p->release(nullptr));
    expectInvalid("ObjectPath.clone", after(p->clone(noPath, &st)));
    expectInvalid("ObjectPath.setNameSpace", p->setNameSpace(noPath, "a"));
    expectInvalid("ObjectPath.getNameSpace", after(p->getNameSpace(noPath, &st)));
    expectInvalid("ObjectPath.setHostname", p->setHostname(noPath, "a"));
    expectInvalid("ObjectPath.getHostname", after(p->getHostname(noPath, &st)));
    expectInvalid("ObjectPath.setClassName", p->setClassName(noPath, "a"));
    expectInvalid("ObjectPath.getClassName", after(p->getClassName(noPath, &st)));
    expectInvalid("ObjectPath.addKey", p->addKey(noPath, "a", nullptr, CMPI_uint16));
    expectInvalid("ObjectPath.getKey", after(p->getKey(noPath, "a", &st)));
    expectInvalid("ObjectPath.getKeyAt", after(p->getKeyAt(noPath, 0, nullptr, &st)));
    expectInvalid("ObjectPath.getKeyCount", after(p->getKeyCount(noPath, &st)));
    expectInvalid("ObjectPath.setNameSpaceFromObjectPath", p->setNameSpaceFromObjectPath(noPath, path));
    expectInvalid("ObjectPath.setNameSpaceFromObjectPath", p->setNameSpaceFromObjectPath(path, noPath));
    expectInvalid("ObjectPath.setHostAndNameSpaceFromObjectPath", p->setHostAndNameSpaceFromObjectPath(noPath, path));
    expectInvalid("ObjectPath.setHostAndNameSpaceFromObjectPath", p->setHostAndNameSpaceFromObjectPath(path, noPath));
    expectInvalid("ObjectPath.getClassQualifier", after(p->getClassQualifier(noPath, "a", &st)));
    expectInvalid("ObjectPath.getPropertyQualifier", after(p->getPropertyQualifier(noPath, "a", "b", &st)));
    expectInvalid("ObjectPath.getMethodQualifier", after(p->getMethodQualifier(noPath, "a", "b", &st)));
    expectInvalid("ObjectPath.getParameterQualifier", after(p->getParameterQualifier(noPath, "a", "b", "c", &st)));
    expectInvalid("ObjectPath.toString", after(p->toString(noPath, &st)));

    const auto* noInstance = static_cast<const CMPIInstance*>(nullptr);
    const auto* i = instance->ft;
    expectInvalid("Instance.release", i->release(nullptr));
    expectInvalid("Instance.clone", after(i->clone(noInstance, &st)));
    expectInvalid("Instance.getProperty", after(i->getProperty(noInstance, "a", &st)));
    expectInvalid("Instance.getPropertyAt", after(i->getPropertyAt(noInstance, 0, nullptr, &st)));
    expectInvalid("Instance.getPropertyCount", after(i->getPropertyCount(noInstance, &st)));
    expectInvalid("Instance.setProperty", i->setProperty(noInstance, "a", nullptr, CMPI_uint16));
    expectInvalid("Instance.getObjectPath", after(i->getObjectPath(noInstance, &st)));
    expectInvalid("Instance.setPropertyFilter", i->setPropertyFilter(noInstance, nullptr, nullptr));
    expectInvalid("Instance.setObjectPath", i->setObjectPath(noInstance, path));
    expectInvalid("Instance.setObjectPath", i->setObjectPath(instance, noPath));
    expectInvalid("Instance.setPropertyWithOrigin",
                  i->setPropertyWithOrigin(noInstance, "a", nullptr, CMPI_uint16, "b"));

    const auto* noArgs = static_cast<const CMPIArgs*>(nullptr);
    expectInvalid("Args.release", args->ft->release(nullptr));
    expectInvalid("Args.clone", after(args->ft->clone(noArgs, &st)));
    expectInvalid("Args.addArg", args->ft->addArg(noArgs, "a", nullptr, CMPI_uint16));
    expectInvalid("Args.getArg", after(args->ft->getArg(noArgs, "a", &st)));
    expectInvalid("Args.getArgAt", after(args->ft->getArgAt(noArgs, 0, nullptr, &st)));
    expectInvalid("Args.getArgCount", after(args->ft->getArgCount(noArgs, &st)));

    const auto* noContext = static_cast<const CMPIContext*>(nullptr);
    expectInvalid("Context.release", context->ft->release(nullptr));
    expectInvalid("Context.clone", after(context->ft->clone(noContext, &st)));
    expectInvalid("Context.getEntry", after(context->ft->getEntry(noContext, "a", &st)));
    expectInvalid("Context.getEntryAt", after(context->ft->getEntryAt(noContext, 0, nullptr, &st)));
    expectInvalid("Context.getEntryCount", after(context->ft->getEntryCount(noContext, &st)));
    expectInvalid("Context.addEntry", context->ft->addEntry(noContext, "a", nullptr, CMPI_uint16));

    const auto* noString = static_cast<const CMPIString*>(nullptr);
    expectInvalid("String.release", string->ft->release(nullptr));
    expectInvalid("String.clone", after(string->ft->clone(noString, &st)));
    expectInvalid("String.getCharPtr", after(string->ft->getCharPtr(noString, &st)));

    const auto* noArray = static_cast<const CMPIArray*>(nullptr);
    expectInvalid("Array.release", array->ft->release(nullptr));
    expectInvalid("Array.clone", after(array->ft->clone(noArray, &st)));
    expectInvalid("Array.getSize", after(array->ft->getSize(noArray, &st)));
    expectInvalid("Array.getSimpleType", after(array->ft->getSimpleType(noArray, &st)));
    expectInvalid("Array.getElementAt", after(array->ft->getElementAt(noArray, 0, &st)));
    expectInvalid("Array.setElementAt", array->ft->setElementAt(noArray, 0, nullptr, CMPI_uint16));

    const auto* noDateTime = static_cast<const CMPIDateTime*>(nullptr);
    expectInvalid("DateTime.release", dateTime->ft->release(nullptr));
    expectInvalid("DateTime.clone", after(dateTime->ft->clone(noDateTime, &st)));
    expectInvalid("DateTime.getBinaryFormat", after(dateTime->ft->getBinaryFormat(noDateTime, &st)));
    expectInvalid("DateTime.getStringFormat", after(dateTime->ft->getStringFormat(noDateTime, &st)));
    expectInvalid("DateTime.isInterval", after(dateTime->ft->isInterval(noDateTime, &st)));

    const CMPIResult* noResult = nullptr;
    const auto* r = result.handle()->ft;
    expectInvalid("Result.release", r->release(nullptr));
    expectInvalid("Result.clone", after(r->clone(noResult, &st)));
    expectInvalid("Result.returnData", r->returnData(noResult, nullptr, CMPI_uint16));
    expectInvalid("Result.returnInstance", r->returnInstance(noResult, instance));
    expectInvalid("Result.returnObjectPath", r->returnObjectPath(noResult, path));
    expectInvalid("Result.returnDone", r->returnDone(noResult));
    expectInvalid("Result.returnError", r->returnError(noResult, error));

    const CMPIError* noError = nullptr;
    const auto* e = error->ft;
    expectInvalid("Error.release", e->release(nullptr));
    expectInvalid("Error.clone", after(e->clone(noError, &st)));
    for (auto* get :
         {e->getOtherErrorType, e->getOwningEntity, e->getMessageID, e->getMessage, e->getProbableCauseDescription,
          e->getErrorSource, e->getOtherErrorSourceFormat, e->getCIMStatusCodeDescription}) {
        expectInvalid("Error: text", after(get(noError, &st)));
    }
    expectInvalid("Error.getErrorType", after(e->getErrorType(noError, &st)));
    expectInvalid("Error.getPerceivedSeverity", after(e->getPerceivedSeverity(noError, &st)));
    expectInvalid("Error.getProbableCause", after(e->getProbableCause(noError, &st)));
    expectInvalid("Error.getErrorSourceFormat", after(e->getErrorSourceFormat(noError, &st)));
    expectInvalid("Error.getCIMStatusCode", after(e->getCIMStatusCode(noError, &st)));
    expectInvalid("Error.getRecommendedActions", after(e->getRecommendedActions(noError, &st)));
    expectInvalid("Error.getMessageArguments", after(e->getMessageArguments(noError, &st)));
    for (auto* set : {e->setOtherErrorType, e->setProbableCauseDescription, e->setErrorSource,
                      e->setOtherErrorSourceFormat, e->setCIMStatusCodeDescription}) {
        expectInvalid("Error: set text", set(noError, "a"));
    }
    expectInvalid("Error.setErrorType", e->setErrorType(noError, OtherErrorType));
    expectInvalid("Error.setErrorSourceFormat", e->setErrorSourceFormat(noError, CIMErrorSrcFormatOther));
    for (auto* set : {e->setRecommendedActions, e->setMessageArguments}) {
        expectInvalid("Error: set array", set(noError, array));
        expectInvalid("Error: set array", set(error, noArray));
    }

    const CMPIEnumeration* noEnumeration = nullptr;
    expectInvalid("Enumeration.release", enumerationTable.release(nullptr));
    expectInvalid("Enumeration.clone", after(enumerationTable.clone(noEnumeration, &st)));
    expectInvalid("Enumeration.getNext", after(enumerationTable.getNext(noEnumeration, &st)));
    expectInvalid("Enumeration.hasNext", after(enumerationTable.hasNext(noEnumeration, &st)));
    expectInvalid("Enumeration.toArray", after(enumerationTable.toArray(noEnumeration, &st)));

    expectInvalid("newInstance", after(mb->eft->newInstance(mb, noPath, &st)));
    expectInvalid("classPathIsA", after(mb->eft->classPathIsA(mb, noPath, "a", &st)));
    expectInvalid("toString", after(mb->eft->toString(mb, nullptr, &st)));
    expectInvalid("isOfType", after(mb->eft->isOfType(mb, nullptr, "a", &st)));
    expectInvalid("getType", after(mb->eft->getType(mb, nullptr, &st)));
    EXPECT_EQ("", request.misuse());
}

TEST_F(SlotsTest, NullBrokersAreInvalidHandles) {
    const auto* e = mb->eft;
    CMPIMsgFileHandle file = nullptr;
    expectInvalid("newInstance", after(e->newInstance(nullptr, path, &st)));
    expectInvalid("newObjectPath", after(e->newObjectPath(nullptr, "a", "b", &st)));
    expectInvalid("newArgs", after(e->newArgs(nullptr, &st)));
    expectInvalid("newString", after(e->newString(nullptr, "a", &st)));
    expectInvalid("newArray", after(e->newArray(nullptr, 1, CMPI_uint16, &st)));
    expectInvalid("newDateTime", after(e->newDateTime(nullptr, &st)));
    expectInvalid("newDateTimeFromBinary", after(e->newDateTimeFromBinary(nullptr, 0, 0, &st)));
    expectInvalid("newDateTimeFromChars", after(e->newDateTimeFromChars(nullptr, "a", &st)));
    expectInvalid("newSelectExp", after(e->newSelectExp(nullptr, "a", "b", nullptr, &st)));
    expectInvalid("classPathIsA", after(e->classPathIsA(nullptr, path, "a", &st)));
    expectInvalid("getMessage", after(e->getMessage(nullptr, "a", "b", &st, 0)));
    expectInvalid("logMessage", e->logMessage(nullptr, CMPI_SEV_INFO, "a", "b", nullptr));
    expectInvalid("trace", e->trace(nullptr, CMPI_LEV_INFO, "a", "b", nullptr));
    expectInvalid("newCMPIError", after(e->newCMPIError(nullptr, "a", "b", "c", ErrorSevLow, ErrorProbCauseUnknown,
                                                        CMPI_RC_ERR_FAILED, &st)));
    expectInvalid("openMessageFile", e->openMessageFile(nullptr, "a", &file));
    expectInvalid("closeMessageFile", e->closeMessageFile(nullptr, nullptr));
    expectInvalid("getMessage2", after(e->getMessage2(nullptr, "a", nullptr, "b", &st, 0)));

    const auto* b = mb->bft;
    EXPECT_EQ(nullptr, b->prepareAttachThread(nullptr, context));
    expectInvalid("attachThread", b->attachThread(nullptr, context));
    expectInvalid("detachThread", b->detachThread(nullptr, context));
    expectInvalid("deliverIndication", b->deliverIndication(nullptr, context, "a", instance));
    expectInvalid("enumerateInstanceNames", after(b->enumerateInstanceNames(nullptr, context, path, &st)));
    expectInvalid("getInstance", after(b->getInstance(nullptr, context, path, nullptr, &st)));
    expectInvalid("createInstance", after(b->createInstance(nullptr, context, path, instance, &st)));
    expectInvalid("modifyInstance", b->modifyInstance(nullptr, context, path, instance, nullptr));
    expectInvalid("deleteInstance", b->deleteInstance(nullptr, context, path));
    expectInvalid("execQuery", after(b->execQuery(nullptr, context, path, "a", "b", &st)));
    expectInvalid("enumerateInstances", after(b->enumerateInstances(nullptr, context, path, nullptr, &st)));
    expectInvalid("associators",
                  after(b->associators(nullptr, context, path, nullptr, nullptr, nullptr, nullptr, nullptr, &st)));
    expectInvalid("associatorNames",
                  after(b->associatorNames(nullptr, context, path, nullptr, nullptr, nullptr, nullptr, &st)));
    expectInvalid("references", after(b->references(nullptr, context, path, nullptr, nullptr, nullptr, &st)));
    expectInvalid("referenceNames", after(b->referenceNames(nullptr, context, path, nullptr, nullptr, &st)));
    expectInvalid("invokeMethod", after(b->invokeMethod(nullptr, context, path, "a", args, args, &st)));
    expectInvalid("setProperty", b->setProperty(nullptr, context, path, "a", nullptr, CMPI_uint16));
    expectInvalid("getProperty", after(b->getProperty(nullptr, context, path, "a", &st)));

    const auto* m = mb->mft;
    expectInvalid("mark", after(m->mark(nullptr, &st)));
    expectInvalid("release", m->release(nullptr, nullptr));
    EXPECT_EQ(nullptr, m->cmpiMalloc(nullptr, 1));
    EXPECT_EQ(nullptr, m->cmpiCalloc(nullptr, 1, 1));
    EXPECT_EQ(nullptr, m->cmpiRealloc(nullptr, nullptr, 1));
    EXPECT_EQ(nullptr, m->cmpiStrDup(nullptr, "a"));
    m->cmpiFree(nullptr, nullptr);
}

TEST_F(SlotsTest, NullNamesAndTextsAreInvalidParameters) {
    const auto expectRefused = [](const char* slot, const CMPIStatus& found) {
        EXPECT_EQ(CMPI_RC_ERR_INVALID_PARAMETER, found.rc) << slot;
    };
    const CMPIUint16 number = 5;
    expectRefused("setNameSpace", CMSetNameSpace(path, nullptr));
    expectRefused("setHostname", CMSetHostname(path, nullptr));
    expectRefused("setClassName", CMSetClassName(path, nullptr));
    expectRefused("addKey", CMAddKey(path, nullptr, &number, CMPI_uint16));
    expectRefused("getKey", after(CMGetKey(path, nullptr, &st)));
    expectRefused("getProperty", after(CMGetProperty(instance, nullptr, &st)));
    expectRefused("setProperty", CMSetProperty(instance, nullptr, &number, CMPI_uint16));
    expectRefused("addArg", CMAddArg(args, nullptr, &number, CMPI_uint16));
    expectRefused("getArg", after(CMGetArg(args, nullptr, &st)));
    expectRefused("getEntry", after(CMGetContextEntry(context, nullptr, &st)));
    expectRefused("addEntry", CMAddContextEntry(context, nullptr, &number, CMPI_uint16));
    expectRefused("setErrorSource", error->ft->setErrorSource(error, nullptr));
    expectRefused("newObjectPath", after(CMNewObjectPath(mb, nullptr, "a", &st)));
    expectRefused("newObjectPath", after(CMNewObjectPath(mb, "a", nullptr, &st)));
    expectRefused("newString", after(CMNewString(mb, nullptr, &st)));
    expectRefused("newDateTimeFromChars", after(CMNewDateTimeFromChars(mb, nullptr, &st)));
    expectRefused("classPathIsA", after(CMClassPathIsA(mb, path, nullptr, &st)));
    expectRefused("isOfType", after(CDIsOfType(mb, path, nullptr, &st)));
    expectRefused("logMessage", CMLogMessage(mb, CMPI_SEV_INFO, "id", nullptr, nullptr));
    expectRefused("trace", CMTraceMessage(mb, CMPI_LEV_INFO, "component", nullptr, nullptr));
    expectRefused("openMessageFile", CMOpenMessageFile(mb, "a", nullptr));
    expectRefused("execQuery", after(CBExecQuery(mb, context, path, nullptr, nullptr, &st)));
    expectRefused("invokeMethod", after(CBInvokeMethod(mb, context, path, nullptr, args, args, &st)));
    EXPECT_EQ(nullptr, mb->mft->cmpiStrDup(mb, nullptr));
    EXPECT_EQ(nullptr, mb->xft->resolveFileName(nullptr));
}

TEST_F(SlotsTest, StatusPointersMayBeNull) {
    EXPECT_EQ(nullptr, CMNewObjectPath(mb, nullptr, nullptr, nullptr));
    EXPECT_EQ(nullptr, CMNewInstance(mb, nullptr, nullptr));
    EXPECT_EQ(nullptr, CMNewSelectExp(mb, "a", "b", nullptr, nullptr));
    EXPECT_EQ(nullptr, CBEnumInstanceNames(mb, nullptr, path, nullptr));
    EXPECT_TRUE(CMIsNullValue(CMGetKey(path, "Missing", nullptr)));
    EXPECT_TRUE(CMIsNullValue(CMGetKey(path, nullptr, nullptr)));
    EXPECT_TRUE(CMIsNullValue(mb->bft->getProperty(mb, context, path, "a", nullptr)));
}

TEST_F(SlotsTest, ObjectsOfAnotherBrokerAreInvalidHandles) {
    CMPIObjectPathFT table = *path->ft;
    CMPIObjectPath foreign{path->hdl, &table};
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, path->ft->setNameSpace(&foreign, "a").rc);
    EXPECT_EQ(nullptr, CMNewInstance(mb, &foreign, &status));
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, status.rc);
    EXPECT_EQ(nullptr, CDGetType(mb, &foreign, &status));
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, status.rc);
}

TEST_F(SlotsTest, UnsupportedSlotsReportThat) {
    const auto expectUnsupported = [&](const char* slot, const CMPIStatus& found) {
        EXPECT_EQ(CMPI_RC_ERR_NOT_SUPPORTED, found.rc) << slot;
    };
    const auto* b = mb->bft;
    expectUnsupported("newSelectExp", after(CMNewSelectExp(mb, "SELECT * FROM A", "CIM:CQL", nullptr, &st)));
    expectUnsupported("getClassQualifier", after(CMGetClassQualifier(path, "a", &st)));
    expectUnsupported("getPropertyQualifier", after(CMGetPropertyQualifier(path, "a", "b", &st)));
    expectUnsupported("getMethodQualifier", after(CMGetMethodQualifier(path, "a", "b", &st)));
    expectUnsupported("getParameterQualifier", after(CMGetParameterQualifier(path, "a", "b", "c", &st)));
    expectUnsupported("result.clone", after(result.handle()->ft->clone(result.handle(), &st)));
    CMPIMsgFileHandle file = &st;
    expectUnsupported("openMessageFile", CMOpenMessageFile(mb, "messages", &file));
    EXPECT_EQ(nullptr, file);
    expectUnsupported("closeMessageFile", CMCloseMessageFile(mb, file));
    expectUnsupported("deliverIndication", b->deliverIndication(mb, context, "root/cimv2", instance));
    expectUnsupported("associators",
                      after(b->associators(mb, context, path, nullptr, nullptr, nullptr, nullptr, nullptr, &st)));
    expectUnsupported("associatorNames",
                      after(b->associatorNames(mb, context, path, nullptr, nullptr, nullptr, nullptr, &st)));
    expectUnsupported("references", after(b->references(mb, context, path, nullptr, nullptr, nullptr, &st)));
    expectUnsupported("referenceNames", after(b->referenceNames(mb, context, path, nullptr, nullptr, &st)));
    expectUnsupported("setProperty", b->setProperty(mb, context, path, "a", nullptr, CMPI_uint16));
    expectUnsupported("getProperty", after(b->getProperty(mb, context, path, "a", &st)));
    expectUnsupported("up-calls without operations", after(CBEnumInstanceNames(mb, context, path, &st)));
}

TEST_F(SlotsTest, TypesThatCannotBeKeptAreRefused) {
    CMPIValue value{};
    for (const CMPIType type : {CMPI_args, CMPI_class, CMPI_filter, CMPI_enumeration, CMPI_ptr, CMPI_charsptr, 77}) {
        EXPECT_EQ(CMPI_RC_ERR_INVALID_DATA_TYPE, CMAddKey(path, "Key", &value, type).rc) << type;
        EXPECT_EQ(nullptr, CMNewArray(mb, 1, type, &status)) << type;
        EXPECT_EQ(CMPI_RC_ERR_INVALID_DATA_TYPE, status.rc) << type;
    }
    EXPECT_EQ(0U, CMGetKeyCount(path, nullptr));
    EXPECT_EQ(nullptr, CMNewArray(mb, 0xffffffffU, CMPI_uint16, &status));
    EXPECT_EQ(CMPI_RC_ERR_INVALID_PARAMETER, status.rc);
}

} // namespace
} // namespace ObjectManager
