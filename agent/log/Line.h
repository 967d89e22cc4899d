#ifndef LOG_LINE_H
#define LOG_LINE_H

#include "Record.h"

#include <array>
#include <cstddef>
#include <string_view>

namespace OrvLog {

/**
 * A record as one line: time, kind, level, category, function, file:line and text. Control characters are escaped. A
 * line that is longer than a pipe takes at once (PIPE_BUF) is cut off and ends in three dots.
 */
class Line {
public:
    /** Formats a record; its time is the present one. */
    explicit Line(const Record& record);

    /** The line with the line feed at its end. */
    std::string_view whole() const { return {_text.data(), _size}; }

    /** The line without its time and line feed, for destinations that add the time themselves. */
    std::string_view withoutTime() const { return whole().substr(_timeSize, _size - _timeSize - 1); }

    int level() const { return _level; }

private:
    void append(std::string_view piece);
    void appendNumber(int number);
    void appendText(std::string_view text);
    void appendEscaped(std::string_view text);
    void end();

    static constexpr std::size_t _capacity = 4096;

    std::array<char, _capacity> _text;
    std::size_t _size = 0;
    std::size_t _timeSize = 0;
    bool _full = false;
    int _level;
};

} // namespace OrvLog

#endif
