/**
 * What the agent's log tells about the machine, beside what it tells about providers.
 */
#ifndef DISPATCH_AGENTLOG_H
#define DISPATCH_AGENTLOG_H

#include "dispatch/LogTap.h"

#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager {

/** Whether a text is the agent's notice that the machine is a simulated one. */
bool isSimulationNotice(std::string_view text);

/** Whether a text is the agent's word that it accepted a power request. */
bool isAcceptance(std::string_view text);

/** Whether the agent's instrumentation gave that notice in one of the records. */
bool saysSimulated(const std::vector<LogRecord>& records);

enum class PowerAnswer { accepted, refused };

/** The text of the first record in which the agent's instrumentation so answered a power request; empty if none. */
std::string powerRequestText(const std::vector<LogRecord>& records, PowerAnswer answer);

/**
 * What failures the messages tell of, each said once; begins with `introduction` where they tell of any. What the agent
 * says of the machine and of accepted requests is no failure.
 */
std::string reasonsText(const std::vector<std::string>& logged, const char* introduction);

} // namespace ObjectManager

#endif
