#include "Destination.h"

#include <syslog.h>

namespace OrvLog {

namespace {

int priorityOf(int level) {
    if (level >= Norv::Agent::alwaysWrittenLevel) {
        return LOG_NOTICE;
    }
    if (level >= 6000) {
        return LOG_ERR;
    }
    return level >= 4000 ? LOG_INFO : LOG_DEBUG;
}

class SyslogDestination final : public Destination {
public:
    std::string name() const override { return "syslog"; }

    int write(const Line& line) override {
        const auto text = line.withoutTime();
        syslog(priorityOf(line.level()), "%.*s", static_cast<int>(text.size()), text.data());
        return 0;
    }
};

} // namespace

std::unique_ptr<Destination> syslogDestination() {
    return std::make_unique<SyslogDestination>();
}

} // namespace OrvLog
