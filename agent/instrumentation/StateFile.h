/**
 * The state of the simulated machine: one file that every process on the host shares.
 *
 *     { "nodes": { "chassis/blade1": { "request": "reboot", "over": 1795177867123, "after": "shutdown" } } }
 *
 * holds the last power request of each node that ever had one; "over" is in milliseconds since 1970 (UTC), and "after"
 * is the request before, where there was one: what the node goes back to where the last one is cancelled. The file is
 * replaced as a whole, under a lock on "<file>.lock" beside it, so that a reader needs no lock and a process that is
 * killed at any moment leaves a whole file. A damaged file is set aside as "<file>.damaged-<UTC time>-<number>". One
 * that is larger than any of ours is neither read nor replaced.
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
    /** Element of powerTransitions. */
    const PowerTransition* transition;
    /** When the transition is over. */
    TimePoint over;
    /** The node's request before, which was over; null where there was none. */
    const PowerTransition* after = nullptr;
};

/** The last request of each node that had one, by the node's path. */
using PowerRequests = std::map<std::string, PowerRequest>;

/** Any number of threads may use one object at once. */
class StateFile {
public:
    /** Nothing is read or made yet. The missing folders of `file` are made with the file. */
    explicit StateFile(const std::filesystem::path& file);

    /**
     * What the file holds now; nothing where there is no file. A damaged file is reported, set aside and counts as
     * none.
     *
     * @throws std::system_error where the file cannot be read.
     */
    std::shared_ptr<const PowerRequests> read();

    /**
     * Changes what the file holds, while nobody else can.
     *
     * @param change what is to be changed. Where it throws, the file stays as it is.
     * @return what the file holds afterwards.
     * @throws std::system_error where the file cannot be locked, read or written, or a damaged one cannot be set aside;
     * the file is then as it was. What `change` throws.
     */
    std::shared_ptr<const PowerRequests> update(const std::function<void(PowerRequests&)>& change);

private:
    struct Content {
        /** Not set where there is no file. */
        std::optional<FileSignature> signature;
        std::shared_ptr<const PowerRequests> requests = std::make_shared<PowerRequests>();
        /** Why the file cannot be used; empty where it can. `requests` is then empty. */
        std::string damage;
    };

    LockFile lock() const;
    std::optional<FileSignature> currentSignature() const;
    Content load() const;
    Content loadOrSetAside(const LockFile& held) const;
    void store(const PowerRequests& requests, const std::optional<FileSignature>& replaced, const LockFile& held) const;

    const std::filesystem::path _file;

    std::mutex _mutex;
    /** What was last read; guarded by _mutex. */
    Content _content;
};

} // namespace Norv::Agent

#endif
