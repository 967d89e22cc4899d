/** What the agent tells the object manager about the machine, and what providers log while they serve a request. */
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
    /** An OrvLog::RecordKind, or a number beyond them if the agent is newer. */
    int kind = OrvLog::ORDINARY_RECORD;
    std::string category;
    int level = 0;
    /** Empty if there was no memory for it. */
    std::string text;
    /** Increases with each record of a thread. */
    std::uint64_t sequence = 0;
};

/** The message in a record's text, without the frame "MESSAGE [File: ..., Line: N]: " around it. */
std::string_view messageOf(std::string_view text);

/**
 * Receives the records of level 5000 and above from the agent's log library in this process, whatever its thresholds.
 *
 * Each thread has the records that were logged in it. A process has one tap at most, and the tap outlives every call of
 * a provider. Used by several threads at once.
 */
class LogTap {
public:
    /** How many ordinary records a thread keeps until it takes them; beyond that, the oldest one is dropped. */
    static constexpr std::size_t recordsPerThread = 1000;

    LogTap();
    LogTap(const LogTap&) = delete;
    LogTap& operator=(const LogTap&) = delete;
    ~LogTap();

    /**
     * Listens from now on to the agent's libraries that a provider library is linked to, as far as they offer that.
     *
     * @param library the handle from dlopen.
     */
    void attach(void* library);

    /** Whether any log library of an agent is listened to. */
    bool isAttached() const;
    /** Whether the agent says that its machine is a simulated one. */
    bool isSimulated() const;
    /**
     * An optional function of the agent's instrumentation.
     *
     * @tparam Function its type, of those in Norv/Machine.h.
     * @param name its name, from there.
     * @return null if no agent is listened to that offers the function.
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
     * The messages of those of them that are failures. If the agent's configuration cannot be used, they follow from
     * that: only the mistake in it is given, which the agent reports once in a process.
     */
    std::vector<std::string> failuresSince(std::uint64_t sequence) const;
    /** Moves the calling thread's records out of here. */
    std::vector<LogRecord> take() const;
    /** Drops the calling thread's records. */
    void forget() const;

private:
    /** A log library that is listened to. */
    struct Heard {
        OrvLog::Observe1* observe;
        /** Our own handle: it keeps the library loaded, since `observe` is called once more by the destructor. */
        void* library;
    };

    static void keep(void* context, const OrvLog::ObservedRecord1* record) noexcept;
    void* agentSymbol(const char* name) const;

    const OrvLog::Observer1 _observer;
    /** Tells this tap's records from those that an earlier tap left in a thread. */
    const std::uint64_t _number;
    mutable std::mutex _mutex;
    std::vector<Heard> _heard;
    /** Our own handle of the agent's instrumentation; null until one is known. Does not change afterwards. */
    std::atomic<void*> _instrumentation = nullptr;
    /** The mistake in the agent's configuration; empty until it was reported. Guarded by `_mutex`. */
    mutable std::string _mistake;
};

} // namespace ObjectManager

#endif
