/**
 * The state of the simulated machine: one file that every process on the host shares.
 *
 *     { "nodes": { "chassis/blade1": { "request": "reboot", "over": 1795177867123, "after": "shutdown" } } }
 *
 * holds the last power request of each node that ever had one. "over" is the time at which the transition is over, in
 * milliseconds since 1970 (UTC). "after" is the request before it, if there was one: when the last request is
 * cancelled, the node has the state after that one. The file is replaced as a whole, under a lock on "<file>.lock"
 * beside it, so that readers need no lock and a process that is killed at any moment leaves a complete file. A damaged
 * file is renamed to "<file>.damaged-<UTC time>-<number>". A file that is larger than any state file is neither read
 * nor replaced.
 */
#ifndef INSTRUMENTATION_STATEFILE_H
#define INSTRUMENTATION_STATEFILE_H

#include "PowerTransition.h"
#include "base/FileSignature.h"
#include "base/LockFile.h"

#include <chrono>
#include <filesystem>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <string>

namespace Norv::Agent {

using TimePoint = std::chrono::sys_time<std::chrono::milliseconds>;

struct PowerRequest {
    /** An element of powerTransitions. */
    const PowerTransition* transition;
    /** When the transition is over. */
    TimePoint over;
    /** The node's request before this one, which was over; null if there was none. */
    const PowerTransition* after = nullptr;
};

/** The last request of each node that had one, by the node's path. */
using PowerRequests = std::map<std::string, PowerRequest>;

/** The state file. Any number of threads may use one object at once. */
class StateFile {
public:
    /** Neither reads nor makes the file yet. Missing folders are made together with the file. */
    explicit StateFile(const std::filesystem::path& file);

    /**
     * The present content of the file; empty if there is no file. A damaged file is reported, renamed, and counts as
     * none.
     *
     * @throws std::system_error if the file cannot be read.
     */
    std::shared_ptr<const PowerRequests> read();

    /**
     * Changes the content of the file, under its lock.
     *
     * @param change changes the content. If it throws, the file stays as it is, and update throws the same.
     * @return the new content.
     * @throws std::system_error if the file cannot be locked, read or written, or a damaged one cannot be renamed; the
     * file then stays as it was.
     */
    std::shared_ptr<const PowerRequests> update(const std::function<void(PowerRequests&)>& change);

private:
    struct Content {
        /** No value if there is no file. */
        std::optional<FileSignature> signature;
        std::shared_ptr<const PowerRequests> requests = std::make_shared<PowerRequests>();
        /** Why the file is damaged; empty if it is not. `requests` of a damaged file is empty. */
        std::string damage;
    };

    LockFile lock() const;
    std::optional<FileSignature> currentSignature() const;
    Content load() const;
    Content loadOrSetAside(const LockFile& held) const;
    void store(const PowerRequests& requests, const std::optional<FileSignature>& replaced, const LockFile& held) const;

    const std::filesystem::path _file;

    std::mutex _mutex;
    /** The content that was last read; guarded by _mutex. */
    Content _content;
};

} // namespace Norv::Agent

#endif
