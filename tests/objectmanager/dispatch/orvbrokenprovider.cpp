/* Providers that cannot be used. The name of each one tells the reason. */
#include "cmpimacs.h"

#include <stdexcept>

namespace {

CMPIStatus cleanUp(CMPIInstanceMI*, const CMPIContext*, CMPIBoolean) {
    return {CMPI_RC_OK, nullptr};
}

CMPIInstanceMIFT tableOf(CMPIVersion version, const char* name) {
    CMPIInstanceMIFT table{};
    table.ftVersion = version;
    table.miVersion = 1;
    table.miName = name;
    table.cleanup = cleanUp;
    return table;
}

const CMPIInstanceMIFT nullSlotTable = tableOf(CMPIVersion200, "instanceNullSlot");
const CMPIInstanceMIFT oldTable = tableOf(99, "instanceOldVersion");
const CMPIInstanceMIFT namelessTable = tableOf(CMPIVersion200, nullptr);

CMPIInstanceMI noTable = {nullptr, nullptr};
CMPIInstanceMI nullSlot = {nullptr, &nullSlotTable};
CMPIInstanceMI oldVersion = {nullptr, &oldTable};
CMPIInstanceMI nameless = {nullptr, &namelessTable};

} // namespace

extern "C" {

CMPIInstanceMI* ReturnsNull_Create_InstanceMI(const CMPIBroker*, const CMPIContext*, CMPIStatus*) {
    return nullptr;
}

CMPIInstanceMI* ReportsFailure_Create_InstanceMI(const CMPIBroker* broker, const CMPIContext*, CMPIStatus* status) {
    CMSetStatusWithChars(broker, status, CMPI_RC_ERR_ACCESS_DENIED, "no licence");
    return &nullSlot;
}

CMPIInstanceMI* Throws_Create_InstanceMI(const CMPIBroker*, const CMPIContext*, CMPIStatus*) {
    throw std::runtime_error("no disk");
}

CMPIInstanceMI* NoTable_Create_InstanceMI(const CMPIBroker*, const CMPIContext*, CMPIStatus*) {
    return &noTable;
}

CMPIInstanceMI* NullSlot_Create_InstanceMI(const CMPIBroker*, const CMPIContext*, CMPIStatus*) {
    return &nullSlot;
}

CMPIInstanceMI* OldVersion_Create_InstanceMI(const CMPIBroker*, const CMPIContext*, CMPIStatus*) {
    return &oldVersion;
}

CMPIInstanceMI* Nameless_Create_InstanceMI(const CMPIBroker*, const CMPIContext*, CMPIStatus*) {
    return &nameless;
}
}
