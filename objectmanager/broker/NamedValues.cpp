/* Arguments and contexts: both consist of values with names. */
#include "broker/Objects.h"

namespace ObjectManager {

namespace {

template <typename Handle>
CMPIStatus add(const Handle* self, const char* name, const CMPIValue* value, const CMPIType type) {
    CMPIStatus status;
    NamedItemsContent* content = contentOf(self, &status);
    return content != nullptr ? setNamedValue(*headerOf(self).memory, content->items, name, value, type) : status;
}

template <typename Handle>
CMPIData get(const Handle* self, const char* name, CMPIStatus* rc) {
    CMPIStatus status;
    const NamedItemsContent* content = contentOf(self, &status);
    return content != nullptr ? namedValue(content->items, name, CMPI_goodValue, rc) : noData(rc, status.rc);
}

template <typename Handle>
CMPIData getAt(const Handle* self, CMPICount index, CMPIString** name, CMPIStatus* rc) {
    CMPIStatus status;
    const NamedItemsContent* content = contentOf(self, &status);
    return content != nullptr ? namedValueAt(content->items, index, name, CMPI_goodValue, rc) : noData(rc, status.rc);
}

template <typename Handle>
CMPICount count(const Handle* self, CMPIStatus* rc) {
    const NamedItemsContent* content = contentOf(self, rc);
    return content != nullptr ? content->items.size : 0;
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
