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
    /** The kind and number of the newest record that is not ordinary and could not be kept, as memory was short. */
    int unkeptKind = OrvLog::ORDINARY_RECORD;
    /** 0 if there is no such record. */
    std::uint64_t unkept = 0;
};

/** Whether the ending thread has destroyed its records. Other destructors of the thread may log after that. */
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

/** A new handle of the loaded library that has a function; null if there is none. */
void* libraryOf(void* function) {
    Dl_info found{};
    return function == nullptr || dladdr(function, &found) == 0 ? nullptr
                                                                : dlopen(found.dli_fname, RTLD_NOW | RTLD_NOLOAD);
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
    if (_instrumentation != nullptr) {
        dlclose(_instrumentation);
    }
}

void LogTap::attach(void* library) {
    const std::lock_guard lock(_mutex);
    if (_instrumentation == nullptr) {
        _instrumentation = libraryOf(dlsym(library, Norv::machine1Name));
    }
    void* const function = dlsym(library, OrvLog::observe1Name);
    auto* const observe = reinterpret_cast<OrvLog::Observe1*>(function);
    if (std::ranges::find(_heard, observe, &Heard::observe) != _heard.end()) {
        return;
    }
    if (void* const own = libraryOf(function)) {
        _heard.push_back({observe, own});
        observe(&_observer);
    }
}

bool LogTap::isAttached() const {
    const std::lock_guard lock(_mutex);
    return !_heard.empty();
}

void* LogTap::agentSymbol(const char* name) const {
    void* const instrumentation = _instrumentation;
    return instrumentation == nullptr ? nullptr : dlsym(instrumentation, name);
}

bool LogTap::isSimulated() const {
    auto* const machine = agentFunction<Norv::Machine1>(Norv::machine1Name);
    return machine != nullptr && machine() == Norv::SIMULATED_MACHINE;
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
        LogRecord& unkept = records.emplace_back();
        unkept.kind = own.unkeptKind;
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
    auto* const machine = failures.empty() ? nullptr : agentFunction<Norv::Machine1>(Norv::machine1Name);
    if (machine != nullptr && machine() == Norv::NO_MACHINE) {
        // The first failure in the process says what is wrong with the configuration.
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
        // An ordinary record is lost. If even `recordsOf` failed, any record is; it cannot fail after `newest` was
        // called.
        if (own != nullptr && record->kind != OrvLog::ORDINARY_RECORD) {
            own->unkeptKind = record->kind;
            own->unkept = own->newest;
        }
    }
}

} // namespace ObjectManager
