/**
 * The list of everything that a provider did in a test: calls of the broker, log records, calls of the agent's
 * libraries.
 */
#ifndef SUPPORT_TRANSCRIPT_H
#define SUPPORT_TRANSCRIPT_H

#include <cstdint>
#include <map>
#include <mutex>
#include <string>
#include <unordered_map>
#include <variant>
#include <vector>

namespace OrvTest {

using Lines = std::vector<std::string>;

/** One record as the log library received it. */
struct LogRecord {
    enum class Kind { log, trace };

    Kind kind;
    int level;
    std::string category;
    std::string function;
    std::string file;
    int line;
    std::string text;
    /** Whether the three arguments of the log call that have no member here were null, 0 and 0. */
    bool usualArguments;

    bool operator==(const LogRecord&) const = default;
};

/**
 * The transcript of one process; may be written from several threads at once.
 *
 * It has calls, which a test compares, and readings of texts and states, which a provider may make as often as it likes
 * (a string's characters, a path's namespace, the system name, a message buffer).
 */
class Transcript {
public:
    static Transcript& instance();

    void call(std::string line);
    void reading(std::string line);
    void record(LogRecord record);

    /**
     * The calls in order, one line each, in a form that a test can compare:
     * - a log record and the equal trace record after it are one line "log+trace LEVEL CATEGORY FUNCTION FILE: TEXT";
     *   records that do not come in such pairs stay lines of their own and keep their line numbers;
     * - if the line number in a pair's text is that of the record, the text has "<line>" instead of it, and FILE has
     *   none. The mark functions of Trace.h log from another line than the caller's: FILE keeps its line number then,
     *   and the caller's line number in the text is "<line>";
     * - an address in a text is "&NAME" if it belongs to a named object, else "<address>".
     */
    Lines calls() const;

    /** Calls and readings in order, without any line folded or replaced. */
    Lines everything() const;

    /** Forgets the lines, and the numbers that `nextName` gave, but not the names of objects. Ends a pause. */
    void clear();

    /** Keeps no line and no name until the next `clear`, since a transcript of millions of calls would be too large. */
    void pause();

    /** The name for the next object of a kind: "path#1", "path#2", ... */
    std::string nextName(const std::string& kind);

    /** Gives the object at an address a name, until `forget`. */
    void name(const void* address, const std::string& name);
    void forget(const void* address);

    /** The name of the object at an address; "null" for a null pointer, "<address>" for any other address. */
    std::string nameOf(const void* address) const;

private:
    struct Reading {
        std::string line;
    };
    using Entry = std::variant<std::string, Reading, LogRecord>;

    void add(Entry entry);
    std::string withNames(const std::string& text) const;

    mutable std::mutex _mutex;
    std::vector<Entry> _entries;
    std::map<std::string, unsigned int> _numbers;
    std::unordered_map<std::uintptr_t, std::string> _names;
    bool _paused = false;
};

} // namespace OrvTest

#endif
