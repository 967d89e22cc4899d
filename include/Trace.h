/**
 * The provider library's log: fixed formats of lines, and records that go to the agent's log and to its trace.
 *
 * Every record is written twice with the same arguments, first as a log record and then as a trace record. Tools read
 * the log files: the texts, and the line numbers of the markers, must never change.
 */
#ifndef TRACE_H
#define TRACE_H

#include "OrvLog/OrvLogger.h"
#include "OrvLog/OrvMessageBuffer.h"

#include <array>
#include <charconv>
#include <cstddef>
#include <cstring>
#include <initializer_list>
#include <string>
#include <string_view>

namespace Norv {

/** The kind of a line. The numbers are fixed. */
enum MessageType : int {
    /** The function was entered. */
    ENTERING = 0,
    /** The function is about to return. */
    EXITING = 1,
    /** The method was invoked. */
    METHOD = 2,
    /** Free text. */
    MESSAGE = 3,
};

/** Levels of records; a higher level is more important. */
inline constexpr int progressLevel = 3000;
inline constexpr int operationLevel = 4000;
inline constexpr int failureLevel = 6000;

/** The place in the source that a record names. */
struct Site {
    /** The function's own name, without scope and arguments. */
    const char* function;
    /** The path of the source file in the build. */
    const char* file;
    unsigned int line;

    /**
     * The place of the call of `here`; in a default argument, that is the place of the call that omits the argument.
     */
    static constexpr Site here(const char* function = __builtin_FUNCTION(), const char* file = __builtin_FILE(),
                               unsigned int line = __builtin_LINE()) {
        return Site{function, file, line};
    }

    /** The same function and file with the line of this call, for a helper that reports on behalf of that function. */
    constexpr Site atLine(unsigned int currentLine = __builtin_LINE()) const {
        return Site{function, file, currentLine};
    }
};

/** The size of each helper's text buffer in bytes; longer texts are cut off. */
inline constexpr std::size_t messageBufferSize = 512;

/** A part of a message: a text or a number. */
class MessagePart {
public:
    /** A null text becomes "(null)". */
    MessagePart(const char* text) : _text(text != nullptr ? text : "(null)") {}
    MessagePart(int number)
        : _text(_digits.data(), std::to_chars(_digits.data(), _digits.data() + _digits.size(), number).ptr) {}
    MessagePart(const MessagePart&) = delete;
    MessagePart& operator=(const MessagePart&) = delete;
    ~MessagePart() = default;

    std::string_view text() const { return _text; }

private:
    std::array<char, 16> _digits;
    std::string_view _text;
};

/**
 * Clears the buffer, writes the parts into it one after another, cuts off what does not fit, and returns the buffer.
 */
inline char* formatMessage(char (&buffer)[messageBufferSize], std::initializer_list<MessagePart> parts) {
    std::memset(buffer, 0, sizeof buffer);
    std::size_t size = 0;
    for (const MessagePart& part : parts) {
        size += part.text().copy(buffer + size, sizeof buffer - 1 - size);
    }
    return buffer;
}

/**
 * Formats a line about a function, or a free text.
 *
 * Each of the four formatting helpers has one buffer per thread. The helper's next call in the same thread overwrites
 * it.
 *
 * @param text the function's name, or the free text if the type is MESSAGE.
 * @param type a MessageType; any other value formats the line as ENTERING does.
 * @return the line in the helper's buffer.
 */
inline char* trace(const char* text, const char* file, unsigned int line, MessageType type) {
    static thread_local char messageBuffer[messageBufferSize];
    const int lineNumber = static_cast<int>(line);
    switch (type) {
    case METHOD:
        return formatMessage(messageBuffer,
                             {"METHOD: ", text, "() was invoked in ", file, " [Line: ", lineNumber, "]"});
    case MESSAGE:
        return formatMessage(messageBuffer, {"MESSAGE [File: ", file, ", Line: ", lineNumber, "]: ", text});
    case EXITING:
        return formatMessage(messageBuffer, {"EXITING: ", text, "() in ", file, " [Line: ", lineNumber, "]"});
    case ENTERING:
    default:
        return formatMessage(messageBuffer, {"ENTERING: ", text, "() in ", file, " [Line: ", lineNumber, "]"});
    }
}

/** Formats the same line, followed by the function's parameters: labels and values in one text. */
inline char* tracepara(const char* text, const char* file, unsigned int line, const char* parameters,
                       MessageType type) {
    static thread_local char messageBuffer[messageBufferSize];
    constexpr const char* parametersLabel = ",Parameters List: ";
    const int lineNumber = static_cast<int>(line);
    switch (type) {
    case METHOD:
        return formatMessage(messageBuffer, {"METHOD: ", text, "() was invoked in ", file, " [Line: ", lineNumber, "]",
                                             parametersLabel, parameters});
    case MESSAGE:
        return formatMessage(
            messageBuffer, {"MESSAGE [File: ", file, ", Line: ", lineNumber, "]: ", text, parametersLabel, parameters});
    case EXITING:
        return formatMessage(messageBuffer, {"EXITING: ", text, "() in ", file, " [Line: ", lineNumber, "]",
                                             parametersLabel, parameters});
    case ENTERING:
    default:
        return formatMessage(messageBuffer, {"ENTERING: ", text, "() in ", file, " [Line: ", lineNumber, "]",
                                             parametersLabel, parameters});
    }
}

/** Formats a line about a variable that holds a text. */
inline char* trace(const char* variable, const char* file, unsigned int line, const char* value) {
    static thread_local char messageBuffer[messageBufferSize];
    return formatMessage(messageBuffer, {"VARIABLE: '", variable, "' has Value '", value, "' at line ",
                                         static_cast<int>(line), " in ", file});
}

/** Formats a line about a variable that holds a number. */
inline char* trace(const char* variable, const char* file, unsigned int line, unsigned int value) {
    static thread_local char messageBuffer[messageBufferSize];
    return formatMessage(messageBuffer, {"VARIABLE: '", variable, "' has Value '", static_cast<int>(value),
                                         "' at line ", static_cast<int>(line), " in ", file});
}

/**
 * Writes one record, to the log and then to the trace.
 *
 * @param category the category of the file that reports.
 * @param text returns the record's text. It is called once for the log and once for the trace, since the helpers'
 * buffers are shared.
 */
template <typename Text>
void writeRecord(const std::string& category, int level, const Site& site, Text text) {
    const int line = static_cast<int>(site.line);
    OrvLog::OrvMessageBuffer buffer;
    OrvLog::OrvLogger::logLevelMessage(site.function, site.file, line, category, level, nullptr, 0, 0,
                                       OrvLog::OrvMessageBuffer::str(buffer << text()));
    OrvLog::OrvLogger::traceLevelMessage(site.function, site.file, line, category, level, nullptr, 0, 0,
                                         OrvLog::OrvMessageBuffer::str(buffer << text()));
}

/** The line that separates one operation of a provider from the next. */
inline constexpr const char* separatorLine =
    "==============================================================================";

/**
 * Marks the beginning of a provider's operation.
 *
 * @param logger the category of the provider's file.
 * @param function,file,line the operation, and the place where it begins.
 */
inline void markProviderEntry(const std::string& logger, const char* function, const char* file, unsigned int line) {
    writeRecord(logger, operationLevel, Site{"markProviderEntry", __FILE__, 336}, [] { return separatorLine; });
    writeRecord(logger, operationLevel, Site{"markProviderEntry", __FILE__, 337},
                [=] { return trace(function, file, line, ENTERING); });
}

/** Marks the end of a provider's operation; the arguments are those of `markProviderEntry`. */
inline void markProviderExit(const std::string& logger, const char* function, const char* file, unsigned int line) {
    writeRecord(logger, operationLevel, Site{"markProviderExit", __FILE__, 348},
                [=] { return trace(function, file, line, EXITING); });
    writeRecord(logger, operationLevel, Site{"markProviderExit", __FILE__, 349}, [] { return separatorLine; });
}

} // namespace Norv

#endif
