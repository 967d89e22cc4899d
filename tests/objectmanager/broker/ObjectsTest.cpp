/* Tests what paths, instances, arguments, contexts, arrays and errors keep of the data that they are given. */
#include "RequestTest.h"

#include <array>

namespace ObjectManager {
namespace {

class ObjectPathTest : public RequestTest {
protected:
    CMPIObjectPath* path = newPath();
};

TEST_F(ObjectPathTest, KeepsHostNamespaceAndClass) {
    EXPECT_EQ("root/cimv2", text(CMGetNameSpace(path, nullptr)));
    EXPECT_EQ("Test_Disk", text(CMGetClassName(path, nullptr)));
    EXPECT_EQ("", text(CMGetHostname(path, &status)));
    EXPECT_EQ(CMPI_RC_OK, status.rc);
    CMSetNameSpace(path, "root/interop");
    CMSetClassName(path, "Test_Tape");
    CMSetHostname(path, "host.example");
    EXPECT_EQ("root/interop", text(CMGetNameSpace(path, nullptr)));
    EXPECT_EQ("Test_Tape", text(CMGetClassName(path, nullptr)));
    EXPECT_EQ("host.example", text(CMGetHostname(path, nullptr)));
}

TEST_F(ObjectPathTest, TakesNamespaceAndHostFromAnotherPath) {
    CMSetNameSpace(path, "root/interop");
    CMSetHostname(path, "host.example");
    CMPIObjectPath* other = newPath();
    EXPECT_EQ(CMPI_RC_OK, CMSetNameSpaceFromObjectPath(other, path).rc);
    EXPECT_EQ("root/interop", text(CMGetNameSpace(other, nullptr)));
    EXPECT_EQ("", text(CMGetHostname(other, nullptr)));
    EXPECT_EQ(CMPI_RC_OK, CMSetHostAndNameSpaceFromObjectPath(other, path).rc);
    EXPECT_EQ("host.example", text(CMGetHostname(other, nullptr)));
    EXPECT_EQ(CMPI_RC_OK, CMSetHostAndNameSpaceFromObjectPath(other, other).rc);
    EXPECT_EQ("root/interop", text(CMGetNameSpace(other, nullptr)));
}

TEST_F(ObjectPathTest, KeysAreFoundByNameInAnyLetterCase) {
    CMAddKey(path, "Name", "a", CMPI_chars);
    const CMPIData key = CMGetKey(path, "NAME", &status);
    EXPECT_EQ("a", text(key));
    EXPECT_EQ(CMPI_keyValue, key.state);
}

TEST_F(ObjectPathTest, AddingAKeyAgainReplacesIt) {
    CMAddKey(path, "Name", "a", CMPI_chars);
    CMAddKey(path, "System", "s", CMPI_chars);
    CMAddKey(path, "name", "b", CMPI_chars);
    EXPECT_EQ(2U, CMGetKeyCount(path, nullptr));
    EXPECT_EQ("b", text(CMGetKey(path, "Name", nullptr)));
}

TEST_F(ObjectPathTest, KeysAreInTheOrderInWhichTheyWereAdded) {
    std::vector<std::string> names;
    for (const char* name : {"E", "D", "C", "B", "A", "F"}) {
        CMAddKey(path, name, name, CMPI_chars);
    }
    for (CMPICount i = 0; i < CMGetKeyCount(path, nullptr); ++i) {
        CMPIString* name = nullptr;
        const std::string value = text(CMGetKeyAt(path, i, &name, nullptr));
        EXPECT_EQ(text(name), value);
        names.push_back(text(name));
    }
    EXPECT_THAT(names, testing::ElementsAre("E", "D", "C", "B", "A", "F"));
}

TEST_F(ObjectPathTest, AMissingKeyIsNoSuchProperty) {
    CMPIData key = CMGetKey(path, "Name", &status);
    EXPECT_EQ(CMPI_RC_ERR_NO_SUCH_PROPERTY, status.rc);
    EXPECT_EQ(CMPI_nullValue | CMPI_notFound, key.state);
    EXPECT_EQ(nullptr, key.value.string);
    key = CMGetKeyAt(path, 0, nullptr, &status);
    EXPECT_EQ(CMPI_RC_ERR_NO_SUCH_PROPERTY, status.rc);
    EXPECT_TRUE(CMIsNullValue(key));
}

TEST_F(ObjectPathTest, KnowsItsClassesAncestors) {
    EXPECT_TRUE(CMClassPathIsA(mb, path, "CIM_Disk", &status));
    EXPECT_EQ(CMPI_RC_OK, status.rc);
    EXPECT_TRUE(CMClassPathIsA(mb, path, "test_disk", nullptr));
    EXPECT_FALSE(CMClassPathIsA(mb, path, "CIM_Tape", &status));
    EXPECT_EQ(CMPI_RC_OK, status.rc);
}

TEST_F(ObjectPathTest, IsTextForPeople) {
    CMSetHostname(path, "host");
    CMAddKey(path, "Name", "a \"b\"", CMPI_chars);
    const CMPIUint16 number = 5;
    CMAddKey(path, "Number", &number, CMPI_uint16);
    EXPECT_EQ("//host/root/cimv2:Test_Disk.Name=\"a \\\"b\\\"\",Number=5", text(CMObjectPathToString(path, nullptr)));
}

class InstanceTest : public RequestTest {
protected:
    CMPIInstance* instance = newInstance();

    std::vector<std::string> propertyNames() {
        std::vector<std::string> names;
        for (CMPICount i = 0; i < CMGetPropertyCount(instance, nullptr); ++i) {
            CMPIString* name = nullptr;
            CMGetPropertyAt(instance, i, &name, nullptr);
            names.push_back(text(name));
        }
        return names;
    }

    void setProperties(const std::vector<const char*>& names) {
        for (const char* name : names) {
            EXPECT_EQ(CMPI_RC_OK, CMSetProperty(instance, name, name, CMPI_chars).rc);
        }
    }

    std::vector<std::pair<std::string, std::string>> pathKeys() {
        std::vector<std::pair<std::string, std::string>> keys;
        const CMPIObjectPath* path = CMGetObjectPath(instance, nullptr);
        for (CMPICount i = 0; i < CMGetKeyCount(path, nullptr); ++i) {
            CMPIString* name = nullptr;
            const std::string value = text(CMGetKeyAt(path, i, &name, nullptr));
            keys.emplace_back(text(name), value);
        }
        return keys;
    }
};

TEST_F(InstanceTest, KeepsPropertiesInTheOrderInWhichTheyWereSet) {
    setProperties({"Size", "Name", "Vendor", "Model", "Serial"});
    EXPECT_THAT(propertyNames(), testing::ElementsAre("Size", "Name", "Vendor", "Model", "Serial"));
    EXPECT_EQ("Vendor", text(CMGetProperty(instance, "vendor", &status)));
    EXPECT_EQ(CMPI_RC_OK, status.rc);
}

TEST_F(InstanceTest, SettingAPropertyAgainReplacesIt) {
    setProperties({"Size", "Name"});
    CMSetPropertyWithOrigin(instance, "SIZE", "large", CMPI_chars, "CIM_Disk");
    EXPECT_THAT(propertyNames(), testing::ElementsAre("Size", "Name"));
    EXPECT_EQ("large", text(CMGetProperty(instance, "Size", nullptr)));
}

TEST_F(InstanceTest, AMissingPropertyIsNoSuchProperty) {
    EXPECT_TRUE(CMIsNullValue(CMGetProperty(instance, "Size", &status)));
    EXPECT_EQ(CMPI_RC_ERR_NO_SUCH_PROPERTY, status.rc);
    CMGetPropertyAt(instance, 0, nullptr, &status);
    EXPECT_EQ(CMPI_RC_ERR_NO_SUCH_PROPERTY, status.rc);
}

TEST_F(InstanceTest, AFilterKeepsKeysAndListedProperties) {
    std::array<const char*, 2> properties = {"size", nullptr};
    std::array<const char*, 3> keys = {"Name", "System", nullptr};
    CMSetPropertyFilter(instance, properties.data(), keys.data());
    setProperties({"Name", "Size", "Vendor", "SYSTEM"});
    EXPECT_THAT(propertyNames(), testing::ElementsAre("Name", "Size", "SYSTEM"));
}

TEST_F(InstanceTest, AnEmptyFilterKeepsKeysOnly) {
    std::array<const char*, 1> properties = {nullptr};
    std::array<const char*, 2> keys = {"Name", nullptr};
    CMSetPropertyFilter(instance, properties.data(), keys.data());
    setProperties({"Name", "Size"});
    EXPECT_THAT(propertyNames(), testing::ElementsAre("Name"));
}

TEST_F(InstanceTest, WithoutAListThereIsNoFilter) {
    std::array<const char*, 2> properties = {"Size", nullptr};
    CMSetPropertyFilter(instance, properties.data(), nullptr);
    std::array<const char*, 2> keys = {"Name", nullptr};
    CMSetPropertyFilter(instance, nullptr, keys.data());
    setProperties({"Name", "Vendor"});
    EXPECT_THAT(propertyNames(), testing::ElementsAre("Name", "Vendor"));
}

TEST_F(InstanceTest, APathWithoutKeysTakesThemFromTheProperties) {
    setProperties({"Name", "Size", "System"});
    EXPECT_THAT(pathKeys(), testing::ElementsAre(testing::Pair("System", "System"), testing::Pair("Name", "Name")));
}

TEST_F(InstanceTest, APathStaysWithoutKeysIfAKeyPropertyIsNotSet) {
    setProperties({"Name", "Size"});
    EXPECT_THAT(pathKeys(), testing::IsEmpty());
}

TEST_F(InstanceTest, APathOfAnUnknownClassTakesTheKeysOfTheFilter) {
    instance = CMNewInstance(mb, CMNewObjectPath(mb, "root/cimv2", "Test_Unknown", nullptr), nullptr);
    std::array<const char*, 2> keys = {"Id", nullptr};
    CMSetPropertyFilter(instance, nullptr, keys.data());
    setProperties({"Id", "Size"});
    EXPECT_THAT(pathKeys(), testing::ElementsAre(testing::Pair("Id", "Id")));
}

TEST_F(InstanceTest, APathWithKeysKeepsThem) {
    CMPIObjectPath* path = newPath();
    CMAddKey(path, "Name", "given", CMPI_chars);
    EXPECT_EQ(CMPI_RC_OK, CMSetObjectPath(instance, path).rc);
    setProperties({"Name", "System"});
    EXPECT_THAT(pathKeys(), testing::ElementsAre(testing::Pair("Name", "given")));
}

TEST_F(InstanceTest, ThePathIsACopy) {
    CMSetNameSpace(CMGetObjectPath(instance, nullptr), "root/elsewhere");
    EXPECT_EQ("root/cimv2", text(CMGetNameSpace(CMGetObjectPath(instance, nullptr), nullptr)));
}

class NamedValuesTest : public RequestTest {};

TEST_F(NamedValuesTest, ArgumentsAreFoundByNameAndPosition) {
    const CMPIArgs* args = CMNewArgs(mb, nullptr);
    const CMPIUint16 state = 5;
    CMAddArg(args, "PowerState", &state, CMPI_uint16);
    CMAddArg(args, "Time", "now", CMPI_chars);
    CMAddArg(args, "powerstate", &state, CMPI_uint16);
    EXPECT_EQ(2U, CMGetArgCount(args, &status));
    EXPECT_EQ(CMPI_RC_OK, status.rc);
    EXPECT_EQ(5, CMGetArg(args, "POWERSTATE", &status).value.uint16);
    CMPIString* name = nullptr;
    EXPECT_EQ("now", text(CMGetArgAt(args, 1, &name, nullptr)));
    EXPECT_EQ("Time", text(name));
    CMGetArg(args, "TimeoutPeriod", &status);
    EXPECT_EQ(CMPI_RC_ERR_NO_SUCH_PROPERTY, status.rc);
}

TEST_F(NamedValuesTest, ContextsHaveEntries) {
    const CMPIContext* context = request.context({{CMPIPrincipal, stringValue("root")}});
    const CMPIUint32 flags = CMPI_FLAG_LocalOnly;
    EXPECT_EQ(CMPI_RC_OK, CMAddContextEntry(context, CMPIInvocationFlags, &flags, CMPI_uint32).rc);
    EXPECT_EQ(2U, CMGetContextEntryCount(context, nullptr));
    EXPECT_EQ("root", text(CMGetContextEntry(context, CMPIPrincipal, nullptr)));
    CMPIString* name = nullptr;
    EXPECT_EQ(1U, CMGetContextEntryAt(context, 1, &name, nullptr).value.uint32);
    EXPECT_EQ(CMPIInvocationFlags, text(name));
    CMGetContextEntry(context, CMPIRole, &status);
    EXPECT_EQ(CMPI_RC_ERR_NO_SUCH_PROPERTY, status.rc);
}

class ArrayTest : public RequestTest {};

TEST_F(ArrayTest, BeginsWithNullElements) {
    const CMPIArray* array = CMNewArray(mb, 3, CMPI_uint16, nullptr);
    EXPECT_EQ(3U, CMGetArrayCount(array, nullptr));
    EXPECT_EQ(CMPI_uint16, CMGetArrayType(array, nullptr));
    const CMPIData element = CMGetArrayElementAt(array, 2, &status);
    EXPECT_EQ(CMPI_RC_OK, status.rc);
    EXPECT_TRUE(CMIsNullValue(element));
    EXPECT_EQ(CMPI_uint16, element.type);
}

TEST_F(ArrayTest, KeepsElements) {
    const CMPIArray* array = CMNewArray(mb, 2, CMPI_chars, nullptr);
    EXPECT_EQ(CMPI_string, CMGetArrayType(array, nullptr));
    EXPECT_EQ(CMPI_RC_OK, CMSetArrayElementAt(array, 1, "first", CMPI_chars).rc);
    EXPECT_EQ(CMPI_RC_OK, CMSetArrayElementAt(array, 1, "second", CMPI_chars).rc);
    EXPECT_EQ("second", text(CMGetArrayElementAt(array, 1, nullptr)));
    EXPECT_TRUE(CMIsNullValue(CMGetArrayElementAt(array, 0, nullptr)));
}

TEST_F(ArrayTest, RefusesElementsOfAnotherTypeAndPositionsBeyondItsEnd) {
    const CMPIArray* array = CMNewArray(mb, 1, CMPI_uint16, nullptr);
    const CMPIUint32 number = 5;
    EXPECT_EQ(CMPI_RC_ERR_TYPE_MISMATCH, CMSetArrayElementAt(array, 0, &number, CMPI_uint32).rc);
    EXPECT_EQ(CMPI_RC_ERR_TYPE_MISMATCH, CMSetArrayElementAt(array, 0, "text", CMPI_chars).rc);
    EXPECT_EQ(CMPI_RC_ERR_INVALID_DATA_TYPE, CMSetArrayElementAt(array, 0, &number, CMPI_ptr).rc);
    EXPECT_EQ(CMPI_RC_ERR_NO_SUCH_PROPERTY, CMSetArrayElementAt(array, 1, &number, CMPI_uint16).rc);
    CMGetArrayElementAt(array, 1, &status);
    EXPECT_EQ(CMPI_RC_ERR_NO_SUCH_PROPERTY, status.rc);
}

TEST_F(ArrayTest, TakesTextsOnlyWithTheTypeThatItWasMadeFor) {
    CMPIValue value = {};
    value.string = CMNewString(mb, "text", nullptr);
    const CMPIArray* strings = CMNewArray(mb, 1, CMPI_string, nullptr);
    EXPECT_EQ(CMPI_RC_ERR_TYPE_MISMATCH, CMSetArrayElementAt(strings, 0, "text", CMPI_chars).rc);
    EXPECT_TRUE(CMIsNullValue(CMGetArrayElementAt(strings, 0, nullptr)));
    EXPECT_EQ(CMPI_RC_OK, CMSetArrayElementAt(strings, 0, &value, CMPI_string).rc);
    EXPECT_EQ("text", text(CMGetArrayElementAt(strings, 0, nullptr)));

    CMPIArray* chars = CMClone(CMNewArray(mb, 1, CMPI_chars, nullptr), nullptr);
    EXPECT_EQ(CMPI_RC_ERR_TYPE_MISMATCH, CMSetArrayElementAt(chars, 0, &value, CMPI_string).rc);
    EXPECT_EQ(CMPI_RC_OK, CMSetArrayElementAt(chars, 0, "text", CMPI_chars).rc);
    EXPECT_EQ("text", text(CMGetArrayElementAt(chars, 0, nullptr)));
    CMRelease(chars);
}

TEST_F(ArrayTest, TakesNullsOfItsOwnTypeOrOfNone) {
    const CMPIArray* array = CMNewArray(mb, 1, CMPI_uint16, nullptr);
    const CMPIUint16 number = 5;
    EXPECT_EQ(CMPI_RC_ERR_TYPE_MISMATCH, CMSetArrayElementAt(array, 0, nullptr, CMPI_uint32).rc);
    for (const CMPIType type : {CMPI_uint16, CMPI_null}) {
        EXPECT_EQ(CMPI_RC_OK, CMSetArrayElementAt(array, 0, &number, CMPI_uint16).rc);
        EXPECT_EQ(CMPI_RC_OK, CMSetArrayElementAt(array, 0, nullptr, type).rc);
        const CMPIData element = CMGetArrayElementAt(array, 0, nullptr);
        EXPECT_TRUE(CMIsNullValue(element));
        EXPECT_EQ(CMPI_uint16, element.type);
    }
}

TEST_F(ArrayTest, MayBeEmpty) {
    const CMPIArray* array = CMNewArray(mb, 0, CMPI_string, &status);
    EXPECT_EQ(CMPI_RC_OK, status.rc);
    EXPECT_EQ(0U, CMGetArrayCount(array, nullptr));
}

class ErrorTest : public RequestTest {
protected:
    CMPIError* error = CMNewCMPIError(mb, "owner", "ID1", "the disk is full", ErrorSevHigh, ErrorProbCauseOther,
                                      CMPI_RC_ERR_FAILED, nullptr);

    CMPIArray* texts(const char* only) {
        CMPIArray* array = CMNewArray(mb, 1, CMPI_chars, nullptr);
        CMSetArrayElementAt(array, 0, only, CMPI_chars);
        return array;
    }
};

TEST_F(ErrorTest, KeepsTheValuesThatItWasMadeWith) {
    EXPECT_EQ("owner", text(error->ft->getOwningEntity(error, nullptr)));
    EXPECT_EQ("ID1", text(error->ft->getMessageID(error, nullptr)));
    EXPECT_EQ("the disk is full", text(error->ft->getMessage(error, nullptr)));
    EXPECT_EQ(ErrorSevHigh, error->ft->getPerceivedSeverity(error, nullptr));
    EXPECT_EQ(ErrorProbCauseOther, error->ft->getProbableCause(error, nullptr));
    EXPECT_EQ(CMPI_RC_ERR_FAILED, error->ft->getCIMStatusCode(error, &status));
    EXPECT_EQ(CMPI_RC_OK, status.rc);
}

TEST_F(ErrorTest, KeepsTheValuesThatAreSet) {
    error->ft->setErrorType(error, HardwareErrorType);
    error->ft->setErrorSourceFormat(error, CIMErrorSrcFormatCIMObjectPath);
    error->ft->setOtherErrorType(error, "other");
    error->ft->setProbableCauseDescription(error, "cause");
    error->ft->setErrorSource(error, "source");
    error->ft->setOtherErrorSourceFormat(error, "format");
    error->ft->setCIMStatusCodeDescription(error, "code");
    error->ft->setRecommendedActions(error, texts("delete files"));
    error->ft->setMessageArguments(error, texts("overwritten"));
    error->ft->setMessageArguments(error, texts("disk"));

    CMPIError* cloned = CMClone(error, nullptr);
    CMRelease(error);
    EXPECT_EQ(HardwareErrorType, cloned->ft->getErrorType(cloned, nullptr));
    EXPECT_EQ(CIMErrorSrcFormatCIMObjectPath, cloned->ft->getErrorSourceFormat(cloned, nullptr));
    EXPECT_EQ("other", text(cloned->ft->getOtherErrorType(cloned, nullptr)));
    EXPECT_EQ("cause", text(cloned->ft->getProbableCauseDescription(cloned, nullptr)));
    EXPECT_EQ("source", text(cloned->ft->getErrorSource(cloned, nullptr)));
    EXPECT_EQ("format", text(cloned->ft->getOtherErrorSourceFormat(cloned, nullptr)));
    EXPECT_EQ("code", text(cloned->ft->getCIMStatusCodeDescription(cloned, nullptr)));
    EXPECT_EQ("delete files",
              text(CMGetArrayElementAt(cloned->ft->getRecommendedActions(cloned, nullptr), 0, nullptr)));
    EXPECT_EQ("disk", text(CMGetArrayElementAt(cloned->ft->getMessageArguments(cloned, nullptr), 0, nullptr)));
    CMRelease(cloned);
}

TEST_F(ErrorTest, BeginsWithoutActionsAndArguments) {
    EXPECT_EQ(0U, CMGetArrayCount(error->ft->getRecommendedActions(error, nullptr), &status));
    EXPECT_EQ(CMPI_RC_OK, status.rc);
    EXPECT_EQ(CMPI_string, CMGetArrayType(error->ft->getMessageArguments(error, nullptr), nullptr));
}

TEST_F(ErrorTest, TakesArraysOfStringsOnly) {
    EXPECT_EQ(CMPI_RC_ERR_TYPE_MISMATCH,
              error->ft->setRecommendedActions(error, CMNewArray(mb, 1, CMPI_uint16, nullptr)).rc);
}

} // namespace
} // namespace ObjectManager
