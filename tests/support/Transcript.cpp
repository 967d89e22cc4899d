#include "Transcript.h"

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <utility>

namespace OrvTest {
namespace {

const std::string markFile = "include/Trace.h";

std::string place(const LogRecord& record) {
    return std::to_string(record.level) + ' ' + record.category + ' ' + record.function + ' ' + record.file;
}

std::string unfolded(const LogRecord& record) {
    const std::string kind = record.kind == LogRecord::Kind::log ? "log " : "trace ";
    return kind + place(record) + ':' + std::to_string(record.line) + ": " + record.text +
           (record.usualArguments ? "" : " (unusual arguments)");
}

bool isPair(const LogRecord& first, LogRecord second) {
    if (first.kind != LogRecord::Kind::log || second.kind != LogRecord::Kind::trace) {
        return false;
    }
    second.kind = LogRecord::Kind::log;
    return first == second && first.usualArguments;
}

/** The begin and end of the first line number in a text; npos if there is none. */
std::pair<std::size_t, std::size_t> findLineNumber(const std::string& text) {
    for (const std::string& before : {std::string("Line: "), std::string(" at line ")}) {
        const std::size_t found = text.find(before);
        if (found != std::string::npos) {
            return {found + before.size(), text.find_first_not_of("0123456789", found + before.size())};
        }
    }
    return {std::string::npos, std::string::npos};
}

std::string folded(const LogRecord& record) {
    const bool isMark = record.file == markFile;
    const auto [begin, end] = findLineNumber(record.text);
    std::string text = record.text;
    const bool isReplaced = begin < end && (isMark || text.substr(begin, end - begin) == std::to_string(record.line));
    if (isReplaced) {
        text.replace(begin, end - begin, "<line>");
    }
    const std::string line = isMark || !isReplaced ? ':' + std::to_string(record.line) : "";
    return "log+trace " + place(record) + line + ": " + text;
}

} // namespace

Transcript& Transcript::instance() {
    static Transcript transcript;
    return transcript;
}

void Transcript::call(std::string line) {
    add(std::move(line));
}
void Transcript::reading(std::string line) {
    add(Reading{std::move(line)});
}
void Transcript::record(LogRecord record) {
    add(std::move(record));
}

void Transcript::add(Entry entry) {
    const std::lock_guard lock(_mutex);
    if (!_paused) {
        _entries.push_back(std::move(entry));
    }
}

Lines Transcript::calls() const {
    const std::lock_guard lock(_mutex);
    Lines lines;
    const LogRecord* pending = nullptr;
    const auto flush = [&] {
        if (pending != nullptr) {
            lines.push_back(withNames(unfolded(*pending)));
            pending = nullptr;
        }
    };
    for (const Entry& entry : _entries) {
        if (const auto* record = std::get_if<LogRecord>(&entry)) {
            if (pending != nullptr && isPair(*pending, *record)) {
                lines.push_back(withNames(folded(*record)));
                pending = nullptr;
            } else {
                flush();
                pending = record;
            }
        } else if (const auto* line = std::get_if<std::string>(&entry)) {
            flush();
            lines.push_back(*line);
        }
    }
    flush();
    return lines;
}

Lines Transcript::everything() const {
    const std::lock_guard lock(_mutex);
    Lines lines;
    for (const Entry& entry : _entries) {
        if (const auto* record = std::get_if<LogRecord>(&entry)) {
            lines.push_back(unfolded(*record));
        } else if (const auto* reading = std::get_if<Reading>(&entry)) {
            lines.push_back(reading->line);
        } else {
            lines.push_back(std::get<std::string>(entry));
        }
    }
    return lines;
}

void Transcript::clear() {
    const std::lock_guard lock(_mutex);
    _entries.clear();
    _numbers.clear();
    _paused = false;
}

void Transcript::pause() {
    const std::lock_guard lock(_mutex);
    _paused = true;
}

std::string Transcript::nextName(const std::string& kind) {
    const std::lock_guard lock(_mutex);
    return kind + '#' + std::to_string(++_numbers[kind]);
}

void Transcript::name(const void* address, const std::string& name) {
    const std::lock_guard lock(_mutex);
    if (!_paused) {
        _names[reinterpret_cast<std::uintptr_t>(address)] = name;
    }
}

void Transcript::forget(const void* address) {
    const std::lock_guard lock(_mutex);
    _names.erase(reinterpret_cast<std::uintptr_t>(address));
}

std::string Transcript::nameOf(const void* address) const {
    if (address == nullptr) {
        return "null";
    }
    const std::lock_guard lock(_mutex);
    const auto found = _names.find(reinterpret_cast<std::uintptr_t>(address));
    return found == _names.end() ? "<address>" : found->second;
}

std::string Transcript::withNames(const std::string& text) const {
    std::string result;
    std::size_t rest = 0;
    for (std::size_t begin = text.find("0x"); begin != std::string::npos; begin = text.find("0x", rest)) {
        const std::size_t end = std::min(text.find_first_not_of("0123456789abcdef", begin + 2), text.size());
        const auto found = _names.find(static_cast<std::uintptr_t>(std::strtoull(text.c_str() + begin, nullptr, 16)));
        result += text.substr(rest, begin - rest) + (found == _names.end() ? "<address>" : '&' + found->second);
        rest = end;
    }
    return result + text.substr(rest);
}

} // namespace OrvTest
