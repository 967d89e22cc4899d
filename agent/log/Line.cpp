#include "Line.h"

#include "base/UtcText.h"
#include "base/Utf8.h"

#include <algorithm>
#include <charconv>
#include <chrono>
#include <climits>
#include <limits>
#include <string_view>

namespace OrvLog {

namespace {

constexpr std::string_view cutOff = "...\n";

} // namespace

Line::Line(const Record& record) : _level(record.level) {
    static_assert(_capacity <= PIPE_BUF, "a line is written to a pipe in one piece");
    append(Norv::Agent::UtcText(std::chrono::system_clock::now()).view());
    append(" ");
    _timeSize = _size;
    append(record.kind == Kind::log ? "log " : "trace ");
    appendNumber(record.level);
    append(" ");
    appendEscaped(record.category);
    append(" ");
    appendEscaped(record.function);
    append(" ");
    appendEscaped(record.file);
    append(":");
    appendNumber(record.line);
    append(" ");
    appendEscaped(record.text);
    end();
}

// Appends the whole piece; if it does not fit, neither the piece nor anything after it.
void Line::append(std::string_view piece) {
    _full = _full || piece.size() > _capacity - cutOff.size() - _size;
    if (!_full) {
        std::ranges::copy(piece, _text.begin() + _size);
        _size += piece.size();
    }
}

void Line::appendNumber(int number) {
    std::array<char, std::numeric_limits<int>::digits10 + 2> digits{};
    const auto* end = std::to_chars(digits.data(), digits.data() + digits.size(), number).ptr;
    append({digits.data(), end});
}

// Appends the whole characters for which there is room.
void Line::appendText(std::string_view text) {
    const std::size_t room = _full ? 0 : _capacity - cutOff.size() - _size;
    append(Norv::Agent::beginningOf(text, room));
    _full = _full || text.size() > room;
}

void Line::appendEscaped(std::string_view text) {
    constexpr std::string_view hexadecimal = "0123456789abcdef";
    constexpr auto isControl = [](char character) {
        const auto code = static_cast<unsigned char>(character);
        return code < 0x20 || code == 0x7f;
    };
    for (;;) {
        const auto* const control = std::ranges::find_if(text, isControl);
        const auto plain = static_cast<std::size_t>(control - text.begin());
        appendText(text.substr(0, plain));
        if (control == text.end()) {
            return;
        }
        const auto code = static_cast<unsigned char>(*control);
        if (code == '\n') {
            append("\\n");
        } else if (code == '\t') {
            append("\\t");
        } else {
            const std::array escape{'\\', 'x', hexadecimal[code / 16], hexadecimal[code % 16]};
            append({escape.data(), escape.size()});
        }
        text.remove_prefix(plain + 1);
    }
}

void Line::end() {
    if (!_full) {
        _text[_size++] = '\n';
        return;
    }
    std::ranges::copy(cutOff, _text.begin() + _size);
    _size += cutOff.size();
}

} // namespace OrvLog
