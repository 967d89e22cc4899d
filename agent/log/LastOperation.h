#ifndef LOG_LASTOPERATION_H
#define LOG_LASTOPERATION_H

#include "Record.h"

#include <array>
#include <cstddef>
#include <string_view>

namespace OrvLog {

/**
 * The last record of an operation that a thread logged below the threshold; it has the values that the operation was
 * called with. When a record of a failure is written later, this record is written before it, since the failure alone
 * does not say what was requested.
 */
class LastOperation {
public:
    /** The calling thread's object. */
    static LastOperation& ofThisThread();

    /** Whether a record below the threshold is one of an operation, which is remembered. */
    static bool isOne(const Record& record) { return record.kind == Kind::log && record.level >= operationLevel; }
    /**
     * Whether a written record is a failure that the operation explains. Records of power requests explain themselves.
     */
    static bool isNeededFor(const Record& record) {
        return record.kind == Kind::log && record.level >= failureLevel &&
               record.level < Norv::Agent::alwaysWrittenLevel;
    }

    void remember(const Record& record);

    /** Whether a record of this category is remembered. */
    bool hasBeen(std::string_view category) const { return _level != 0 && category == _category.view(); }

    /** The record that is remembered; its texts belong to this object. */
    Record record() const;

    void forget() { _level = 0; }

private:
    static constexpr int operationLevel = 4000;
    static constexpr int failureLevel = 6000;

    /** As many bytes of a text as fit. */
    template <std::size_t Capacity>
    class Beginning {
    public:
        void assign(std::string_view text) { _size = text.copy(_characters.data(), Capacity); }
        std::string_view view() const { return {_characters.data(), _size}; }

    private:
        std::array<char, Capacity> _characters{};
        std::size_t _size = 0;
    };

    /** The record's level; 0 if no record is remembered. */
    int _level = 0;
    int _line = 0;
    Beginning<64> _category;
    Beginning<64> _function;
    Beginning<128> _file;
    Beginning<256> _text;
};

} // namespace OrvLog

#endif
