#include "UtcText.h"

namespace Norv::Agent {

UtcText::UtcText(std::chrono::sys_time<std::chrono::milliseconds> time) {
    const auto day = std::chrono::floor<std::chrono::days>(time);
    const std::chrono::year_month_day date{day};
    const std::chrono::hh_mm_ss clock{time - day};

    auto* at = _characters.data();
    const auto put = [&at](unsigned int number, int digits, char after) {
        for (int i = digits - 1; i >= 0; --i) {
            at[i] = static_cast<char>('0' + number % 10);
            number /= 10;
        }
        at[digits] = after;
        at += digits + 1;
    };
    put(static_cast<unsigned int>(static_cast<int>(date.year())), 4, '-');
    put(static_cast<unsigned int>(date.month()), 2, '-');
    put(static_cast<unsigned int>(date.day()), 2, 'T');
    put(static_cast<unsigned int>(clock.hours().count()), 2, ':');
    put(static_cast<unsigned int>(clock.minutes().count()), 2, ':');
    put(static_cast<unsigned int>(clock.seconds().count()), 2, '.');
    put(static_cast<unsigned int>(clock.subseconds().count()), 3, 'Z');
}

} // namespace Norv::Agent
