#include "server/EventLog.h"

#include <fmt/format.h>

namespace ObjectManager::Server {

namespace {

std::string cut(const std::string& line) {
    return line.size() <= EventLog::longestLine
               ? line
               : fmt::format("{}... ({} bytes)", line.substr(0, EventLog::longestLine), line.size());
}

} // namespace

void EventLog::report(const std::string& network, const std::string& line, Clock::time_point now) {
    settle(now);
    {
        const std::lock_guard lock(_mutex);
        // The table has at most as many networks as lines are allowed in all.
        if (_all.lines >= linesOfAll) {
            ++_all.leftOut;
            return;
        }
        Count& count = _networks.try_emplace(network, Count{now}).first->second;
        if (count.lines >= linesOfNetwork) {
            ++count.leftOut;
            return;
        }
        ++count.lines;
        ++_all.lines;
    }
    report(line);
}

void EventLog::report(const std::string& line) {
    _log(cut(line));
}

void EventLog::settle(Clock::time_point now) {
    const std::lock_guard lock(_mutex);
    std::erase_if(_networks, [&](const auto& entry) {
        const bool over = now - entry.second.begin >= period;
        if (over) {
            logLeftOut(entry.first, entry.second);
        }
        return over;
    });
    if (now - _all.begin >= period) {
        logLeftOut("all clients", _all);
        _all = {now};
    }
}

void EventLog::logLeftOut(const std::string& network, const Count& count) const {
    if (count.leftOut > 0) {
        _log(fmt::format("{}: {} more lines in a minute are left out", network, count.leftOut));
    }
}

} // namespace ObjectManager::Server
