/**
 * What the agent's log tells about the machine, beside what it tells about providers.
 */
#ifndef AGENTLOG_AGENTLOG_H
#define AGENTLOG_AGENTLOG_H

#include "agentlog/LogTap.h"

#include <string>
#include <vector>

namespace ObjectManager {

enum class PowerAnswer { accepted, refused };

/** The text of the first record in which the agent's instrumentation so answered a power request; empty if none. */
std::string powerRequestText(const std::vector<LogRecord>& records, PowerAnswer answer);

/** What failures the messages tell of, each said once; begins with `introduction` where they tell of any. */
std::string reasonsText(const std::vector<std::string>& logged, const char* introduction);

} // namespace ObjectManager

#endif
