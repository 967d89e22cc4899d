#include "broker/Objects.h"

#include "model/DateTime.h"

namespace ObjectManager {

namespace {

/** What a datetime object holds was checked when it was made. */
DateTime valueOf(const Text& text) {
    return parseDateTime(text).value_or(DateTime{});
}

CMPIUint64 getBinaryFormat(const CMPIDateTime* self, CMPIStatus* rc) {
    const Text* text = contentOf(self, rc);
    return text != nullptr ? valueOf(*text).microseconds : 0;
}

CMPIString* getStringFormat(const CMPIDateTime* self, CMPIStatus* rc) {
    const Text* text = contentOf(self, rc);
    return text != nullptr ? returnedString(*text, rc) : nullptr;
}

CMPIBoolean isInterval(const CMPIDateTime* self, CMPIStatus* rc) {
    const Text* text = contentOf(self, rc);
    return text != nullptr && valueOf(*text).interval ? 1 : 0;
}

} // namespace

const CMPIDateTimeFT dateTimeTable = {
    CMPIVersion200, release<CMPIDateTime>, clone<CMPIDateTime>, getBinaryFormat, getStringFormat, isInterval,
};

} // namespace ObjectManager
