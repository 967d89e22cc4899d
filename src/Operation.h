/**
 * One run of a provider's operation, and the log records that it writes.
 */
#ifndef OPERATION_H
#define OPERATION_H

#include "Trace.h"

#include "cmpidt.h"
#include "cmpift.h"
#include "cmpimacs.h"

#include <array>
#include <charconv>
#include <concepts>
#include <cstdint>
#include <ostream>
#include <string>
#include <tuple>

namespace Norv::PowerStateManagementServiceProvider {

/** Writes a free text to the log. */
void logMessage(const std::string& category, int level, const char* text, const Site& site = Site::here());

/** Writes a variable's value to the log, at the level of operations. */
void logVariable(const std::string& category, const char* variable, const char* value, const Site& site = Site::here());
void logVariable(const std::string& category, const char* variable, unsigned int value,
                 const Site& site = Site::here());

/**
 * Writes an entry or exit record of a call with parameters. The parts are alternately labels and values: pointers are
 * written as addresses, and a null text ends the list.
 */
template <typename... Parts>
class CallTrace {
public:
    explicit CallTrace(const std::string& category, Parts... parts) : _category(category), _parts(parts...) {}

    void entering(const Site& site = Site::here()) const { write(ENTERING, site); }
    void exiting(const Site& site = Site::here()) const { write(EXITING, site); }

private:
    void write(MessageType type, const Site& site) const {
        OrvLog::OrvMessageBuffer buffer;
        std::ostream& stream = buffer;
        std::apply([&](const Parts&... parts) { (put(stream, parts), ...); }, _parts);
        const std::string& parameters = OrvLog::OrvMessageBuffer::str(stream);
        writeRecord(_category, progressLevel, site,
                    [&] { return tracepara(site.function, site.file, site.line, parameters.c_str(), type); });
    }

    static void put(std::ostream& stream, const char* text) { stream << text; }

    /** As the stream itself writes a pointer, which takes several times as long. */
    static void put(std::ostream& stream, const void* pointer) {
        std::array<char, 2 + 2 * sizeof pointer> text{'0', 'x'};
        char* const begin = text.data() + (pointer == nullptr ? 0 : 2);
        const auto end = std::to_chars(begin, text.data() + text.size(), reinterpret_cast<std::uintptr_t>(pointer), 16);
        stream.write(text.data(), end.ptr - text.data());
    }

    /** Takes nothing that merely converts to a flag, such as a number. */
    static void put(std::ostream& stream, std::same_as<bool> auto flag) { stream.write(flag ? "1" : "0", 1); }

    const std::string& _category;
    std::tuple<Parts...> _parts;
};

/**
 * One run of a provider's operation; the constructor marks its entry in the log. Its records name the place in the
 * provider's own file where the operation began, since shared code does the work.
 */
class Operation {
public:
    Operation(const std::string& category, const Site& site) : _category(category), _site(site) {
        markProviderEntry(_category, _site.function, _site.file, _site.line);
    }

    /**
     * The status that the operation returns. It is passed to every call of the broker and the factory, which write it.
     */
    CMPIStatus status{CMPI_RC_OK, nullptr};

    const Site& site() const { return _site; }

    void report(const char* failure) const { logMessage(_category, failureLevel, failure, _site); }

    void markExit() const { markProviderExit(_category, _site.function, _site.file, _site.line); }

    /** Ends a failed operation: the result stays open and no exit is marked. */
    CMPIStatus fail(const char* failure) const {
        report(failure);
        return status;
    }

    /** Ends an operation: closes its result and marks its exit. */
    CMPIStatus complete(const CMPIResult* result) const {
        CMReturnDone(result);
        markExit();
        return status;
    }

private:
    const std::string& _category;
    Site _site;
};

} // namespace Norv::PowerStateManagementServiceProvider

#endif
