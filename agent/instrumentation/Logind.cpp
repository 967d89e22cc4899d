#include "Logind.h"

#include "Wording.h"

#include <dlfcn.h>
#include <systemd/sd-bus.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <string_view>
#include <system_error>

namespace Norv::Agent {

namespace {

constexpr const char* service = "org.freedesktop.login1";
constexpr const char* path = "/org/freedesktop/login1";
constexpr const char* managerInterface = "org.freedesktop.login1.Manager";
constexpr const char* propertiesInterface = "org.freedesktop.DBus.Properties";

using Kind = LogindError::Kind;

/** The bus's errors for a service that is not there. */
constexpr std::array<std::string_view, 3> noServiceErrors = {
    SD_BUS_ERROR_SERVICE_UNKNOWN, SD_BUS_ERROR_NAME_HAS_NO_OWNER, "org.freedesktop.systemd1.NoSuchUnit"};
/** systemd's error for a service that must not be started. */
constexpr std::string_view maskedError = "org.freedesktop.systemd1.UnitMasked";
/**
 * systemd's error if systemd-logind was masked while it ran: D-Bus starts it by an alias, which systemd cannot load any
 * more.
 */
constexpr std::string_view maskedAliasError = SD_BUS_ERROR_FILE_EXISTS;
/** The bus's errors for a service that ended before it answered. */
constexpr std::array<std::string_view, 2> unansweredErrors = {SD_BUS_ERROR_NO_REPLY, SD_BUS_ERROR_DISCONNECTED};

std::string textOf(int error) {
    return std::generic_category().message(error);
}

/** A text of another program, without characters that would break a line or control a terminal. Null becomes empty. */
std::string printable(const char* text) {
    std::string result(text == nullptr ? "" : text);
    std::ranges::replace_if(
        result, [](unsigned char character) { return character < 0x20 || character == 0x7f; }, ' ');
    return result;
}

/**
 * systemd's library, which implements D-Bus. It is loaded when it is first needed, and stays loaded: together with its
 * dependencies it is larger than the agent, and hosts of a simulated machine never need it.
 */
class Libsystemd {
public:
    // Its functions, by their own names. NOLINTNEXTLINE(bugprone-macro-parentheses): a name is declared
#define ORV_FUNCTION(name) decltype(&::name) name = reinterpret_cast<decltype(&::name)>(function(#name))
    ORV_FUNCTION(sd_bus_call);
    ORV_FUNCTION(sd_bus_call_async);
    ORV_FUNCTION(sd_bus_close_unref);
    ORV_FUNCTION(sd_bus_error_free);
    ORV_FUNCTION(sd_bus_is_open);
    ORV_FUNCTION(sd_bus_is_ready);
    ORV_FUNCTION(sd_bus_message_append);
    ORV_FUNCTION(sd_bus_message_enter_container);
    ORV_FUNCTION(sd_bus_message_get_error);
    ORV_FUNCTION(sd_bus_message_new_method_call);
    ORV_FUNCTION(sd_bus_message_read);
    ORV_FUNCTION(sd_bus_message_set_expect_reply);
    ORV_FUNCTION(sd_bus_message_ref);
    ORV_FUNCTION(sd_bus_message_rewind);
    ORV_FUNCTION(sd_bus_message_unref);
    ORV_FUNCTION(sd_bus_open_system);
    ORV_FUNCTION(sd_bus_process);
    ORV_FUNCTION(sd_bus_send);
    ORV_FUNCTION(sd_bus_wait);
#undef ORV_FUNCTION

private:
    static void* require(void* found) {
        if (found == nullptr) {
            throw LogindError(Kind::noBus, std::string("the system bus cannot be reached: ") + dlerror());
        }
        return found;
    }

    static void* function(const char* name) {
        static void* const library = require(dlopen("libsystemd.so.0", RTLD_NOW | RTLD_NODELETE));
        return require(dlsym(library, name));
    }
};

/** @throws LogindError if the library cannot be loaded. The next call tries again. */
const Libsystemd& libsystemd() {
    static const Libsystemd library;
    return library;
}

std::string textOf(const sd_bus_error& error) {
    return printable(error.name) + ": " + printable(error.message);
}

bool isOneOf(const auto& names, const std::string& name) {
    return std::ranges::find(names, name) != names.end();
}

class BusErrorText {
public:
    BusErrorText() = default;
    ~BusErrorText() { libsystemd().sd_bus_error_free(&_error); }
    BusErrorText(const BusErrorText&) = delete;
    BusErrorText& operator=(const BusErrorText&) = delete;

    sd_bus_error* target() { return &_error; }

    std::string name() const { return printable(_error.name); }
    std::string text() const { return textOf(_error); }

private:
    sd_bus_error _error = SD_BUS_ERROR_NULL;
};

[[noreturn]] void failToConnect(const std::string& reason) {
    const char* address = std::getenv("DBUS_SYSTEM_BUS_ADDRESS");
    throw LogindError(Kind::noBus, "the system bus" +
                                       (address == nullptr ? std::string() : " at " + printable(address)) +
                                       " cannot be reached: " + reason);
}

/** Checks a result of sd-bus of a call that fails only if memory is short or an answer has an unexpected type. */
void require(int result, const char* method) {
    if (result < 0) {
        throw LogindError(Kind::refused, std::string(method) + ": " + textOf(-result));
    }
}

/** Whether a list of names, separated by colons, contains a name. */
bool contains(std::string_view list, std::string_view name) {
    for (;;) {
        const std::size_t end = list.find(':');
        if (list.substr(0, end) == name) {
            return true;
        }
        if (end == std::string_view::npos) {
            return false;
        }
        list.remove_prefix(end + 1);
    }
}

} // namespace

void Logind::Closer::operator()(sd_bus* bus) const {
    libsystemd().sd_bus_close_unref(bus);
}

void Logind::Unreferencer::operator()(sd_bus_message* message) const {
    libsystemd().sd_bus_message_unref(message);
}

Logind::Logind(const Deadline& deadline) : _deadline(deadline) {
    if (_deadline.remaining().count() == 0) {
        throw LogindError(Kind::unanswered,
                          "there was no answer within " + inSeconds(_deadline.whole()) + ", a moment ago");
    }
    sd_bus* bus = nullptr;
    if (const int result = libsystemd().sd_bus_open_system(&bus); result < 0) {
        failToConnect(textOf(-result));
    }
    _bus.reset(bus);
    waitUntilConnected();
}

// The first call would connect, too, but without a timeout if the bus accepts the connection and never answers.
void Logind::waitUntilConnected() {
    for (;;) {
        const int ready = libsystemd().sd_bus_is_ready(_bus.get());
        if (ready > 0) {
            return;
        }
        int result = ready < 0 ? ready : libsystemd().sd_bus_process(_bus.get(), nullptr);
        if (result == 0) {
            const auto remaining = _deadline.remaining();
            if (remaining.count() == 0) {
                failToConnect("it does not answer within " + inSeconds(_deadline.whole()));
            }
            result = libsystemd().sd_bus_wait(_bus.get(), static_cast<std::uint64_t>(remaining.count()));
        }
        if (result < 0 && result != -EINTR) {
            failToConnect(textOf(-result));
        }
    }
}

Logind::Message Logind::newCall(const char* interface, const char* method) {
    sd_bus_message* call = nullptr;
    require(libsystemd().sd_bus_message_new_method_call(_bus.get(), &call, service, path, interface, method), method);
    return Message(call);
}

Logind::Message Logind::newQuestion(const char* question) {
    constexpr std::array<std::string_view, 2> properties = {preparingForShutdown, scheduledShutdownProperty};
    if (std::ranges::find(properties, question) == properties.end()) {
        return newCall(managerInterface, question);
    }
    Message call = newCall(propertiesInterface, "Get");
    require(libsystemd().sd_bus_message_append(call.get(), "ss", managerInterface, question), question);
    return call;
}

Logind::Message Logind::send(const Message& call, const char* method) {
    const auto remaining = static_cast<std::uint64_t>(_deadline.remaining().count());
    if (remaining == 0) {
        // sd-bus would take 0 for its default timeout.
        failToAnswer(method, -ETIMEDOUT);
    }
    BusErrorText error;
    sd_bus_message* reply = nullptr;
    const int result = libsystemd().sd_bus_call(_bus.get(), call.get(), remaining, error.target(), &reply);
    if (result < 0) {
        failToAnswer(method, result, error.name(), error.text());
    }
    _answers = true;
    return Message(reply);
}

void Logind::askTogether(std::span<const char* const> questions) {
    const auto keep = [](sd_bus_message* answer, void* asked, sd_bus_error*) {
        static_cast<Asked*>(asked)->answer.reset(libsystemd().sd_bus_message_ref(answer));
        return 1;
    };
    for (const char* question : questions) {
        const Message call = newQuestion(question);
        _asked.push_back({question, Message()});
        require(libsystemd().sd_bus_call_async(_bus.get(), nullptr, call.get(), keep, &_asked.back(),
                                               std::numeric_limits<std::uint64_t>::max()),
                question);
    }
    // If the connection is lost or the time is over, the questions without an answer report it later.
    while (std::ranges::any_of(_asked, [](const Asked& asked) { return asked.answer == nullptr; })) {
        int result = libsystemd().sd_bus_process(_bus.get(), nullptr);
        if (result == 0) {
            const auto remaining = _deadline.remaining();
            if (remaining.count() == 0) {
                return;
            }
            result = libsystemd().sd_bus_wait(_bus.get(), static_cast<std::uint64_t>(remaining.count()));
        }
        if (result < 0 && result != -EINTR) {
            return;
        }
    }
}

Logind::Message Logind::answerTo(const char* question) {
    const auto asked = std::ranges::find(_asked, std::string_view(question), &Asked::question);
    if (asked == _asked.end()) {
        return send(newQuestion(question), question);
    }
    if (asked->answer == nullptr) {
        failToAnswer(question, -ECONNRESET);
    }
    if (const sd_bus_error* error = libsystemd().sd_bus_message_get_error(asked->answer.get())) {
        failToAnswer(question, -ECONNRESET, printable(error->name), textOf(*error));
    }
    _answers = true;
    require(libsystemd().sd_bus_message_rewind(asked->answer.get(), 1), question);
    return Message(libsystemd().sd_bus_message_ref(asked->answer.get()));
}

void Logind::failToAnswer(const char* method, int result, const std::string& error, const std::string& text) {
    const auto unanswered = [method](const std::string& reason) {
        return LogindError(Kind::unanswered, std::string(method) + ": " + reason);
    };
    if (_deadline.remaining().count() == 0) {
        throw unanswered("systemd-logind does not answer within " + inSeconds(_deadline.whole()));
    }
    // An error with an open connection is an answer; with a closed one, there is none.
    if (libsystemd().sd_bus_is_open(_bus.get()) <= 0) {
        throw unanswered("the connection to the system bus was lost: " + textOf(-result));
    }
    if (isOneOf(unansweredErrors, error)) {
        throw unanswered("systemd-logind ended without an answer: " + text);
    }
    if (isOneOf(noServiceErrors, error)) {
        throw LogindError(Kind::noService, "systemd-logind is not on the system bus: " + text);
    }
    if (error == maskedError || (!_answers && error == maskedAliasError)) {
        throw _answers ? LogindError(Kind::polkitMasked, std::string(method) +
                                                             ": polkit is masked, which "
                                                             "systemd-logind has to ask: " +
                                                             text)
                       : LogindError(Kind::masked, "systemd-logind is masked: " + text);
    }
    throw LogindError(Kind::refused, std::string(method) + ": " + text);
}

bool Logind::isPreparingForShutdown() {
    constexpr const char* name = preparingForShutdown;
    const Message reply = answerTo(name);
    int preparing = 0;
    require(libsystemd().sd_bus_message_read(reply.get(), "v", "b", &preparing), name);
    return preparing != 0;
}

ScheduledShutdown Logind::scheduledShutdown() {
    constexpr const char* name = scheduledShutdownProperty;
    const Message reply = answerTo(name);
    const char* type = nullptr;
    std::uint64_t time = 0;
    require(libsystemd().sd_bus_message_read(reply.get(), "v", "(st)", &type, &time), name);
    // The largest number means "never".
    const auto latest = static_cast<std::uint64_t>(endOfTime.time_since_epoch().count());
    return {printable(type), WallTime(std::chrono::microseconds(std::min(time, latest)))};
}

std::string Logind::can(const char* method) {
    const Message reply = answerTo(method);
    const char* answer = nullptr;
    require(libsystemd().sd_bus_message_read(reply.get(), "s", &answer), method);
    return printable(answer);
}

std::vector<Inhibitor> Logind::shutdownInhibitors() {
    constexpr const char* method = listInhibitors;
    const Message reply = answerTo(method);
    require(libsystemd().sd_bus_message_enter_container(reply.get(), 'a', "(ssssuu)"), method);
    std::vector<Inhibitor> inhibitors;
    for (;;) {
        const char* what = nullptr;
        const char* who = nullptr;
        const char* why = nullptr;
        const char* mode = nullptr;
        std::uint32_t uid = 0;
        std::uint32_t pid = 0;
        const int result =
            libsystemd().sd_bus_message_read(reply.get(), "(ssssuu)", &what, &who, &why, &mode, &uid, &pid);
        require(result, method);
        if (result == 0) {
            return inhibitors;
        }
        // The modes "block" and "block-weak" forbid a shutdown; the mode "delay" does not.
        if (contains(what, "shutdown") && std::string_view(mode).starts_with("block")) {
            inhibitors.push_back({printable(who), printable(why), uid, pid});
        }
    }
}

void Logind::shutDown(const char* method) {
    const Message call = newCall(managerInterface, method);
    constexpr int interactive = 0;
    require(libsystemd().sd_bus_message_append(call.get(), "b", interactive), method);
    send(call, method);
}

void Logind::scheduleShutdown(const ScheduledShutdown& shutdown) {
    constexpr const char* method = "ScheduleShutdown";
    const Message call = newCall(managerInterface, method);
    const auto time = static_cast<std::uint64_t>(shutdown.time.time_since_epoch().count());
    require(libsystemd().sd_bus_message_append(call.get(), "st", shutdown.type.c_str(), time), method);
    send(call, method);
}

bool Logind::cancelScheduledShutdown() {
    constexpr const char* method = "CancelScheduledShutdown";
    const Message reply = send(newCall(managerInterface, method), method);
    int cancelled = 0;
    require(libsystemd().sd_bus_message_read(reply.get(), "b", &cancelled), method);
    return cancelled != 0;
}

void Logind::takeBackScheduledShutdown() noexcept {
    sd_bus_message* call = nullptr;
    if (libsystemd().sd_bus_message_new_method_call(_bus.get(), &call, service, path, managerInterface,
                                                    "CancelScheduledShutdown") >= 0) {
        const Message owner(call);
        libsystemd().sd_bus_message_set_expect_reply(call, 0);
        libsystemd().sd_bus_send(_bus.get(), call, nullptr);
    }
}

} // namespace Norv::Agent
