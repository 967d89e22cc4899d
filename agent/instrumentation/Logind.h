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

/** A call that did not do what it should. what() is the reason, for people. */
class LogindError : public std::runtime_error {
public:
    enum class Kind {
        /** There is no way to the bus. */
        noBus,
        /** Nobody on the bus is systemd-logind, and nobody starts it. */
        noService,
        /** Systemd-logind must not be started. */
        masked,
        /** Systemd-logind answers, but polkit, which it has to ask about this user, must not be started. */
        polkitMasked,
        /** Systemd-logind, or the bus in its place, said no. */
        refused,
        /** No answer came: whether the call did something is not known. */
        unanswered,
    };

    LogindError(Kind kind, const std::string& reason) : std::runtime_error(reason), _kind(kind) {}

    Kind kind() const { return _kind; }

private:
    Kind _kind;
};

using WallTime = std::chrono::sys_time<std::chrono::microseconds>;

/** The last time whose year has four digits. Whatever is later is shown as this. */
constexpr WallTime endOfTime{std::chrono::seconds{253'402'300'799}};

struct ScheduledShutdown {
    /** "reboot", "poweroff" and the like; empty where nothing is scheduled. */
    std::string type;
    WallTime time;
};

/** Something on the machine that does not want it to go down. */
struct Inhibitor {
    std::string who;
    std::string why;
    std::uint32_t uid;
    std::uint32_t pid;
};

/**
 * A connection to systemd-logind, for one thread and one operation: none is kept, so that nothing depends on what a
 * host does with its descriptors, or whether it forks, and a bus that was restarted is found again.
 *
 * Every member throws LogindError, at the latest when the time is over.
 */
class Logind {
public:
    /** Connects to the bus that DBUS_SYSTEM_BUS_ADDRESS names, else to the machine's. */
    explicit Logind(const Deadline& deadline);

    /** Questions that are not methods without arguments, but properties. */
    static constexpr const char* preparingForShutdown = "PreparingForShutdown";
    static constexpr const char* scheduledShutdownProperty = "ScheduledShutdown";
    /** The question behind shutdownInhibitors. */
    static constexpr const char* listInhibitors = "ListInhibitors";

    /**
     * Asks several questions at once, so that all of them take the time of one. Their answers are what the members
     * below return when they are next called; an answer that is an error is thrown then.
     *
     * @param questions those above, and methods for `can`.
     */
    void askTogether(std::span<const char* const> questions);

    bool isPreparingForShutdown();

    ScheduledShutdown scheduledShutdown();

    /** What a method such as CanReboot answers: "yes" or why not. */
    std::string can(const char* method);

    /** Those that forbid a shutdown, not those that merely delay it. */
    std::vector<Inhibitor> shutdownInhibitors();

    /** Calls Reboot or PowerOff. Never lets polkit ask anybody. */
    void shutDown(const char* method);

    void scheduleShutdown(const ScheduledShutdown& shutdown);

    /** Cancels the scheduled shutdown. @return whether there was one. */
    bool cancelScheduledShutdown();

    /** Asks for the scheduled shutdown to be cancelled, without waiting for an answer. Does not throw. */
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
    /** Throws what it means that a call has no answer, or an error: its name and text, which are empty else. */
    [[noreturn]] void failToAnswer(const char* method, int result, const std::string& error = "",
                                   const std::string& text = "");

    /** A question that was asked together with others. */
    struct Asked {
        const char* question;
        /** Null until it comes. */
        Message answer;
    };

    Deadline _deadline;
    /** What sd-bus calls back writes here; the bus goes first. */
    std::list<Asked> _asked;
    std::unique_ptr<sd_bus, Closer> _bus;
    /** Whether systemd-logind has answered anything. */
    bool _answers = false;
};

} // namespace Norv::Agent

#endif
