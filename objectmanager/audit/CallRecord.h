/** Records of who called which method, and with which outcome. */
#ifndef AUDIT_CALLRECORD_H
#define AUDIT_CALLRECORD_H

#include <chrono>
#include <functional>
#include <string>
#include <string_view>

namespace ObjectManager::Audit {

enum class Verdict {
    /** The method was called and did not fail. */
    accepted,
    /** The call was not made, or it failed. */
    refused,
    /** The client does not have the right to make the request. */
    denied,
};

/**
 * A client's call of a method, or another request that the client did not have the right to make. Every text is one
 * line.
 */
struct CallRecord {
    std::chrono::system_clock::time_point time;
    std::string address;
    /** The client's user name; empty if clients need not log in. */
    std::string user;
    /** The path of the instance or class whose method was called; for other requests, the namespace. */
    std::string target;
    /** Empty for other requests. */
    std::string className;
    std::string method;
    /** The input arguments: "name=value, ...". */
    std::string arguments;
    Verdict verdict = Verdict::refused;
    /** Why the request was not accepted, or what is known about the outcome of an accepted one; may be empty. */
    std::string reason;
};

/** Called with each record, from several threads at once. Must not throw. */
using Recorder = std::function<void(const CallRecord&)>;

/** The verdict in a word: accepted, refused or denied. */
std::string_view nameOf(Verdict verdict);

/** The record as one line, without its time. */
std::string messageOf(const CallRecord& record);

/**
 * Makes a recorder. If the process's standard error goes to the system's journal, it writes records to the journal,
 * with fields; else, and if the journal does not take a record, it writes a line to the log that begins with the time
 * in UTC.
 *
 * @param log writes one line, which has no line end. Called from several threads at once.
 */
Recorder makeRecorder(std::function<void(const std::string& line)> log);

} // namespace ObjectManager::Audit

#endif
