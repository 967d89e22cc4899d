#ifndef LOG_LASTOPERATION_H
#define LOG_LASTOPERATION_H

#include "Record.h"

#include <array>
#include <cstddef>
#include <string_view>

namespace OrvLog {

/**
 * The last operation that a thread has logged below its threshold, with the value that it was given. Where a failure
 * follows that is written, so is this, in front of it: a failure alone does not say what was asked for.
 */
class LastOperation {
public:
    /** That of the calling thread. */
    static LastOperation& ofThisThread();

    /** Whether a record that is below the threshold is an operation, and so to be remembered. */
    static bool isOne(const Record& record) { return record.kind == Kind::log && record.level >= operationLevel; }
    /** Whether a written record is a failure that the operation explains. Records of power requests need no other. */
    static bool isNeededFor(const Record& record) {
        return record.kind == Kind::log && record.level >= failureLevel &&
               record.level < Norv::Agent::alwaysWrittenLevel;
    }

    void remember(const Record& record);

    /** Nothing is remembered afterwards, or nothing of this category. */
    bool hasBeen(std::string_view category) const { return _level != 0 && category == _category.view(); }

    /** What is remembered; the texts are this object's. */
    Record record() const;

    void forget() { _level = 0; }

private:
    static constexpr int operationLevel = 4000;
    static constexpr int failureLevel = 6000;

    /** The beginning of a text. */
    template <std::size_t Capacity>
    class Beginning {
    public:
        void assign(std::string_view text) { _size = text.copy(_characters.data(), Capacity); }
        std::string_view view() const { return {_characters.data(), _size}; }

    private:
        std::array<char, Capacity> _characters{};
        std::size_t _size = 0;
    };

    /** 0 where nothing is remembered. */
    int _level = 0;
    int _line = 0;
    Beginning<64> _category;
    Beginning<64> _function;
    Beginning<128> _file;
    Beginning<256> _text;
};

} // namespace OrvLog

#endif
