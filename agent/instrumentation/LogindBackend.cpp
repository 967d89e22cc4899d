#include "LogindBackend.h"

#include "Logind.h"
#include "Patience.h"
#include "Report.h"
#include "Wording.h"
#include "base/Folders.h"
#include "base/LockFile.h"
#include "base/UtcText.h"

#include <algorithm>
#include <array>
#include <functional>
#include <initializer_list>
#include <iterator>
#include <stdexcept>
#include <system_error>
#include <utility>

#include <unistd.h>

namespace Norv::Agent {

namespace {

constexpr const char* nodePath = "system";

/** The value of property 123 while the machine runs. */
constexpr unsigned int running = 1;
/** The value of property 123 while the machine goes down for an unknown reason. */
constexpr unsigned int goingDown = 12;

/** A request that the machine can carry out. */
struct Transition {
    /** The value that is written to property 123, and that it has from then on. */
    unsigned int state;
    const char* name;
    /** The methods of systemd-logind. */
    const char* method;
    const char* canMethod;
    /** systemd-logind's name for it as a scheduled shutdown. */
    const char* scheduledType;
    /** The actions of polkit that it needs. */
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

/** The numbers are CIM's power states: sleep - deep, power cycle (off - soft), hibernate, off - soft. */
constexpr std::array listedStates = {ListedState{4, "CanSuspend"}, ListedState{5, "CanReboot"},
                                     ListedState{7, "CanHibernate"}, ListedState{8, "CanPowerOff"}};
/** CIM's power state "on": the machine that runs this program is always in it. */
constexpr unsigned int listedOn = 2;

constexpr const char* yes = "yes";

std::string user() {
    return "uid " + std::to_string(geteuid());
}

/** What the answer of a method such as CanReboot means, if it is not "yes". */
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

/** A shutdown that is under way, whoever requested it. */
struct Pending {
    unsigned int state;
    /** Its kind and time, for people. */
    std::string description;
    /** Whether the machine is already going down. */
    bool begun;
    /** When the machine goes down. */
    WallTime time;
};

/** What `pendingOn` asks. */
constexpr std::array pendingQuestions = {Logind::preparingForShutdown, Logind::scheduledShutdownProperty};

/** Asks at once what is under way, what the machine can be asked to do, and `more`. */
void askWhatItDoes(Logind& logind, std::initializer_list<const char*> more = {}) {
    std::vector<const char*> questions(more);
    questions.insert(questions.end(), pendingQuestions.begin(), pendingQuestions.end());
    std::ranges::transform(listedStates, std::back_inserter(questions), &ListedState::canMethod);
    logind.askTogether(questions);
}

std::optional<Pending> pendingOn(Logind& logind) {
    const bool preparing = logind.isPreparingForShutdown();
    const ScheduledShutdown scheduled = logind.scheduledShutdown();
    const WallTime now = std::chrono::floor<std::chrono::microseconds>(std::chrono::system_clock::now());
    if (scheduled.type.empty()) {
        return preparing ? std::optional(Pending{goingDown, "the machine is going down", true, now}) : std::nullopt;
    }
    const auto* const transition = std::ranges::find(transitions, scheduled.type, &Transition::scheduledType);
    // Other types are possible, such as "halt" and "kexec".
    const unsigned int state = transition != transitions.end() ? transition->state : goingDown;
    if (preparing) {
        return Pending{state, scheduled.type + " is under way", true, now};
    }
    return Pending{state, scheduled.type + " is scheduled for " + UtcText(scheduled.time).inSeconds(), false,
                   scheduled.time};
}

/** @throws Refusal if the machine cannot carry the request out now. */
void requireThatItCanBeDone(Logind& logind, const Transition& transition) {
    askWhatItDoes(logind, {Logind::listInhibitors});
    if (const auto pending = pendingOn(logind)) {
        throw Refusal("another request is in progress: " + pending->description);
    }
    // systemd-logind would ignore inhibitors if root makes the request, so they are checked here.
    if (const auto inhibitors = logind.shutdownInhibitors(); !inhibitors.empty()) {
        throw Refusal(describe(inhibitors));
    }
    if (const std::string answer = logind.can(transition.canMethod); answer != yes) {
        throw Refusal(describe(transition, answer));
    }
}

/** Makes the request of systemd-logind: for a time, or at once. */
void carryOut(Logind& logind, const Transition& transition, WallTime time, bool atOnce) {
    if (atOnce) {
        logind.shutDown(transition.method);
        return;
    }
    const ScheduledShutdown shutdown{transition.scheduledType, time};
    try {
        logind.scheduleShutdown(shutdown);
    } catch (const LogindError& error) {
        if (error.kind() == LogindError::Kind::unanswered) {
            // systemd-logind may still receive the call later. The request counts as refused here, so it must have no
            // effect then.
            logind.takeBackScheduledShutdown();
        }
        throw;
    }
}

std::string adviceFor(LogindError::Kind kind) {
    switch (kind) {
    case LogindError::Kind::noBus:
        return ": start the system bus (dbus.service), or give " + user() + " access to it";
    case LogindError::Kind::noService:
        return ": install systemd-logind and start it (systemd-logind.service)";
    case LogindError::Kind::masked:
        return ": let it be started again (systemctl unmask systemd-logind.service)";
    case LogindError::Kind::polkitMasked:
        return ": let polkit be started again (systemctl unmask polkit.service), or have root make the requests: " +
               user() + " needs polkit's leave";
    case LogindError::Kind::refused:
        return ": let the policy of the system bus and of polkit allow it to " + user();
    case LogindError::Kind::unanswered:
        break;
    }
    return ": look into the journal of systemd-logind (journalctl --unit systemd-logind)";
}

/** The reason; for a masked service, with advice: somebody has masked it on purpose and may have forgotten it. */
std::string reasonOf(const LogindError& error) {
    const bool isMasked = error.kind() == LogindError::Kind::masked || error.kind() == LogindError::Kind::polkitMasked;
    return error.what() + (isMasked ? adviceFor(error.kind()) : std::string());
}

/** The list in property 125: what the machine can be asked to do. */
std::vector<unsigned int> listedStatesOf(Logind& logind) {
    std::vector<unsigned int> states{listedOn};
    try {
        for (const ListedState& listed : listedStates) {
            if (logind.can(listed.canMethod) == yes) {
                states.push_back(listed.state);
            }
        }
    } catch (const LogindError& error) {
        if (error.kind() != LogindError::Kind::polkitMasked) {
            throw;
        }
        report(failureLevel, std::string("What this machine can be asked to do cannot be told: ") + reasonOf(error));
    }
    std::ranges::sort(states);
    return states;
}

/** The same without what cannot be told: a request that can be carried out does not depend on it. */
std::vector<unsigned int> listedStatesIfTold(Logind& logind) {
    try {
        return listedStatesOf(logind);
    } catch (const LogindError&) {
        return {listedOn};
    }
}

} // namespace

class LogindBackend::Selection final : public NodeSelection {
public:
    explicit Selection(LogindBackend& backend) : _backend(backend) {}

    std::size_t size() const override { return 1; }

    const std::string& path(std::size_t /*node*/) const override {
        // Never destroyed: cursors may be used until the process ends.
        static const std::string& path = *new std::string(nodePath);
        return path;
    }

    std::optional<unsigned int> powerState(std::size_t /*node*/) const override { return reading().state; }

    const std::vector<unsigned int>& powerStates(std::size_t /*node*/) const override { return reading().powerStates; }

    PowerRequestOutcome requestPowerState(std::size_t node, unsigned int state) override {
        const std::string where = "of this machine, node " + path(node);
        const auto* const transition = std::ranges::find(transitions, state, &Transition::state);
        if (transition == transitions.end()) {
            return {false,
                    "power state " + std::to_string(state) + ' ' + where + ": expected " + acceptedStates(transitions)};
        }
        const std::string what = transition->name + (' ' + where);
        return attempt(what, [&](Logind& logind) {
            requireThatItCanBeDone(logind, *transition);
            const std::chrono::milliseconds delay = _backend._settings.delay;
            const bool atOnce = delay.count() == 0;
            const WallTime time =
                std::chrono::floor<std::chrono::microseconds>(std::chrono::system_clock::now()) + delay;
            std::string description = what;
            description += atOnce ? ", at once" : ", at " + UtcText(time).inSeconds() + ", in " + inSeconds(delay);
            Reading requested{state, listedStatesIfTold(logind)};
            EndOfTheMachine::Node ending{state, requested.powerStates};
            carryOut(logind, *transition, time, atOnce);
            _reading = std::move(requested);
            _backend._end.note(time, atOnce, std::move(ending));
            return description;
        });
    }

    PowerRequestOutcome cancelRequest(std::size_t node) override {
        const std::string what = "cancellation of the request of this machine, node " + path(node);
        return attempt(what, [&](Logind& logind) {
            logind.askTogether(pendingQuestions);
            const auto pending = pendingOn(logind);
            if (!pending) {
                throw Refusal("no request is in progress");
            }
            std::string description = what + " (" + pending->description + ')';
            if (pending->begun || !logind.cancelScheduledShutdown()) {
                throw Refusal("it is too late: " + pending->description);
            }
            _reading.reset();
            _backend._end.forget();
            return description;
        });
    }

private:
    /**
     * The timeout for questions after the time of a shutdown has come: systemd-logind may have ended, and this process
     * is about to.
     */
    static constexpr std::chrono::milliseconds shortTimeout{500};

    struct Reading {
        /** No value if the state is not known. */
        std::optional<unsigned int> state;
        std::vector<unsigned int> powerStates;
    };

    /** The node's states, which are read when they are first asked for: whoever only writes need not wait for them. */
    const Reading& reading() const {
        if (!_reading) {
            _reading = read();
        }
        return *_reading;
    }

    Reading read() const {
        if (const auto known = _backend._end.begun()) {
            return {known->state, known->powerStates};
        }
        const auto due = _backend._end.due();
        try {
            const Patience patience(due ? std::min(_backend._settings.timeout, shortTimeout)
                                        : _backend._settings.timeout);
            Logind logind(patience.deadline());
            return readFrom(logind);
        } catch (const LogindError& error) {
            if (due) {
                return {due->state, due->powerStates};
            }
            report(failureLevel, std::string("The power state of this machine cannot be told: ") + reasonOf(error));
            return {};
        }
    }

    Reading readFrom(Logind& logind) const {
        askWhatItDoes(logind);
        const auto pending = pendingOn(logind);
        Reading found{pending ? pending->state : running, listedStatesOf(logind)};
        if (pending) {
            _backend._end.note(pending->time, pending->begun, {pending->state, found.powerStates});
        } else {
            _backend._end.forget();
        }
        return found;
    }

    /** @param action makes the request of systemd-logind; returns the description, or throws the reason of a refusal.
     */
    PowerRequestOutcome attempt(const std::string& what, const std::function<std::string(Logind&)>& action) {
        const Patience patience(_backend._settings.timeout);
        try {
            createMissingFolders(_backend._settings.lockFile.parent_path());
            const LockFile lock(_backend._settings.lockFile, patience.deadline());
            Logind logind(patience.deadline());
            return {true, action(logind)};
        } catch (const LogindError& error) {
            return {false, what + ": " + reasonOf(error)};
        } catch (const std::exception& error) {
            return {false, what + ": " + error.what()};
        }
    }

    LogindBackend& _backend;
    mutable std::optional<Reading> _reading;
};

std::unique_ptr<NodeSelection> LogindBackend::selectPowerManagementNodes() {
    return std::make_unique<Selection>(*this);
}

std::string LogindBackend::machine() const {
    return "this machine through systemd-logind (requests take effect after " + inSeconds(_settings.delay) + ')';
}

MachineReport LogindBackend::examine() {
    MachineReport found;
    try {
        requireWritable(_settings.lockFile.parent_path());
        const Patience patience(_settings.timeout);
        Logind logind(patience.deadline());
        askWhatItDoes(logind, {Logind::listInhibitors});
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
    } catch (const std::system_error& error) {
        found.problems.push_back(std::string(error.what()) + ": let " + user() +
                                 " write there, or name another lock-file");
    }
    return found;
}

} // namespace Norv::Agent
