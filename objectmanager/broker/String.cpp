#include "broker/Objects.h"

namespace ObjectManager {

namespace {

const char* getCharPtr(const CMPIString* self, CMPIStatus* rc) {
    return contentOf(self, rc);
}

} // namespace

const CMPIStringFT stringTable = {CMPIVersion200, release<CMPIString>, clone<CMPIString>, getCharPtr};

} // namespace ObjectManager
