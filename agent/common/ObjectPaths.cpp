#include "Norv/Common.h"

#include "cmpimacs.h"

#include <algorithm>
#include <cstdint>
#include <optional>
#include <string_view>
#include <variant>

namespace Norv {

namespace {

/**
 * How deep references in the keys of references are followed. Deeper paths, such as one that refers to itself, count as
 * unequal.
 */
constexpr unsigned int deepestReference = 16;

/** Which parts of a path are compared beside its class name and keys. */
struct Extent {
    bool nameSpace;
    bool host;
};

/** An integer of any CMPI type, by its value. */
struct Integer {
    bool negative;
    std::uint64_t twosComplement;

    bool operator==(const Integer&) const = default;
};

struct Character {
    CMPIChar16 code;

    bool operator==(const Character&) const = default;
};

/**
 * The value of a key. Texts and paths belong to the object manager. A date and time is compared as text, since some
 * object managers store it so.
 */
using KeyValue = std::variant<bool, Integer, double, Character, std::string_view, const CMPIObjectPath*>;

struct Key {
    std::string_view name;
    KeyValue value;
};

/** CIM names are compared without regard to the case of ASCII letters, whatever the process's locale. */
bool areEqualNames(std::string_view left, std::string_view right) {
    const auto folded = [](char c) { return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c; };
    return std::ranges::equal(left, right, {}, folded, folded);
}

/** The text of a string object; no value if there is none. */
std::optional<std::string_view> textOf(const CMPIString* string) {
    const char* text = CMIsNullObject(string) ? nullptr : CMGetCharPtr(string);
    return text == nullptr ? std::nullopt : std::optional<std::string_view>(text);
}

using TextGetter = CMPIString* (*CMPIObjectPathFT::*)(const CMPIObjectPath*, CMPIStatus*);

/** A text of a path; empty if the path does not have it, no value if the object manager fails. */
std::optional<std::string_view> textOf(const CMPIObjectPath* path, TextGetter getter) {
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    const CMPIString* text = (path->ft->*getter)(path, &status);
    return status.rc == CMPI_RC_OK ? textOf(text).value_or("") : std::optional<std::string_view>();
}

template <typename Number>
Integer integer(Number number) {
    return {number < 0, static_cast<std::uint64_t>(number)};
}

/** The value of a key; no value if it is null, or of a type that keys cannot have. */
std::optional<KeyValue> valueOf(const CMPIData& data) {
    if ((data.state & ~CMPI_keyValue) != CMPI_goodValue) {
        return std::nullopt;
    }
    const CMPIValue& value = data.value;
    switch (data.type) {
    case CMPI_boolean:
        return value.boolean != 0;
    case CMPI_uint8:
        return integer(value.uint8);
    case CMPI_uint16:
        return integer(value.uint16);
    case CMPI_uint32:
        return integer(value.uint32);
    case CMPI_uint64:
        return integer(value.uint64);
    case CMPI_sint8:
        return integer(value.sint8);
    case CMPI_sint16:
        return integer(value.sint16);
    case CMPI_sint32:
        return integer(value.sint32);
    case CMPI_sint64:
        return integer(value.sint64);
    case CMPI_real32:
        return value.real32;
    case CMPI_real64:
        return value.real64;
    case CMPI_char16:
        return Character{value.char16};
    case CMPI_chars:
        return value.chars == nullptr ? std::nullopt : std::optional<KeyValue>(std::string_view(value.chars));
    case CMPI_string:
        return textOf(value.string);
    case CMPI_dateTime:
        return CMIsNullObject(value.dateTime) ? std::nullopt : textOf(CMGetStringFormat(value.dateTime, nullptr));
    case CMPI_ref:
        return value.ref;
    default:
        return std::nullopt;
    }
}

/** A key of a path; no value if the object manager fails, or the key has no usable value. */
std::optional<Key> keyAt(const CMPIObjectPath* path, CMPICount index) {
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    CMPIString* string = nullptr;
    const CMPIData data = CMGetKeyAt(path, index, &string, &status);
    if (status.rc != CMPI_RC_OK) {
        return std::nullopt;
    }
    const auto name = textOf(string);
    const auto value = valueOf(data);
    return name && value ? std::optional<Key>({*name, *value}) : std::nullopt;
}

/** The key of a given name. The search begins at index `likely`: most paths have their keys in the same order. */
std::optional<Key> findKey(const CMPIObjectPath* path, CMPICount count, std::string_view name, CMPICount likely) {
    for (CMPICount step = 0; step < count; ++step) {
        auto key = keyAt(path, (likely + step) % count);
        if (key && areEqualNames(key->name, name)) {
            return key;
        }
    }
    return std::nullopt;
}

bool areEqualPaths(const CMPIObjectPath* left, const CMPIObjectPath* right, Extent extent, Extent extentOfReferences,
                   unsigned int depth) {
    if (CMIsNullObject(left) || CMIsNullObject(right) || depth > deepestReference) {
        return false;
    }
    const auto haveEqual = [&](TextGetter getter) {
        const auto leftText = textOf(left, getter);
        const auto rightText = textOf(right, getter);
        return leftText && rightText && areEqualNames(*leftText, *rightText);
    };
    if (!haveEqual(&CMPIObjectPathFT::getClassName) ||
        (extent.nameSpace && !haveEqual(&CMPIObjectPathFT::getNameSpace)) ||
        (extent.host && !haveEqual(&CMPIObjectPathFT::getHostname))) {
        return false;
    }

    const auto areEqualValues = [&](const KeyValue& leftValue, const KeyValue& rightValue) {
        const auto* const leftPath = std::get_if<const CMPIObjectPath*>(&leftValue);
        const auto* const rightPath = std::get_if<const CMPIObjectPath*>(&rightValue);
        return leftPath != nullptr && rightPath != nullptr
                   ? areEqualPaths(*leftPath, *rightPath, extentOfReferences, extentOfReferences, depth + 1)
                   : leftValue == rightValue;
    };
    CMPIStatus leftStatus = {CMPI_RC_OK, nullptr};
    CMPIStatus rightStatus = {CMPI_RC_OK, nullptr};
    const CMPICount count = CMGetKeyCount(left, &leftStatus);
    if (CMGetKeyCount(right, &rightStatus) != count || leftStatus.rc != CMPI_RC_OK || rightStatus.rc != CMPI_RC_OK) {
        return false;
    }
    for (CMPICount index = 0; index < count; ++index) {
        const auto leftKey = keyAt(left, index);
        const auto rightKey = leftKey ? findKey(right, count, leftKey->name, index) : std::nullopt;
        if (!rightKey || !areEqualValues(leftKey->value, rightKey->value)) {
            return false;
        }
    }
    return true;
}

} // namespace

bool isObjPathsEqual(const CMPIObjectPath* left, const CMPIObjectPath* right, bool flag) {
    const Extent instance = {.nameSpace = true, .host = false};
    const Extent reference = {.nameSpace = !flag, .host = !flag};
    return areEqualPaths(left, right, instance, reference, 0);
}

} // namespace Norv
