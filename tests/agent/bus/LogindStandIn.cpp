#include "LogindStandIn.h"

#include <systemd/sd-bus.h>

#include <array>
#include <cerrno>
#include <string_view>
#include <system_error>

#include <poll.h>
#include <sys/eventfd.h>
#include <unistd.h>

namespace AgentTest {

namespace {

void requireSuccess(int result, const char* what) {
    if (result < 0) {
        throw std::system_error(-result, std::generic_category(), what);
    }
}

} // namespace

void LogindStandIn::Unreferencer::operator()(sd_bus* bus) const {
    sd_bus_flush_close_unref(bus);
}

void LogindStandIn::Unreferencer::operator()(sd_bus_message* message) const {
    sd_bus_message_unref(message);
}

LogindStandIn::LogindStandIn() : _end(eventfd(0, EFD_CLOEXEC)) {
    sd_bus* bus = nullptr;
    requireSuccess(sd_bus_open_system(&bus), "sd_bus_open_system");
    _bus.reset(bus);
    const auto take = [](sd_bus_message* call, void* standIn, sd_bus_error* /*error*/) {
        static_cast<LogindStandIn*>(standIn)->take(call);
        return 1;
    };
    requireSuccess(sd_bus_add_object(bus, nullptr, "/org/freedesktop/login1", take, this), "sd_bus_add_object");
    requireSuccess(sd_bus_request_name(bus, "org.freedesktop.login1", 0), "org.freedesktop.login1");
    _thread = std::thread([this] { serve(); });
}

LogindStandIn::~LogindStandIn() {
    eventfd_write(_end, 1);
    _thread.join();
    close(_end);
}

void LogindStandIn::expect(std::vector<std::size_t> roundTrips) {
    const std::lock_guard guard(_mutex);
    _atOnce = roundTrips.empty();
    _roundTrips.assign(roundTrips.begin(), roundTrips.end());
    _unanswered.clear();
    _calls = 0;
    _connections.clear();
    _scheduled = {};
}

LogindStandIn::Asked LogindStandIn::asked() const {
    const std::lock_guard guard(_mutex);
    return {_calls, _connections.size()};
}

void LogindStandIn::serve() {
    for (;;) {
        const int done = sd_bus_process(_bus.get(), nullptr);
        if (done > 0) {
            continue;
        }
        std::array<pollfd, 2> ready{{{sd_bus_get_fd(_bus.get()), POLLIN, 0}, {_end, POLLIN, 0}}};
        if (done < 0 || poll(ready.data(), ready.size(), -1) < 0 || ready[1].revents != 0) {
            return;
        }
    }
}

void LogindStandIn::take(sd_bus_message* call) {
    const std::lock_guard guard(_mutex);
    ++_calls;
    _connections.insert(sd_bus_message_get_sender(call));
    if (_atOnce) {
        answer(call);
        return;
    }
    _unanswered.emplace_back(sd_bus_message_ref(call));
    if (!_roundTrips.empty() && --_roundTrips.front() == 0) {
        _roundTrips.pop_front();
        for (const Message& each : std::exchange(_unanswered, {})) {
            answer(each.get());
        }
    }
}

void LogindStandIn::answer(sd_bus_message* call) {
    const std::string_view method = sd_bus_message_get_member(call);
    if (method == "Get") {
        const char* interface = nullptr;
        const char* property = nullptr;
        sd_bus_message_read(call, "ss", &interface, &property);
        if (property == std::string_view("ScheduledShutdown")) {
            sd_bus_reply_method_return(call, "v", "(st)", _scheduled.first.c_str(), _scheduled.second);
        } else {
            sd_bus_reply_method_return(call, "v", "b", 0);
        }
    } else if (method == "ListInhibitors") {
        sd_bus_reply_method_return(call, "a(ssssuu)", 0);
    } else if (method == "ScheduleShutdown") {
        const char* type = nullptr;
        sd_bus_message_read(call, "st", &type, &_scheduled.second);
        _scheduled.first = type;
        sd_bus_reply_method_return(call, nullptr);
    } else if (method == "CancelScheduledShutdown") {
        sd_bus_reply_method_return(call, "b", _scheduled.first.empty() ? 0 : 1);
        _scheduled = {};
    } else if (method.starts_with("Can")) {
        sd_bus_reply_method_return(call, "s", "yes");
    } else {
        sd_bus_reply_method_errorf(call, SD_BUS_ERROR_UNKNOWN_METHOD, "%s", sd_bus_message_get_member(call));
    }
}

} // namespace AgentTest
