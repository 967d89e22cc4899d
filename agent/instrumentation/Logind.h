/**
 * systemd-logind, org.freedesktop.login1(5), on the system bus.
 */
#ifndef INSTRUMENTATION_LOGIND_H
#define INSTRUMENTATION_LOGIND_H

#include "base/Deadline.h"

#include <chrono>
#include <cstdint>
#include <list>
#include <memory>
#include <span>
#include <stdexcept>
#include <string>
#include <vector>

struct sd_bus;
struct sd_bus_message;

namespace Norv::Agent {

/** A call that failed. what() is the reason, for people. */
class LogindError : public std::runtime_error {
public:
    enum class Kind {
        /** The bus cannot be reached. */
        noBus,
        /** systemd-logind is not on the bus, and cannot be started. */
        noService,
        /** systemd-logind is masked: it must not be started. */
        masked,
        /** systemd-logind answers, but polkit, which it has to ask about this user, is masked. */
        polkitMasked,
        /** systemd-logind, or the policy of the bus, refused the call. */
        refused,
        /** No answer came: it is not known whether the call had an effect. */
        unanswered,
    };

    LogindError(Kind kind, const std::string& reason) : std::runtime_error(reason), _kind(kind) {}

    Kind kind() const { return _kind; }

private:
    Kind _kind;
};

using WallTime = std::chrono::sys_time<std::chrono::microseconds>;

/** The last time whose year has four digits. Later times are shown as this one. */
constexpr WallTime endOfTime{std::chrono::seconds{253'402'300'799}};

struct ScheduledShutdown {
    /** "reboot", "poweroff" or another type; empty if no shutdown is scheduled. */
    std::string type;
    WallTime time;
};

/** A program's lock against shutdown. */
struct Inhibitor {
    std::string who;
    std::string why;
    std::uint32_t uid;
    std::uint32_t pid;
};

/**
 * A connection to systemd-logind, for one thread and one operation. No connection is kept, so that a host may close
 * descriptors or fork, and a bus that was restarted is found again.
 *
 * Every member throws LogindError if it fails, at the latest when the deadline is over.
 */
class Logind {
public:
    /** Connects to the bus that DBUS_SYSTEM_BUS_ADDRESS names, else to the machine's system bus. */
    explicit Logind(const Deadline& deadline);

    /** Properties that `askTogether` can read; its other questions are methods without arguments. */
    static constexpr const char* preparingForShutdown = "PreparingForShutdown";
    static constexpr const char* scheduledShutdownProperty = "ScheduledShutdown";
    /** The method that shutdownInhibitors calls. */
    static constexpr const char* listInhibitors = "ListInhibitors";

    /**
     * Sends several questions at once, so that together they take the time of one. From then on, the members below
     * return these answers, and throw the errors among them.
     *
     * @param questions the constants above, and methods for `can`.
     */
    void askTogether(std::span<const char* const> questions);

    bool isPreparingForShutdown();

    ScheduledShutdown scheduledShutdown();

    /** The answer of a method such as CanReboot: "yes", or why not ("no", "na", "challenge"). */
    std::string can(const char* method);

    /** The inhibitors that forbid a shutdown, without those that only delay it. */
    std::vector<Inhibitor> shutdownInhibitors();

    /** Calls Reboot or PowerOff, not interactively: polkit asks nobody for a password. */
    void shutDown(const char* method);

    void scheduleShutdown(const ScheduledShutdown& shutdown);

    /** Cancels the scheduled shutdown. @return whether there was one. */
    bool cancelScheduledShutdown();

    /** Asks systemd-logind to cancel the scheduled shutdown, without waiting for an answer. */
    void takeBackScheduledShutdown() noexcept;

private:
    struct Closer {
        void operator()(sd_bus* bus) const;
    };
    struct Unreferencer {
        void operator()(sd_bus_message* message) const;
    };
    using Message = std::unique_ptr<sd_bus_message, Unreferencer>;

    void waitUntilConnected();
    Message newCall(const char* interface, const char* method);
    Message newQuestion(const char* question);
    Message send(const Message& call, const char* method);
    Message answerTo(const char* question);
    /**
     * Throws the LogindError for a call without an answer, or with an error as its answer: then `error` and `text` are
     * that error's name and text.
     */
    [[noreturn]] void failToAnswer(const char* method, int result, const std::string& error = "",
                                   const std::string& text = "");

    /** A question of `askTogether`. */
    struct Asked {
        const char* question;
        /** Null until the answer comes. */
        Message answer;
    };

    Deadline _deadline;
    /** Callbacks of sd-bus write into this list, so _bus must be destroyed before it. */
    std::list<Asked> _asked;
    std::unique_ptr<sd_bus, Closer> _bus;
    /** Whether systemd-logind has answered any call. */
    bool _answers = false;
};

} // namespace Norv::Agent

#endif
