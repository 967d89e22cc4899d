/** Who called which method, and what became of it. */
#ifndef AUDIT_CALLRECORD_H
#define AUDIT_CALLRECORD_H

#include <chrono>
#include <functional>
#include <string>
#include <string_view>

namespace ObjectManager::Audit {

enum class Verdict {
    /** The method was called, and did not fail. */
    accepted,
    /** The call was not made, or failed. */
    refused,
    /** The client has not the right to it. */
    denied,
};

/** A client's call of a method, or another request that he has not the right to. Every text is one line. */
struct CallRecord {
    std::chrono::system_clock::time_point time;
    std::string address;
    /** Empty where clients need not log in. */
    std::string user;
    /** The path of the instance or class; of another request the namespace. */
    std::string target;
    /** Empty of another request. */
    std::string className;
    std::string method;
    /** Name=value, ... */
    std::string arguments;
    Verdict verdict = Verdict::refused;
    /** Why it was not accepted, or what is known of what was; may be empty. */
    std::string reason;
};

/** Takes each record as it comes. Called from several threads at once; must not throw. */
using Recorder = std::function<void(const CallRecord&)>;

/** accepted, refused or denied. */
std::string_view nameOf(Verdict verdict);

/** A text in one line: control characters are written as \xNN, and what is beyond `longest` bytes as "...". */
std::string inOneLine(std::string_view text, std::size_t longest = 2000);

/** The record as one line, without its time. */
std::string messageOf(const CallRecord& record);

/**
 * A recorder that writes to the system's journal, with fields, where the process's standard error is the journal's;
 * else a line to the log, which begins with the time in UTC. What the journal does not take goes to the log.
 *
 * @param log takes one line, without a line end. Called from several threads at once.
 */
Recorder makeRecorder(std::function<void(const std::string& line)> log);

} // namespace ObjectManager::Audit

#endif
