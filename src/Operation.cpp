#include "Operation.h"

namespace Norv::PowerStateManagementServiceProvider {

void logMessage(const std::string& category, int level, const char* text, const Site& site) {
    writeRecord(category, level, site, [&] { return trace(text, site.file, site.line, MESSAGE); });
}

void logVariable(const std::string& category, const char* variable, const char* value, const Site& site) {
    writeRecord(category, operationLevel, site, [&] { return trace(variable, site.file, site.line, value); });
}

void logVariable(const std::string& category, const char* variable, unsigned int value, const Site& site) {
    writeRecord(category, operationLevel, site, [&] { return trace(variable, site.file, site.line, value); });
}

} // namespace Norv::PowerStateManagementServiceProvider
