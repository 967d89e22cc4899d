#include "Norv/Common.h"

#include "TestSupport.h"

#include "cmpift.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <deque>
#include <limits>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace {

using Norv::isObjPathsEqual;
using testing::UnorderedElementsAre;

/** A string of an object manager. */
class FakeString {
public:
    explicit FakeString(std::optional<std::string> text) : _text(std::move(text)) {}
    FakeString(const FakeString&) = delete;
    FakeString& operator=(const FakeString&) = delete;

    CMPIString* handle() { return &_handle; }

private:
    static const char* getCharPtr(const CMPIString* string, CMPIStatus*) {
        const auto* self = static_cast<const FakeString*>(string->hdl);
        return self->_text ? self->_text->c_str() : nullptr;
    }

    static constexpr CMPIStringFT table = {CMPIVersion200, nullptr, nullptr, getCharPtr};

    /** No value if the object returns a null pointer. */
    std::optional<std::string> _text;
    CMPIString _handle = {this, &table};
};

/** A date and time of an object manager. */
class FakeDateTime {
public:
    explicit FakeDateTime(const std::string& text) : _text(text) {}
    FakeDateTime(const FakeDateTime&) = delete;
    FakeDateTime& operator=(const FakeDateTime&) = delete;

    CMPIDateTime* handle() { return &_handle; }

private:
    static CMPIString* getStringFormat(const CMPIDateTime* dateTime, CMPIStatus*) {
        return static_cast<FakeDateTime*>(const_cast<void*>(static_cast<const void*>(dateTime->hdl)))->_text.handle();
    }

    static constexpr CMPIDateTimeFT table = {CMPIVersion200, nullptr, nullptr, nullptr, getStringFormat, nullptr};

    FakeString _text;
    CMPIDateTime _handle = {this, &table};
};

/** The call of the object path that fails. */
enum class Failure { none, className, nameSpace, hostName, keyCount, key };

/** An object path of an object manager, with only those functions that the comparison calls. */
class FakePath {
public:
    explicit FakePath(const char* className = "TALVO_PowerManagementService", const char* nameSpace = "root/cimv2",
                      const char* hostName = "host.example.org")
        : _className(text(className)), _nameSpace(text(nameSpace)), _hostName(text(hostName)) {}
    FakePath(const FakePath&) = delete;
    FakePath& operator=(const FakePath&) = delete;

    FakePath& key(const char* name, CMPIType type, const CMPIValue& value, CMPIValueState state = CMPI_keyValue) {
        _keys.push_back({text(name), {type, state, value}});
        return *this;
    }
    FakePath& key(const char* name, const char* value) {
        return key(name, CMPI_string, CMPIValue{.string = text(value)});
    }
    FakePath& key(const char* name, const FakePath& value) {
        return key(name, CMPI_ref, CMPIValue{.ref = &value._handle});
    }
    FakePath& fail(Failure failure) {
        _failure = failure;
        return *this;
    }

    operator const CMPIObjectPath*() const { return &_handle; }

private:
    struct Key {
        CMPIString* name;
        CMPIData data;
    };

    /** A null pointer if `value` is one: an object manager without such a text returns no object. */
    CMPIString* text(const char* value) {
        return value == nullptr ? nullptr : _strings.emplace_back(std::string(value)).handle();
    }

    static const FakePath& self(const CMPIObjectPath* path) { return *static_cast<const FakePath*>(path->hdl); }

    /** Sets the status. @return whether the call succeeds. */
    bool succeeds(Failure call, CMPIStatus* status) const {
        *status = {_failure == call ? CMPI_RC_ERR_FAILED : CMPI_RC_OK, nullptr};
        return _failure != call;
    }

    static CMPIString* getClassName(const CMPIObjectPath* path, CMPIStatus* status) {
        return self(path).succeeds(Failure::className, status) ? self(path)._className : nullptr;
    }
    static CMPIString* getNameSpace(const CMPIObjectPath* path, CMPIStatus* status) {
        return self(path).succeeds(Failure::nameSpace, status) ? self(path)._nameSpace : nullptr;
    }
    static CMPIString* getHostname(const CMPIObjectPath* path, CMPIStatus* status) {
        return self(path).succeeds(Failure::hostName, status) ? self(path)._hostName : nullptr;
    }
    static CMPICount getKeyCount(const CMPIObjectPath* path, CMPIStatus* status) {
        return self(path).succeeds(Failure::keyCount, status) ? static_cast<CMPICount>(self(path)._keys.size()) : 0;
    }
    static CMPIData getKeyAt(const CMPIObjectPath* path, CMPICount index, CMPIString** name, CMPIStatus* status) {
        if (!self(path).succeeds(Failure::key, status)) {
            return {CMPI_null, CMPI_nullValue, {}};
        }
        const Key& key = self(path)._keys.at(index);
        *name = key.name;
        return key.data;
    }

    static const CMPIObjectPathFT& table() {
        static const CMPIObjectPathFT table = [] {
            CMPIObjectPathFT slots = {};
            slots.ftVersion = CMPIVersion200;
            slots.getClassName = getClassName;
            slots.getNameSpace = getNameSpace;
            slots.getHostname = getHostname;
            slots.getKeyCount = getKeyCount;
            slots.getKeyAt = getKeyAt;
            return slots;
        }();
        return table;
    }

    std::deque<FakeString> _strings;
    CMPIString* _className;
    CMPIString* _nameSpace;
    CMPIString* _hostName;
    std::vector<Key> _keys;
    Failure _failure = Failure::none;
    mutable CMPIObjectPath _handle = {this, &table()};
};

/** Compares in both directions, with the flag and without. */
void expectEqual(const CMPIObjectPath* left, const CMPIObjectPath* right, bool expected) {
    for (const bool flag : {false, true}) {
        EXPECT_EQ(isObjPathsEqual(left, right, flag), expected) << "flag " << flag;
        EXPECT_EQ(isObjPathsEqual(right, left, flag), expected) << "flag " << flag << ", the other way round";
    }
}

TEST(CommonLibrary, ExportsItsFunctionsAndNothingElse) {
    EXPECT_THAT(
        AgentTest::exportedSymbols(ORV_COMMON_LIBRARY),
        UnorderedElementsAre("_ZN4Norv13getSystemNameB5cxx11Ev", "_ZN4Norv15isObjPathsEqualEPK15_CMPIObjectPathS2_b"));
}

TEST(ObjectPaths, AreEqualWithTheSameClassNamespaceAndKeys) {
    const FakePath bare;
    expectEqual(bare, bare, true);
    FakePath left;
    FakePath right;
    left.key("CreationClassName", "A").key("Name", "n");
    right.key("CreationClassName", "A").key("Name", "n");
    expectEqual(left, right, true);
}

TEST(ObjectPaths, AreEqualWhateverTheOrderOfTheirKeys) {
    FakePath left;
    FakePath right;
    left.key("A", "1").key("B", "2").key("C", "3");
    right.key("C", "3").key("A", "1").key("B", "2");
    expectEqual(left, right, true);
}

TEST(ObjectPaths, AreEqualWhateverTheCaseOfTheirNames) {
    FakePath left("TALVO_computerSYSTEM", "Root/CIMv2");
    FakePath right("talvo_COMPUTERsystem", "rOOT/cimV2");
    left.key("InstanceID", "x");
    right.key("iNSTANCEid", "x");
    expectEqual(left, right, true);
}

TEST(ObjectPaths, AreEqualWhateverTheirHosts) {
    expectEqual(FakePath("A", "n", "one"), FakePath("A", "n", "two"), true);
    expectEqual(FakePath("A", "n", nullptr), FakePath("A", "n", "two"), true);
}

TEST(ObjectPaths, DifferByClassOrNamespace) {
    expectEqual(FakePath("A"), FakePath("B"), false);
    expectEqual(FakePath("A"), FakePath("AB"), false);
    expectEqual(FakePath("A", "root/cimv2"), FakePath("A", "root/cimv3"), false);
    expectEqual(FakePath("A", nullptr), FakePath("A", "root/cimv2"), false);
    expectEqual(FakePath("A", nullptr), FakePath("A", nullptr), true);
    // Case is folded for ASCII letters only: these two characters differ in the bit that tells cases apart.
    expectEqual(FakePath("A@"), FakePath("A`"), false);
}

TEST(ObjectPaths, DifferByTheirKeys) {
    FakePath none;
    FakePath one;
    FakePath otherName;
    FakePath otherValue;
    FakePath otherCase;
    FakePath two;
    one.key("Name", "n");
    otherName.key("Names", "n");
    otherValue.key("Name", "nn");
    otherCase.key("Name", "N");
    two.key("Name", "n").key("Other", "n");
    for (const FakePath* other : {&none, &otherName, &otherValue, &otherCase, &two}) {
        expectEqual(one, *other, false);
    }
}

TEST(ObjectPaths, CompareTextsOfBothTypes) {
    std::string name = "n";
    FakePath string;
    FakePath chars;
    string.key("Name", "n");
    chars.key("Name", CMPI_chars, CMPIValue{.chars = name.data()});
    expectEqual(string, chars, true);
    name = "m";
    expectEqual(string, chars, false);
}

TEST(ObjectPaths, CompareDatesAndTimesByTheirText) {
    FakeDateTime time("20261120123107.000000+000");
    FakeDateTime later("20261120123108.000000+000");
    FakePath left;
    FakePath same;
    FakePath different;
    left.key("Time", CMPI_dateTime, CMPIValue{.dateTime = time.handle()});
    same.key("Time", "20261120123107.000000+000");
    different.key("Time", CMPI_dateTime, CMPIValue{.dateTime = later.handle()});
    expectEqual(left, left, true);
    expectEqual(left, same, true);
    expectEqual(left, different, false);
}

struct TypedKey {
    CMPIType type;
    CMPIValue value;
    /** Keys with the same text are equal, and no others. */
    std::string meaning;
};

TEST(ObjectPaths, CompareValuesOfEveryType) {
    const std::vector<TypedKey> keys = {
        {CMPI_boolean, {.boolean = 0}, "false"},
        {CMPI_boolean, {.boolean = 1}, "true"},
        {CMPI_boolean, {.boolean = 2}, "true"},
        {CMPI_uint8, {.uint8 = 1}, "1"},
        {CMPI_uint16, {.uint16 = 1}, "1"},
        {CMPI_uint32, {.uint32 = 1}, "1"},
        {CMPI_uint64, {.uint64 = 1}, "1"},
        {CMPI_sint8, {.sint8 = 1}, "1"},
        {CMPI_sint16, {.sint16 = 1}, "1"},
        {CMPI_sint32, {.sint32 = 1}, "1"},
        {CMPI_sint64, {.sint64 = 1}, "1"},
        {CMPI_sint8, {.sint8 = -1}, "-1"},
        {CMPI_sint16, {.sint16 = -1}, "-1"},
        {CMPI_sint32, {.sint32 = -1}, "-1"},
        {CMPI_sint64, {.sint64 = -1}, "-1"},
        {CMPI_uint8, {.uint8 = 255}, "255"},
        {CMPI_uint64, {.uint64 = std::numeric_limits<CMPIUint64>::max()}, "largest"},
        {CMPI_real32, {.real32 = 0.5F}, "0.5"},
        {CMPI_real64, {.real64 = 0.5}, "0.5"},
        {CMPI_real64, {.real64 = 1.0}, "real 1"},
        {CMPI_char16, {.char16 = 1}, "character 1"},
        {CMPI_char16, {.char16 = 'n'}, "character n"},
    };
    for (const TypedKey& left : keys) {
        for (const TypedKey& right : keys) {
            FakePath leftPath;
            FakePath rightPath;
            leftPath.key("Key", left.type, left.value);
            rightPath.key("Key", right.type, right.value);
            SCOPED_TRACE(std::to_string(left.type) + ' ' + left.meaning + ", " + std::to_string(right.type) + ' ' +
                         right.meaning);
            expectEqual(leftPath, rightPath, left.meaning == right.meaning);
        }
    }
}

TEST(ObjectPaths, AreUnequalWhereAKeyHasNoUsableValue) {
    FakeString nothing(std::nullopt);
    CMPIString empty = {nullptr, nullptr};
    CMPIDateTime noTime = {nullptr, nullptr};
    CMPIObjectPath noPath = {nullptr, nullptr};
    const std::vector<CMPIData> values = {
        {CMPI_string, CMPI_keyValue, {.string = nullptr}},
        {CMPI_string, CMPI_keyValue, {.string = &empty}},
        {CMPI_string, CMPI_keyValue, {.string = nothing.handle()}},
        {CMPI_chars, CMPI_keyValue, {.chars = nullptr}},
        {CMPI_dateTime, CMPI_keyValue, {.dateTime = nullptr}},
        {CMPI_dateTime, CMPI_keyValue, {.dateTime = &noTime}},
        {CMPI_ref, CMPI_keyValue, {.ref = nullptr}},
        {CMPI_ref, CMPI_keyValue, {.ref = &noPath}},
        {CMPI_uint32, CMPI_keyValue | CMPI_nullValue, {.uint32 = 1}},
        {CMPI_uint32, CMPI_notFound, {.uint32 = 1}},
        {CMPI_uint32, CMPI_badValue, {.uint32 = 1}},
        {CMPI_uint32A, CMPI_keyValue, {.array = nullptr}},
        {CMPI_null, CMPI_keyValue, {}},
    };
    for (const CMPIData& data : values) {
        SCOPED_TRACE(std::to_string(data.type) + ", state " + std::to_string(data.state));
        FakePath path;
        path.key("Key", data.type, data.value, data.state);
        expectEqual(path, path, false);
    }
}

TEST(ObjectPaths, AreUnequalWhereAKeyHasNoName) {
    FakePath path;
    path.key(nullptr, "n");
    expectEqual(path, path, false);
}

TEST(ObjectPaths, ThatHoldNothingEqualNoPath) {
    const FakePath path;
    const CMPIObjectPath empty = {nullptr, nullptr};
    expectEqual(nullptr, nullptr, false);
    expectEqual(nullptr, path, false);
    expectEqual(&empty, &empty, false);
    expectEqual(&empty, path, false);
}

TEST(ObjectPaths, AreUnequalWhereTheObjectManagerFails) {
    for (const Failure failure : {Failure::className, Failure::nameSpace, Failure::keyCount, Failure::key}) {
        SCOPED_TRACE(static_cast<int>(failure));
        FakePath whole;
        FakePath failing;
        whole.key("Name", "n");
        failing.key("Name", "n").fail(failure);
        expectEqual(failing, whole, false);
        expectEqual(failing, failing, false);
    }
}

struct Reference {
    const char* name;
    const char* className;
    const char* nameSpace;
    const char* hostName;
    const char* value;
    bool equal;
    bool equalWithFlag;
};

class ObjectPathReferences : public testing::TestWithParam<Reference> {};

TEST_P(ObjectPathReferences, AreComparedAsPaths) {
    FakePath leftEnd("A", "root/cimv2", "host");
    FakePath rightEnd(GetParam().className, GetParam().nameSpace, GetParam().hostName);
    leftEnd.key("Name", "n");
    rightEnd.key("Name", GetParam().value);
    FakePath left;
    FakePath right;
    left.key("Antecedent", leftEnd).key("Dependent", leftEnd);
    right.key("Antecedent", leftEnd).key("Dependent", rightEnd);
    EXPECT_EQ(isObjPathsEqual(left, right, false), GetParam().equal);
    EXPECT_EQ(isObjPathsEqual(right, left, false), GetParam().equal);
    EXPECT_EQ(isObjPathsEqual(left, right, true), GetParam().equalWithFlag);
    EXPECT_EQ(isObjPathsEqual(right, left, true), GetParam().equalWithFlag);
}

INSTANTIATE_TEST_SUITE_P(All, ObjectPathReferences,
                         testing::Values(Reference{"Same", "A", "root/cimv2", "host", "n", true, true},
                                         Reference{"Case", "a", "ROOT/cimv2", "HOST", "n", true, true},
                                         Reference{"Class", "B", "root/cimv2", "host", "n", false, false},
                                         Reference{"Value", "A", "root/cimv2", "host", "N", false, false},
                                         Reference{"Namespace", "A", "root/other", "host", "n", false, true},
                                         Reference{"NoNamespace", "A", nullptr, "host", "n", false, true},
                                         Reference{"Host", "A", "root/cimv2", "other", "n", false, true},
                                         Reference{"NoHost", "A", "root/cimv2", nullptr, "n", false, true}),
                         [](const auto& each) { return each.param.name; });

TEST(ObjectPaths, DifferByTheirOwnNamespaceEvenWithTheFlag) {
    EXPECT_FALSE(isObjPathsEqual(FakePath("A", "root/cimv2"), FakePath("A", "root/other"), true));
}

TEST(ObjectPaths, AreUnequalWhereTheHostOfAReferenceCannotBeRead) {
    FakePath end;
    FakePath failing;
    failing.fail(Failure::hostName);
    FakePath left;
    FakePath right;
    left.key("End", end);
    right.key("End", failing);
    EXPECT_FALSE(isObjPathsEqual(left, right, false));
    EXPECT_TRUE(isObjPathsEqual(left, right, true));
}

TEST(ObjectPaths, DifferWhereOneHasAReferenceAndTheOtherNone) {
    FakePath end;
    FakePath left;
    FakePath right;
    left.key("End", end);
    right.key("End", "n");
    expectEqual(left, right, false);
}

TEST(ObjectPaths, AreFollowedThroughReferencesInReferences) {
    std::deque<FakePath> left;
    std::deque<FakePath> right;
    for (int depth = 0; depth <= 16; ++depth) {
        for (auto* chain : {&left, &right}) {
            FakePath& path = chain->emplace_back();
            if (depth > 0) {
                path.key("End", (*chain)[chain->size() - 2]);
            }
        }
    }
    expectEqual(left.back(), right.back(), true);
    left.front().key("Name", "n");
    expectEqual(left.back(), right.back(), false);
}

TEST(ObjectPaths, ThatReferToThemselvesAreUnequal) {
    FakePath path;
    path.key("Left", path).key("Right", path);
    expectEqual(path, path, false);
}

} // namespace
