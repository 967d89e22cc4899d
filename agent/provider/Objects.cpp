#include "provider/Objects.h"

#include "provider/BrokerCalls.h"

#include <algorithm>

#include <strings.h>

namespace Norv::Provider {

namespace {

/* Brokers get a pointer to a whole CMPIValue, since some copy all of it; for CMPI_chars, they get the text itself. */

/** A value and its type. For CMPI_chars, the pointer to the value points to the text. */
struct Typed {
    CMPIType type;
    CMPIValue value = {};
    const char* text = nullptr;

    const CMPIValue* get() const { return text == nullptr ? &value : reinterpret_cast<const CMPIValue*>(text); }
};

/** Makes the values of the properties of one object. */
class Maker {
public:
    Maker(const CMPIBroker* broker, const std::string& property) : _broker(broker), _property(property) {}

    Typed operator()(const std::string& text) const { return {CMPI_chars, {}, text.c_str()}; }

    Typed operator()(bool flag) const {
        Typed made{CMPI_boolean};
        made.value.boolean = static_cast<CMPIBoolean>(flag);
        return made;
    }

    Typed operator()(CMPIUint16 number) const {
        Typed made{CMPI_uint16};
        made.value.uint16 = number;
        return made;
    }

    Typed operator()(const Path& path) const {
        Typed made{CMPI_ref};
        made.value.ref = newPath(_broker, path);
        return made;
    }

    /** The elements are string objects: in arrays, object managers do not convert CMPI_chars. */
    Typed operator()(const std::vector<std::string>& texts) const {
        return array(texts, CMPI_string, [this](const std::string& text) {
            CMPIValue value = {};
            value.string = requireObject("newString for " + _property, [&](CMPIStatus* status) {
                return CMNewString(_broker, text.c_str(), status);
            });
            return value;
        });
    }

    Typed operator()(const std::vector<CMPIUint16>& numbers) const {
        return array(numbers, CMPI_uint16, [this](CMPIUint16 number) { return (*this)(number).value; });
    }

private:
    template <typename Elements, typename ValueOf>
    Typed array(const Elements& elements, CMPIType type, ValueOf valueOf) const {
        const auto count = static_cast<CMPICount>(elements.size());
        CMPIArray* const made = requireObject(
            "newArray for " + _property, [&](CMPIStatus* status) { return CMNewArray(_broker, count, type, status); });
        for (CMPICount i = 0; i < count; ++i) {
            const CMPIValue element = valueOf(elements[i]);
            require("setElementAt(" + std::to_string(i) + ") for " + _property,
                    CMSetArrayElementAt(made, i, &element, type));
        }
        Typed typed{static_cast<CMPIType>(type | CMPI_ARRAY)};
        typed.value.array = made;
        return typed;
    }

    const CMPIBroker* _broker;
    const std::string& _property;
};

Typed made(const CMPIBroker* broker, const Property& property) {
    return std::visit(Maker(broker, property.name), property.value);
}

void setProperties(const CMPIBroker* broker, const CMPIInstance* instance, const std::vector<Property>& properties) {
    for (const Property& property : properties) {
        const Typed value = made(broker, property);
        require("setProperty(" + property.name + ')',
                CMSetProperty(instance, property.name.c_str(), value.get(), value.type));
    }
}

std::string classNameOf(const CMPIObjectPath* path) {
    return requireText("getClassName", [&](CMPIStatus* status) { return CMGetClassName(path, status); });
}

CMPICount keyCountOf(const CMPIObjectPath* path) {
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    const CMPICount count = CMGetKeyCount(path, &status);
    require("getKeyCount", status);
    return count;
}

bool isText(const CMPIData& data) {
    return data.type == CMPI_string && !CMIsNullValue(data) && (data.state & CMPI_notFound) == 0;
}

std::string textOf(const CMPIData& data) {
    return requireText("getKey", [&](CMPIStatus*) { return data.value.string; });
}

/** Whether the value of a key is equal to a value. */
bool hasValue(const CMPIData& data, const Property& expected) {
    if (const auto* const text = std::get_if<std::string>(&expected.value)) {
        return isText(data) && textOf(data) == *text;
    }
    const auto* const path = std::get_if<Path>(&expected.value);
    return path != nullptr && data.type == CMPI_ref && !CMIsNullValue(data) && !isNull(data.value.ref) &&
           isSame(data.value.ref, *path);
}

} // namespace

CMPIObjectPath* newPath(const CMPIBroker* broker, const Path& path) {
    CMPIObjectPath* const object =
        requireObject("newObjectPath(" + path.nameSpace + ", " + path.className + ')', [&](CMPIStatus* status) {
            return CMNewObjectPath(broker, path.nameSpace.c_str(), path.className.c_str(), status);
        });
    if (!path.host.empty()) {
        require("setHostname(" + path.host + ')', CMSetHostname(object, path.host.c_str()));
    }
    for (const Property& key : path.keys) {
        const Typed value = made(broker, key);
        require("addKey(" + key.name + ')', CMAddKey(object, key.name.c_str(), value.get(), value.type));
    }
    return object;
}

CMPIInstance* newInstance(const CMPIBroker* broker, const Instance& instance, const char** properties) {
    const CMPIObjectPath* const path = newPath(broker, instance.path);
    CMPIInstance* const object = requireObject("newInstance of " + instance.path.className,
                                               [&](CMPIStatus* status) { return CMNewInstance(broker, path, status); });
    std::vector<const char*> keys;
    std::transform(instance.path.keys.begin(), instance.path.keys.end(), std::back_inserter(keys),
                   [](const Property& key) { return key.name.c_str(); });
    keys.push_back(nullptr);
    require("setPropertyFilter", CMSetPropertyFilter(object, properties, keys.data()));
    setProperties(broker, object, instance.path.keys);
    setProperties(broker, object, instance.properties);
    return object;
}

Path pathOf(const CMPIObjectPath* path) {
    Path value{nameSpaceOf(path), classNameOf(path), {}};
    const CMPICount count = keyCountOf(path);
    for (CMPICount i = 0; i < count; ++i) {
        CMPIStatus status = {CMPI_RC_OK, nullptr};
        CMPIString* name = nullptr;
        const CMPIData data = CMGetKeyAt(path, i, &name, &status);
        require("getKeyAt(" + std::to_string(i) + ')', status);
        const std::string key = requireText("the name of getKeyAt", [&](CMPIStatus*) { return name; });
        if (!isText(data)) {
            throw OperationError(CMPI_RC_ERR_FAILED, "The key " + key + " of a " + value.className + " is no text.");
        }
        value.keys.push_back({key, textOf(data)});
    }
    return value;
}

bool isSame(const CMPIObjectPath* path, const Path& expected) {
    return isSameName(classNameOf(path), expected.className) && isSameName(nameSpaceOf(path), expected.nameSpace) &&
           keyCountOf(path) == expected.keys.size() &&
           std::all_of(expected.keys.begin(), expected.keys.end(), [&](const Property& key) {
               CMPIStatus status = {CMPI_RC_OK, nullptr};
               const CMPIData data = CMGetKey(path, key.name.c_str(), &status);
               return status.rc == CMPI_RC_OK && hasValue(data, key);
           });
}

bool isSameName(const std::string& left, const std::string& right) {
    return strcasecmp(left.c_str(), right.c_str()) == 0;
}

std::string nameSpaceOf(const CMPIObjectPath* path) {
    return requireText("getNameSpace of the request's path",
                       [&](CMPIStatus* status) { return CMGetNameSpace(path, status); });
}

} // namespace Norv::Provider
