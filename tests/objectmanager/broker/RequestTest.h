/** The fixture of the broker's tests: a broker, and a request that is the current one while a test runs. */
#ifndef TESTS_OBJECTMANAGER_BROKER_REQUESTTEST_H
#define TESTS_OBJECTMANAGER_BROKER_REQUESTTEST_H

#include "broker/Broker.h"
#include "broker/Request.h"

#include "cmpimacs.h"

#include <gmock/gmock.h>

#include <string>
#include <vector>

namespace ObjectManager {

/** Information about one class, which has two keys and the superclass CIM_Disk. */
class OneClass final : public ClassInformation {
public:
    bool isA(std::string_view className, std::string_view superClassName) const override {
        return equalNames(className, "Test_Disk") && equalNames(superClassName, "CIM_Disk");
    }
    std::span<const std::string> keyNames(std::string_view className) const override {
        return equalNames(className, "Test_Disk") ? std::span<const std::string>(_keys)
                                                  : std::span<const std::string>();
    }
    const std::string* declaredName(std::string_view className) const override {
        return equalNames(className, _name) ? &_name : nullptr;
    }
    std::span<const ReferenceEnd> references(std::string_view) const override { return {}; }

private:
    std::string _name = "Test_Disk";
    std::vector<std::string> _keys = {"System", "Name"};
};

class RequestTest : public testing::Test {
protected:
    CMPIObjectPath* newPath() { return CMNewObjectPath(mb, "root/cimv2", "Test_Disk", nullptr); }
    CMPIInstance* newInstance() { return CMNewInstance(mb, newPath(), nullptr); }

    static std::string text(const CMPIString* string) { return textOf(string); }
    static std::string text(const CMPIData& data) { return textOf(data.value.string); }

    OneClass classes;
    Broker broker{nullptr, &classes};
    Request request{broker};
    const CMPIBroker* mb = broker.handle();
    CMPIStatus status{CMPI_RC_ERROR, nullptr};
};

} // namespace ObjectManager

#endif
