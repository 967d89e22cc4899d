#include "orvcim/ServeLog.h"

#include <fmt/format.h>

#include <poll.h>
#include <syslog.h>
#include <unistd.h>

#include <cerrno>
#include <string_view>
#include <utility>

namespace ObjectManager::Orvcim {

namespace {

constexpr std::chrono::seconds lastTime{1};

/** How often the thread checks whether the program ends while nobody reads standard error, in milliseconds. */
constexpr int lookInterval = 100;

} // namespace

ServeLog::ServeLog(bool syslog) : _queue(std::make_shared<Queue>(syslog)) {
    if (syslog) {
        openlog("orvcim", LOG_PID, LOG_DAEMON);
    }
    _thread = std::thread([queue = _queue] { queue->run(); });
}

ServeLog::~ServeLog() {
    flush(lastTime);
    std::unique_lock lock(_queue->mutex);
    _queue->ending = true;
    _queue->changed.notify_all();
    const bool ended = _queue->changed.wait_for(lock, lastTime, [this] { return _queue->ended; });
    lock.unlock();
    if (ended) {
        _thread.join();
    } else {
        // The thread hangs in a call of the system's log.
        _thread.detach();
    }
}

void ServeLog::write(const std::string& line) {
    {
        const std::lock_guard lock(_queue->mutex);
        if (_queue->lines.size() - _queue->aboutSwitch >= room) {
            ++_queue->leftOut;
            return;
        }
        _queue->lines.push_back({line, false});
    }
    _queue->changed.notify_all();
}

void ServeLog::keep(const std::string& line) {
    {
        std::unique_lock lock(_queue->mutex);
        _queue->changed.wait(lock, [this] { return _queue->ending || _queue->aboutSwitch < roomForSwitch; });
        _queue->lines.push_back({line, true});
        ++_queue->aboutSwitch;
    }
    _queue->changed.notify_all();
}

bool ServeLog::flush(std::chrono::milliseconds time) {
    std::unique_lock lock(_queue->mutex);
    return _queue->changed.wait_for(lock, time, [this] { return _queue->lines.empty() && !_queue->writing; });
}

void ServeLog::Queue::run() {
    std::unique_lock lock(mutex);
    while (true) {
        changed.wait(lock, [this] { return ending || !lines.empty(); });
        if (ending) {
            break;
        }
        const Line line = std::move(lines.front());
        lines.pop_front();
        aboutSwitch -= line.isAboutSwitch ? 1 : 0;
        if (lines.empty() && leftOut > 0) {
            lines.push_back(
                {fmt::format("{} more lines are left out: the log's reader is too slow, or its disk was full",
                             std::exchange(leftOut, 0)),
                 false});
        }
        writing = true;
        lock.unlock();
        put(line.text);
        lock.lock();
        writing = false;
        changed.notify_all();
    }
    ended = true;
    changed.notify_all();
}

void ServeLog::Queue::put(const std::string& line) {
    if (syslog) {
        ::syslog(LOG_WARNING, "%s", line.c_str());
        return;
    }
    // A pipe that is ready takes a whole line at once, since lines are short.
    const std::string text = "orvcim: " + line + '\n';
    std::string_view rest = text;
    while (!rest.empty() && !isEnding()) {
        pollfd target{STDERR_FILENO, POLLOUT, 0};
        if (poll(&target, 1, lookInterval) <= 0) {
            continue;
        }
        const ssize_t written = ::write(STDERR_FILENO, rest.data(), rest.size());
        if (written < 0 && (errno == ENOSPC || errno == EDQUOT)) {
            // Standard error is a file: somebody has to make room on its disk.
            std::unique_lock lock(mutex);
            changed.wait_for(lock, std::chrono::milliseconds{lookInterval}, [this] { return ending; });
        } else if (written < 0 && errno != EINTR && errno != EAGAIN) {
            return; // The reader of standard error is gone.
        }
        rest.remove_prefix(written > 0 ? static_cast<std::size_t>(written) : 0);
    }
}

bool ServeLog::Queue::isEnding() {
    const std::lock_guard lock(mutex);
    return ending;
}

} // namespace ObjectManager::Orvcim
