#include "LogindBackend.h"

#include "Logind.h"
#include "Report.h"
#include "Wording.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <ctime>
#include <stdexcept>
#include <system_error>
#include <utility>

#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

namespace Norv::Agent {

namespace {

constexpr const char* nodePath = "system";

/** Property 123 while the machine runs. */
constexpr unsigned int running = 1;
/** Property 123 while the machine goes down and nobody can say for what. */
constexpr unsigned int goingDown = 12;

/** What the machine can be asked to do. */
struct Transition {
    /** What is written to property 123, and what it reads from then on. */
    unsigned int state;
    const char* name;
    /** Methods of systemd-logind. */
    const char* method;
    const char* canMethod;
    /** What systemd-logind calls it where it is scheduled. */
    const char* scheduledType;
    /** The rights that it needs. */
    const char* actions;
};

constexpr std::array transitions = {
    Transition{9, "reboot", "Reboot", "CanReboot", "reboot",
               "org.freedesktop.login1.reboot and org.freedesktop.login1.reboot-multiple-sessions"},
    Transition{12, "shutdown", "PowerOff", "CanPowerOff", "poweroff",
               "org.freedesktop.login1.power-off and org.freedesktop.login1.power-off-multiple-sessions"},
};

/** A power state of the list in property 125, and the method that tells whether the machine can be put into it. */
struct ListedState {
    unsigned int state;
    const char* canMethod;
};

/** As CIM numbers power states: sleep - deep, power cycle, hibernate, off - soft. */
constexpr std::array listedStates = {ListedState{4, "CanSuspend"}, ListedState{5, "CanReboot"},
                                     ListedState{7, "CanHibernate"}, ListedState{8, "CanPowerOff"}};
/** The machine that runs this is on, and stays so where nothing else is asked of it. */
constexpr unsigned int listedOn = 2;

constexpr const char* yes = "yes";

std::string user() {
    return "uid " + std::to_string(geteuid());
}

/** Why a machine does not do what it was asked whether it can. */
std::string meaningOf(const std::string& answer, const Transition& transition) {
    if (answer == "na") {
        return "this machine cannot do it";
    }
    if (answer == "no") {
        return user() + " may not do it: it needs the rights " + transition.actions;
    }
    if (answer == "challenge") {
        return user() + " could do it only after authentication, which nobody is asked for here: it needs the rights " +
               transition.actions;
    }
    return "expected \"yes\"";
}

std::string describe(const Transition& transition, const std::string& answer) {
    return std::string(transition.canMethod) + " answers \"" + answer + "\": " + meaningOf(answer, transition);
}

std::string describe(const Inhibitor& inhibitor) {
    return inhibitor.who + " (" + inhibitor.why + "; process " + std::to_string(inhibitor.pid) + ", uid " +
           std::to_string(inhibitor.uid) + ')';
}

std::string describe(const std::vector<Inhibitor>& inhibitors) {
    std::string text = "inhibited by ";
    for (const Inhibitor& inhibitor : inhibitors) {
        text += (&inhibitor == &inhibitors.front() ? "" : ", by ") + describe(inhibitor);
    }
    return text;
}

/** A shutdown that is under way, asked for by whomever. */
struct Pending {
    unsigned int state;
    /** For people: what, and when. */
    std::string description;
};

std::optional<Pending> pendingOn(Logind& logind) {
    const bool preparing = logind.isPreparingForShutdown();
    const ScheduledShutdown scheduled = logind.scheduledShutdown();
    if (scheduled.type.empty()) {
        return preparing ? std::optional(Pending{goingDown, "the machine is going down"}) : std::nullopt;
    }
    const auto* const transition = std::ranges::find(transitions, scheduled.type, &Transition::scheduledType);
    // There are others, such as "halt" and "kexec".
    const unsigned int state = transition != transitions.end() ? transition->state : goingDown;
    return Pending{state,
                   scheduled.type + (preparing ? " is under way"
                                               : " is scheduled for " +
                                                     inUtc(std::chrono::floor<std::chrono::seconds>(scheduled.time)))};
}

/** The lock on a file, held by one process and thread at a time. */
class Lock {
public:
    /** @throws std::system_error where the file cannot be opened, or others hold the lock until the deadline. */
    Lock(const std::filesystem::path& file, const Deadline& deadline)
        : _descriptor(::open(file.c_str(), O_RDONLY | O_CLOEXEC | O_NOCTTY)) {
        if (_descriptor < 0) {
            throw std::system_error(errno, std::generic_category(), file.string() + ": cannot be opened");
        }
        while (::flock(_descriptor, LOCK_EX | LOCK_NB) != 0) {
            const int error = errno;
            if ((error != EWOULDBLOCK && error != EINTR) || deadline.remaining().count() == 0) {
                ::close(_descriptor);
                throw std::system_error(error, std::generic_category(), file.string() + ": cannot be locked");
            }
            constexpr timespec pause{.tv_sec = 0, .tv_nsec = 10'000'000};
            ::nanosleep(&pause, nullptr);
        }
    }
    ~Lock() {
        // Closing would not do: a child that the host has just forked holds the same lock.
        ::flock(_descriptor, LOCK_UN);
        ::close(_descriptor);
    }
    Lock(const Lock&) = delete;
    Lock& operator=(const Lock&) = delete;

private:
    int _descriptor;
};

/** A request that systemd-logind was not asked to fulfil. what() is the reason. */
class Refusal : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/** @throws Refusal where something speaks against it now. */
void requireThatItCanBeDone(Logind& logind, const Transition& transition) {
    if (const auto pending = pendingOn(logind)) {
        throw Refusal("another request is in progress: " + pending->description);
    }
    // Systemd-logind would let the superuser do it all the same.
    if (const auto inhibitors = logind.shutdownInhibitors(); !inhibitors.empty()) {
        throw Refusal(describe(inhibitors));
    }
    if (const std::string answer = logind.can(transition.canMethod); answer != yes) {
        throw Refusal(describe(transition, answer));
    }
}

/** Has systemd-logind do it. @return when, for people. */
std::string carryOut(Logind& logind, const Transition& transition, std::chrono::milliseconds delay) {
    if (delay.count() == 0) {
        logind.shutDown(transition.method);
        return "at once";
    }
    const WallTime time = std::chrono::floor<std::chrono::microseconds>(std::chrono::system_clock::now()) + delay;
    try {
        logind.scheduleShutdown({transition.scheduledType, time});
    } catch (const LogindError& error) {
        if (error.kind() == LogindError::Kind::unanswered) {
            // The call may still be waiting. It was refused here, and must not bring the machine down later.
            logind.cancelScheduledShutdown();
        }
        throw;
    }
    return "at " + inUtc(std::chrono::floor<std::chrono::seconds>(time)) + ", in " + inSeconds(delay);
}

std::string adviceFor(LogindError::Kind kind) {
    switch (kind) {
    case LogindError::Kind::noBus:
        return ": start the system bus (dbus.service), or give " + user() + " access to it";
    case LogindError::Kind::noService:
        return ": install systemd-logind and start it (systemd-logind.service)";
    case LogindError::Kind::refused:
        return ": let the policy of the system bus and of polkit allow it to " + user();
    case LogindError::Kind::unanswered:
        break;
    }
    return ": look into the journal of systemd-logind (journalctl --unit systemd-logind)";
}

} // namespace

class LogindBackend::Selection final : public NodeSelection {
public:
    explicit Selection(const LogindBackend& backend) : _backend(backend) {
        try {
            Logind logind{Deadline(backend._settings.timeout)};
            const auto pending = pendingOn(logind);
            _states.push_back(listedOn);
            for (const ListedState& listed : listedStates) {
                if (logind.can(listed.canMethod) == yes) {
                    _states.push_back(listed.state);
                }
            }
            std::ranges::sort(_states);
            _state = pending ? pending->state : running;
        } catch (const LogindError& error) {
            _states.clear();
            report(failureLevel, std::string("The power state of this machine cannot be told: ") + error.what());
        }
    }

    std::size_t size() const override { return 1; }

    const std::string& path(std::size_t /*node*/) const override {
        static const std::string path = nodePath;
        return path;
    }

    std::optional<unsigned int> powerState(std::size_t /*node*/) const override { return _state; }

    const std::vector<unsigned int>& powerStates(std::size_t /*node*/) const override { return _states; }

    PowerRequestOutcome requestPowerState(std::size_t node, unsigned int state) override {
        const std::string where = "of this machine, node " + path(node);
        const auto* const transition = std::ranges::find(transitions, state, &Transition::state);
        if (transition == transitions.end()) {
            return {false,
                    "power state " + std::to_string(state) + ' ' + where + ": expected " + acceptedStates(transitions)};
        }
        const std::string what = transition->name + (' ' + where);
        const Deadline deadline(_backend._settings.timeout);
        try {
            const Lock lock(_backend._lockFile, deadline);
            Logind logind(deadline);
            requireThatItCanBeDone(logind, *transition);
            const std::string when = carryOut(logind, *transition, _backend._settings.delay);
            _state = state;
            return {true, what + ", " + when};
        } catch (const std::exception& error) {
            return {false, what + ": " + error.what()};
        }
    }

private:
    const LogindBackend& _backend;
    /** Not set where it cannot be told. */
    std::optional<unsigned int> _state;
    std::vector<unsigned int> _states;
};

LogindBackend::LogindBackend(const LogindSettings& settings, std::filesystem::path lockFile)
    : _settings(settings), _lockFile(std::move(lockFile)) {}

std::unique_ptr<NodeSelection> LogindBackend::selectPowerManagementNodes() {
    return std::make_unique<Selection>(*this);
}

std::string LogindBackend::machine() const {
    return "this machine through systemd-logind (requests take effect after " + inSeconds(_settings.delay) + ')';
}

MachineReport LogindBackend::examine() {
    MachineReport found;
    try {
        Logind logind{Deadline(_settings.timeout)};
        const auto pending = pendingOn(logind);
        found.facts.push_back({"under way", pending ? pending->description : "nothing"});
        for (const Transition& transition : transitions) {
            const std::string answer = logind.can(transition.canMethod);
            found.facts.push_back({transition.name, answer});
            if (answer != yes) {
                found.problems.push_back(describe(transition, answer));
            }
        }
        for (const auto& [name, method] :
             {std::pair{"sleep", "CanSuspend"}, std::pair{"hibernation", "CanHibernate"}}) {
            found.facts.push_back({name, logind.can(method)});
        }
        if (const auto inhibitors = logind.shutdownInhibitors(); !inhibitors.empty()) {
            found.problems.push_back("requests are refused for now: " + describe(inhibitors) +
                                     ": wait for it, or end it");
        }
    } catch (const LogindError& error) {
        found.problems.push_back(error.what() + adviceFor(error.kind()));
    }
    return found;
}

} // namespace Norv::Agent
