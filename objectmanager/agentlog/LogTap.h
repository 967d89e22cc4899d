/** What the agent tells the object manager about the machine, and providers write to its log while they serve a
 * request. */
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
    /** An OrvLog::RecordKind, or another number of an agent that knows more of them. */
    int kind = OrvLog::ORDINARY_RECORD;
    std::string category;
    int level = 0;
    std::string text;
    /** Grows from record to record of a thread. */
    std::uint64_t sequence = 0;
};

/** The message in a record's text, without the frame "MESSAGE [File: ..., Line: N]: " around it. */
std::string_view messageOf(std::string_view text);

/**
 * Receives the records of the agent's log library in this process, of level 5000 and above, whatever its thresholds.
 *
 * Each thread has its own records: those that were logged in it. There is one tap at most in a process, and it outlives
 * every call of a provider. Used by several threads at once.
 */
class LogTap {
public:
    /** How many ordinary records are kept for a thread that does not take them. */
    static constexpr std::size_t recordsPerThread = 1000;

    LogTap();
    LogTap(const LogTap&) = delete;
    LogTap& operator=(const LogTap&) = delete;
    ~LogTap();

    /**
     * Listens from now on to the agent's libraries that a library uses, where they can be listened to.
     *
     * @param library as dlopen gave it.
     */
    void attach(void* library);

    /** Whether there is an agent that can be listened to. */
    bool isAttached() const;
    /** Whether every power request to the agent leaves a record here that says what became of it. */
    bool hearsPowerRequests() const;
    /** Whether the agent says that its machine is a simulated one. */
    bool isSimulated() const;
    /** The path of the node that power requests go to, whichever service they name; empty where it is not known. */
    std::string powerNode() const;
    /** Has the agent take back the power request that is under way, which leaves a record as a request does. Nothing
     * happens where it cannot be asked. */
    void cancelPowerRequest() const;
    /** For whom the calling thread acts from now on; null for nobody. The text is valid until another one is given. */
    void actFor(const char* whom) const;

    /** The sequence number of the calling thread's newest record. */
    std::uint64_t newest() const;
    /** The calling thread's records after the one numbered `sequence`, which stay here. */
    std::vector<LogRecord> since(std::uint64_t sequence) const;
    /** The messages in those of them that tell a failure; one alone where the agent's configuration cannot be used. */
    std::vector<std::string> failuresSince(std::uint64_t sequence) const;
    /** The calling thread's records, which are gone from here. */
    std::vector<LogRecord> take();
    /** Drops the calling thread's records. */
    void forget();

private:
    /** A library of the agent whose log is listened to. */
    struct Heard {
        OrvLog::Observe1* observe;
        /** A reference of our own, since the function is called once more at the end. */
        void* library;
    };

    static void keep(void* context, const OrvLog::ObservedRecord1* record) noexcept;

    const OrvLog::Observer1 _observer;
    /** Tells the records of this tap from those that another one has left in a thread. */
    const std::uint64_t _number;
    mutable std::mutex _mutex;
    std::vector<Heard> _heard;
    std::atomic<Norv::Machine1*> _machine = nullptr;
    std::atomic<Norv::CancelRequest1*> _cancelRequest = nullptr;
    std::atomic<Norv::PowerNode1*> _powerNode = nullptr;
    std::atomic<Norv::OnBehalfOf1*> _onBehalfOf = nullptr;
};

} // namespace ObjectManager

#endif
