#include "broker/Objects.h"

#include "model/DateTime.h"

namespace ObjectManager {

namespace {

/** Reads the text of a datetime object, which was checked when the object was made. */
DateTime valueOf(const DateTimeContent& content) {
    return parseDateTime(content.text).value_or(DateTime{});
}

CMPIUint64 getBinaryFormat(const CMPIDateTime* self, CMPIStatus* rc) {
    const DateTimeContent* content = contentOf(self, rc);
    return content != nullptr ? valueOf(*content).microseconds : 0;
}

CMPIString* getStringFormat(const CMPIDateTime* self, CMPIStatus* rc) {
    const DateTimeContent* content = contentOf(self, rc);
    return content != nullptr ? returnedString(content->text, rc) : nullptr;
}

CMPIBoolean isInterval(const CMPIDateTime* self, CMPIStatus* rc) {
    const DateTimeContent* content = contentOf(self, rc);
    return content != nullptr && valueOf(*content).interval ? 1 : 0;
}

} // namespace

const CMPIDateTimeFT dateTimeTable = {
    CMPIVersion200, release<CMPIDateTime>, clone<CMPIDateTime>, getBinaryFormat, getStringFormat, isInterval,
};

} // namespace ObjectManager
