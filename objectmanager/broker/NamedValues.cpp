/* Arguments and contexts: both are values under names. */
#include "broker/Objects.h"

namespace ObjectManager {

namespace {

template <typename Handle>
CMPIStatus add(const Handle* self, const char* name, const CMPIValue* value, const CMPIType type) {
    CMPIStatus status;
    NamedValues* values = contentOf(self, &status);
    return values != nullptr ? setNamedValue(*values, name, value, type) : status;
}

template <typename Handle>
CMPIData get(const Handle* self, const char* name, CMPIStatus* rc) {
    CMPIStatus status;
    const NamedValues* values = contentOf(self, &status);
    return values != nullptr ? namedValue(*values, name, CMPI_goodValue, rc) : noData(rc, status.rc);
}

template <typename Handle>
CMPIData getAt(const Handle* self, CMPICount index, CMPIString** name, CMPIStatus* rc) {
    CMPIStatus status;
    const NamedValues* values = contentOf(self, &status);
    return values != nullptr ? namedValueAt(*values, index, name, CMPI_goodValue, rc) : noData(rc, status.rc);
}

template <typename Handle>
CMPICount count(const Handle* self, CMPIStatus* rc) {
    const NamedValues* values = contentOf(self, rc);
    return values != nullptr ? static_cast<CMPICount>(values->size()) : 0;
}

} // namespace

const CMPIArgsFT argsTable = {
    CMPIVersion200, release<CMPIArgs>, clone<CMPIArgs>, add<CMPIArgs>, get<CMPIArgs>, getAt<CMPIArgs>, count<CMPIArgs>,
};

const CMPIContextFT contextTable = {
    CMPIVersion200,     release<CMPIContext>, clone<CMPIContext>, get<CMPIContext>,
    getAt<CMPIContext>, count<CMPIContext>,   add<CMPIContext>,
};

} // namespace ObjectManager
