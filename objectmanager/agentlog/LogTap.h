/** Receives the records that providers log while they serve a request, and asks the agent about the machine. */
#ifndef AGENTLOG_LOGTAP_H
#define AGENTLOG_LOGTAP_H

#include "Norv/Machine.h"
#include "OrvLog/Observer.h"

#include <atomic>
#include <cstdint>
#include <mutex>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager {

struct LogRecord {
    /** An OrvLog::RecordKind, or a greater number, which only a newer agent uses. */
    int kind = OrvLog::ORDINARY_RECORD;
    std::string category;
    int level = 0;
    /** Empty if there was no memory for the text. */
    std::string text;
    /** Increases with each record of a thread. */
    std::uint64_t sequence = 0;
};

/** The message in a record's text, without the frame "MESSAGE [File: ..., Line: N]: " around it. */
std::string_view messageOf(std::string_view text);

/**
 * Receives the records of level 5000 and above from the agent's log library in this process, whatever the thresholds of
 * this library are.
 *
 * Each thread has the records that were logged in it. A process may have only one tap at a time, and the tap must
 * outlive every call of a provider. Used by several threads at once.
 */
class LogTap {
public:
    /** How many records a thread keeps until it takes them; if more come, the oldest ordinary ones are dropped. */
    static constexpr std::size_t recordsPerThread = 1000;

    LogTap();
    LogTap(const LogTap&) = delete;
    LogTap& operator=(const LogTap&) = delete;
    ~LogTap();

    /**
     * Listens from now on to the agent's log library to which a provider library is linked, and calls functions of the
     * agent's instrumentation to which it is linked. A library of the agent without the functions for this is ignored.
     *
     * @param library the provider library's handle from dlopen.
     */
    void attach(void* library);

    /** Whether any log library of an agent is listened to. */
    bool isAttached() const;
    /** Whether the agent says that its machine is a simulated one. */
    bool isSimulated() const;
    /**
     * An optional function of the agent's instrumentation.
     *
     * @tparam Function the type of the function, from Norv/Machine.h.
     * @param name the name of the function, from Norv/Machine.h.
     * @return null if no instrumentation is known, or if it does not have the function.
     */
    template <typename Function>
    Function* agentFunction(const char* name) const {
        return reinterpret_cast<Function*>(agentSymbol(name));
    }

    /** The sequence number of the calling thread's newest record; 0 before the first. */
    std::uint64_t newest() const;
    /**
     * Copies of the calling thread's records after the one numbered `sequence`. The newest record that is not an
     * ordinary one is among them even if there was no memory for its text.
     */
    std::vector<LogRecord> since(std::uint64_t sequence) const;
    /**
     * The messages of the failures among the calling thread's records after the one numbered `sequence`. If the agent's
     * configuration cannot be used, every failure follows from that. The result then has only the mistake in the
     * configuration, which the agent logs once in a process.
     */
    std::vector<std::string> failuresSince(std::uint64_t sequence) const;
    /** Returns the calling thread's records, and drops them here. */
    std::vector<LogRecord> take() const;
    /** Drops the calling thread's records. */
    void forget() const;

private:
    /** A log library that is listened to. */
    struct Heard {
        OrvLog::Observe1* observe;
        /** This object's own handle. It keeps the library loaded, since the destructor calls `observe` once more. */
        void* library;
    };

    static void keep(void* context, const OrvLog::ObservedRecord1* record) noexcept;
    void* agentSymbol(const char* name) const;

    const OrvLog::Observer1 _observer;
    /** Tells this tap's records from those that an earlier tap left in a thread. */
    const std::uint64_t _number;
    mutable std::mutex _mutex;
    std::vector<Heard> _heard;
    /** This object's own handle of the agent's instrumentation; null until one is known. It does not change later. */
    std::atomic<void*> _instrumentation = nullptr;
    /** The mistake in the agent's configuration; empty until the agent has reported one. Guarded by `_mutex`. */
    mutable std::string _mistake;
};

} // namespace ObjectManager

#endif
