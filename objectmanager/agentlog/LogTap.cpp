#include "agentlog/LogTap.h"

#include <algorithm>
#include <deque>
#include <dlfcn.h>
#include <iterator>
#include <new>
#include <utility>

namespace ObjectManager {

namespace {

constexpr int lowestLevel = 5000;

struct ThreadRecords {
    /** The number of the tap that received the records. */
    std::uint64_t tap = 0;
    std::uint64_t newest = 0;
    std::deque<LogRecord> records;
    /** The kind and number of the last record of a power request that there was no memory for; 0 if there is none. */
    int unkeptKind = OrvLog::ORDINARY_RECORD;
    std::uint64_t unkept = 0;
};

/** Set when the ending thread has destroyed its records: its other destructors may still log. */
constinit thread_local bool isEnding = false;

struct EndingThreadRecords : ThreadRecords {
    EndingThreadRecords() = default;
    EndingThreadRecords(const EndingThreadRecords&) = delete;
    EndingThreadRecords& operator=(const EndingThreadRecords&) = delete;
    ~EndingThreadRecords() { isEnding = true; }
};

/** The records that a tap received in the calling thread. */
ThreadRecords& recordsOf(std::uint64_t tap) {
    thread_local EndingThreadRecords own;
    if (own.tap != tap) {
        ThreadRecords none;
        none.tap = tap;
        static_cast<ThreadRecords&>(own) = std::move(none);
    }
    return own;
}

std::uint64_t nextNumber() {
    static std::atomic<std::uint64_t> taps = 0;
    return ++taps;
}

bool isOrdinary(const LogRecord& record) {
    return record.kind == OrvLog::ORDINARY_RECORD;
}

template <typename Function>
Function* functionOf(void* library, const char* name) {
    return reinterpret_cast<Function*>(dlsym(library, name));
}

} // namespace

std::string_view messageOf(std::string_view text) {
    constexpr std::string_view frame = "MESSAGE [File: ";
    constexpr std::string_view frameEnd = "]: ";
    const std::size_t end = text.find(frameEnd);
    return text.starts_with(frame) && end != std::string_view::npos ? text.substr(end + frameEnd.size()) : text;
}

LogTap::LogTap()
    : _observer{.lowestLevel = lowestLevel, .record = &LogTap::keep, .context = this}, _number(nextNumber()) {}

LogTap::~LogTap() {
    for (const Heard& heard : _heard) {
        heard.observe(nullptr);
        dlclose(heard.library);
    }
}

void LogTap::attach(void* library) {
    if (auto* const machine = functionOf<Norv::Machine1>(library, Norv::machine1Name)) {
        _machine = machine;
    }
    if (auto* const node = functionOf<Norv::PowerNode1>(library, Norv::powerNode1Name)) {
        _powerNode = node;
    }
    if (auto* const state = functionOf<Norv::PowerState1>(library, Norv::powerState1Name)) {
        _powerState = state;
    }
    if (auto* const cancelRequest = functionOf<Norv::CancelRequest1>(library, Norv::cancelRequest1Name)) {
        _cancelRequest = cancelRequest;
    }
    if (auto* const onBehalfOf = functionOf<Norv::OnBehalfOf1>(library, Norv::onBehalfOf1Name)) {
        _onBehalfOf = onBehalfOf;
    }
    auto* const observe = functionOf<OrvLog::Observe1>(library, OrvLog::observe1Name);
    const std::lock_guard lock(_mutex);
    if (observe == nullptr || std::ranges::find(_heard, observe, &Heard::observe) != _heard.end()) {
        return;
    }
    Dl_info found{};
    if (dladdr(reinterpret_cast<void*>(observe), &found) != 0) {
        if (void* const own = dlopen(found.dli_fname, RTLD_NOW | RTLD_NOLOAD)) {
            _heard.push_back({observe, own});
            observe(&_observer);
        }
    }
}

bool LogTap::isAttached() const {
    const std::lock_guard lock(_mutex);
    return !_heard.empty();
}

bool LogTap::hearsPowerRequests() const {
    // An instrumentation without Norv::Machine1 does not number its records of power requests either.
    return isAttached() && _machine != nullptr;
}

bool LogTap::isSimulated() const {
    Norv::Machine1* const machine = _machine;
    return machine != nullptr && machine() == Norv::SIMULATED_MACHINE;
}

std::string LogTap::powerNode() const {
    Norv::PowerNode1* const node = _powerNode;
    return node == nullptr ? "" : node();
}

std::optional<unsigned int> LogTap::powerState() const {
    Norv::PowerState1* const tell = _powerState;
    const int state = tell == nullptr ? -1 : tell();
    return state < 0 ? std::nullopt : std::optional(static_cast<unsigned int>(state));
}

void LogTap::cancelPowerRequest() const {
    if (Norv::CancelRequest1* const cancel = _cancelRequest) {
        cancel();
    }
}

void LogTap::actFor(const char* whom) const {
    if (Norv::OnBehalfOf1* const onBehalfOf = _onBehalfOf) {
        onBehalfOf(whom);
    }
}

std::uint64_t LogTap::newest() const {
    return recordsOf(_number).newest;
}

std::vector<LogRecord> LogTap::since(std::uint64_t sequence) const {
    const ThreadRecords& own = recordsOf(_number);
    const auto first =
        std::ranges::find_if(own.records, [sequence](const LogRecord& record) { return record.sequence > sequence; });
    std::vector<LogRecord> records(first, own.records.end());
    if (own.unkept > sequence) {
        const bool accepted = own.unkeptKind == OrvLog::POWER_REQUEST_ACCEPTED_RECORD;
        LogRecord& unkept = records.emplace_back();
        unkept.kind = own.unkeptKind;
        unkept.text =
            std::string("Power request ") + (accepted ? "accepted" : "refused") + ": memory was too short for more";
        unkept.sequence = own.unkept;
    }
    return records;
}

std::vector<std::string> LogTap::failuresSince(std::uint64_t sequence) const {
    constexpr int failureLevel = 6000;
    std::vector<std::string> failures;
    for (const LogRecord& record : since(sequence)) {
        // Records about the machine, and about accepted power requests, are not failures, whatever their level.
        const bool isNews =
            record.kind == OrvLog::MACHINE_RECORD || record.kind == OrvLog::POWER_REQUEST_ACCEPTED_RECORD;
        if (record.level >= failureLevel && !isNews) {
            failures.emplace_back(messageOf(record.text));
        }
    }
    Norv::Machine1* const machine = _machine;
    if (!failures.empty() && machine != nullptr && machine() == Norv::NO_MACHINE) {
        // Of a process's failures, the first says what is wrong with the configuration.
        const std::lock_guard guard(_mutex);
        if (_mistake.empty()) {
            _mistake = failures.front() + " ('orvcim check' says more)";
        }
        return {_mistake};
    }
    return failures;
}

std::vector<LogRecord> LogTap::take() const {
    ThreadRecords& own = recordsOf(_number);
    own.unkept = 0;
    std::deque<LogRecord> taken = std::exchange(own.records, {});
    return {std::make_move_iterator(taken.begin()), std::make_move_iterator(taken.end())};
}

void LogTap::forget() const {
    ThreadRecords& own = recordsOf(_number);
    own.unkept = 0;
    own.records.clear();
}

void LogTap::keep(void* context, const OrvLog::ObservedRecord1* record) noexcept {
    if (isEnding) {
        return;
    }
    ThreadRecords* own = nullptr;
    try {
        own = &recordsOf(static_cast<const LogTap*>(context)->_number);
        ++own->newest;
        if (own->records.size() >= recordsPerThread) {
            if (const auto oldest = std::ranges::find_if(own->records, isOrdinary); oldest != own->records.end()) {
                own->records.erase(oldest);
            }
        }
        own->records.push_back({record->kind,
                                {record->category, record->categorySize},
                                record->level,
                                {record->text, record->textSize},
                                own->newest});
    } catch (const std::bad_alloc&) {
        // An ordinary record is lost. So is every record of a thread that did not ask for its newest one before.
        if (own != nullptr && (record->kind == OrvLog::POWER_REQUEST_ACCEPTED_RECORD ||
                               record->kind == OrvLog::POWER_REQUEST_REFUSED_RECORD)) {
            own->unkeptKind = record->kind;
            own->unkept = own->newest;
        }
    }
}

} // namespace ObjectManager
