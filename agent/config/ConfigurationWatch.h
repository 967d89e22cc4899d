#ifndef AGENT_CONFIGURATIONWATCH_H
#define AGENT_CONFIGURATIONWATCH_H

#include "base/FileSignature.h"

#include <atomic>
#include <cstdint>
#include <optional>
#include <string>

namespace Norv::Agent {

/**
 * Notices that the configuration file has become another one, was changed, made or removed. Asked as often as one
 * likes: it looks at the file once a second at most. Used by several threads at a time; takes no lock and allocates
 * nothing.
 */
class ConfigurationWatch {
public:
    /** Takes the file as it is now for known. */
    ConfigurationWatch();

    /**
     * Has `action` act where the file has changed since the last time, or since the beginning, and once more where that
     * was so recent that another change could look the same. Only one thread at a time does so; others go on meanwhile,
     * and so does `action` where it comes here itself.
     */
    void onChange(const auto& action) {
        if (!isDue() || _looking.test_and_set(std::memory_order_acquire)) {
            return;
        }
        const Looking untilTheEnd(_looking);
        if (look()) {
            action();
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
    /** Looks at the file. @return whether it is, or may be, another one than the last time. */
    bool look();
    std::optional<FileSignature> signature() const;
    static bool isRecent(const std::optional<FileSignature>& signature);

    const std::string _file;
    /** When to look again, in milliseconds of a clock of its own. */
    std::atomic<std::int64_t> _next;
    /** Set while a thread looks. */
    std::atomic_flag _looking;
    // These belong to the thread that looks.
    std::optional<FileSignature> _known;
    bool _recent;
};

} // namespace Norv::Agent

#endif
