#include "dispatch/LogTap.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <charconv>
#include <cstdlib>
#include <sys/socket.h>
#include <system_error>
#include <unistd.h>

namespace ObjectManager {

namespace {

constexpr const char* variable = "ORV_AGENT_LOG_SOCKET";

/** What a burst of records may take up until it is read, as far as the system allows. */
constexpr int bufferBytes = 4 * 1024 * 1024;

/** Longer texts are cut. */
constexpr std::size_t maximumDatagram = std::size_t{64} * 1024;

std::int64_t callingThread() {
    return gettid();
}

/** The characters up to the next line end, which are taken off `text`. */
std::string_view takeLine(std::string_view& text) {
    const std::size_t end = std::min(text.find('\n'), text.size());
    const std::string_view line = text.substr(0, end);
    text.remove_prefix(std::min(end + 1, text.size()));
    return line;
}

template <class Number>
bool parse(std::string_view text, Number& number) {
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
    return error == std::errc{} && end == text.data() + text.size();
}

} // namespace

std::string_view messageOf(std::string_view text) {
    constexpr std::string_view frame = "MESSAGE [File: ";
    constexpr std::string_view frameEnd = "]: ";
    const std::size_t end = text.find(frameEnd);
    return text.starts_with(frame) && end != std::string_view::npos ? text.substr(end + frameEnd.size()) : text;
}

LogTap::LogTap() {
    std::array<int, 2> sockets{};
    if (socketpair(AF_UNIX, SOCK_SEQPACKET | SOCK_CLOEXEC | SOCK_NONBLOCK, 0, sockets.data()) != 0) {
        throw std::system_error(errno, std::generic_category(), "socket for the agent's log records");
    }
    _receiver = sockets[0];
    _sender = sockets[1];
    setsockopt(_sender, SOL_SOCKET, SO_SNDBUF, &bufferBytes, sizeof bufferBytes);
    setenv(variable, std::to_string(_sender).c_str(), 1);
}

LogTap::~LogTap() {
    unsetenv(variable);
    close(_sender);
    close(_receiver);
}

std::uint64_t LogTap::newest() {
    const std::lock_guard lock(_mutex);
    drain();
    return _newest;
}

std::vector<LogRecord> LogTap::since(std::uint64_t sequence) {
    const std::lock_guard lock(_mutex);
    drain();
    std::vector<LogRecord> records;
    if (const auto found = _records.find(callingThread()); found != _records.end()) {
        std::copy_if(found->second.begin(), found->second.end(), std::back_inserter(records),
                     [&](const LogRecord& record) { return record.sequence > sequence; });
    }
    return records;
}

std::vector<std::string> LogTap::failuresSince(std::uint64_t sequence) {
    constexpr int failureLevel = 6000;
    std::vector<std::string> failures;
    for (const LogRecord& record : since(sequence)) {
        if (record.level >= failureLevel) {
            failures.emplace_back(messageOf(record.text));
        }
    }
    return failures;
}

std::vector<LogRecord> LogTap::take() {
    const std::lock_guard lock(_mutex);
    drain();
    const auto taken = _records.extract(callingThread());
    if (taken.empty()) {
        return {};
    }
    return {std::make_move_iterator(taken.mapped().begin()), std::make_move_iterator(taken.mapped().end())};
}

void LogTap::forget() {
    const std::lock_guard lock(_mutex);
    if (!_records.empty()) {
        _records.erase(callingThread());
    }
}

void LogTap::drain() {
    std::array<char, maximumDatagram> buffer;
    ssize_t received = 0;
    while ((received = recv(_receiver, buffer.data(), buffer.size(), MSG_DONTWAIT)) > 0) {
        keep({buffer.data(), static_cast<std::size_t>(received)});
    }
}

/** A datagram is "<thread>\n<level>\n<category>\n<text>". */
void LogTap::keep(std::string_view datagram) {
    std::int64_t thread = 0;
    LogRecord record;
    if (!parse(takeLine(datagram), thread) || !parse(takeLine(datagram), record.level)) {
        return; // not from the agent's log library
    }
    record.category = takeLine(datagram);
    record.text = datagram;
    record.sequence = ++_newest;
    if (_records.size() == threads && !_records.contains(thread)) {
        _records.erase(std::min_element(_records.begin(), _records.end(), [](const auto& left, const auto& right) {
            return left.second.back().sequence < right.second.back().sequence;
        }));
    }
    std::deque<LogRecord>& records = _records[thread];
    if (records.size() == recordsPerThread) {
        records.pop_front();
    }
    records.push_back(std::move(record));
}

} // namespace ObjectManager
