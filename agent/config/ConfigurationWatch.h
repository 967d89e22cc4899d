#ifndef AGENT_CONFIGURATIONWATCH_H
#define AGENT_CONFIGURATIONWATCH_H

#include "base/FileSignature.h"

#include <atomic>
#include <cstdint>
#include <optional>
#include <string>
#include <utility>

namespace Norv::Agent {

/**
 * Notices when the configuration file was changed, replaced, made or removed. It may be asked at any rate: it looks at
 * the file once a second at most. Used by several threads at a time; takes no lock and allocates nothing.
 */
class ConfigurationWatch {
public:
    /** Takes the file's present state as the known one. */
    ConfigurationWatch();

    /**
     * Calls `action` if the file has changed since the last look, and once more at the next look if the change was so
     * recent that a further change could have the same time stamp. Only one thread at a time looks and calls `action`;
     * other threads return at once, and so does a call from within `action`. If `action` throws, the exception passes,
     * and the next look calls it again.
     */
    void onChange(const auto& action) {
        if (!isDue() || _looking.test_and_set(std::memory_order_acquire)) {
            return;
        }
        const Looking untilTheEnd(_looking);
        if (look()) {
            const bool wasRecent = std::exchange(_recent, true);
            action();
            _recent = wasRecent;
        }
    }

private:
    class Looking {
    public:
        explicit Looking(std::atomic_flag& flag) : _flag(flag) {}
        ~Looking() { _flag.clear(std::memory_order_release); }
        Looking(const Looking&) = delete;
        Looking& operator=(const Looking&) = delete;

    private:
        std::atomic_flag& _flag;
    };

    bool isDue() const;
    /** Looks at the file. @return whether it has changed since the last look, or may have. */
    bool look();
    std::optional<FileSignature> signature() const;
    static bool isRecent(const std::optional<FileSignature>& signature);

    const std::string _file;
    /** When to look again, in milliseconds of coarseMilliseconds(). */
    std::atomic<std::int64_t> _next;
    /** Set while a thread looks. */
    std::atomic_flag _looking;
    // Only the thread that looks uses these.
    std::optional<FileSignature> _known;
    /** Whether the next look has to be taken for a change. */
    bool _recent;
};

} // namespace Norv::Agent

#endif
