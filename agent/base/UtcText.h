#ifndef BASE_UTCTEXT_H
#define BASE_UTCTEXT_H

#include <array>
#include <chrono>
#include <string>
#include <string_view>

namespace Norv::Agent {

/** A time in UTC as text in the form of ISO 8601. */
class UtcText {
public:
    /**
     * Calls neither gmtime_r, which takes a lock of the C library that another thread may hold while the host forks,
     * nor anything that allocates memory. @param time in the years 0 to 9999.
     */
    explicit UtcText(std::chrono::sys_time<std::chrono::milliseconds> time);
    template <typename Duration>
    explicit UtcText(std::chrono::sys_time<Duration> time)
        : UtcText(std::chrono::floor<std::chrono::milliseconds>(time)) {}

    /** The text with milliseconds, for example "2026-11-20T12:31:07.123Z". */
    std::string_view view() const { return {_characters.data(), _characters.size()}; }

    /** The text in whole seconds, for example "2026-11-20T12:31:07Z". */
    std::string inSeconds() const { return std::string(view().substr(0, view().find('.'))) + 'Z'; }

private:
    std::array<char, sizeof "2026-11-20T12:31:07.123Z" - 1> _characters;
};

} // namespace Norv::Agent

#endif
