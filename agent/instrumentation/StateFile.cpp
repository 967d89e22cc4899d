#include "StateFile.h"

#include "Report.h"

#include <nlohmann/json.hpp>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdint>
#include <ctime>
#include <stdexcept>
#include <string_view>
#include <system_error>
#include <utility>

#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

namespace Norv::Agent {

namespace {

constexpr const char* nodesKey = "nodes";
constexpr const char* requestKey = "request";
constexpr const char* overKey = "over";

/** @throws std::system_error of errno. */
[[noreturn]] void fail(const std::filesystem::path& path, const std::string& problem) {
    throw std::system_error(errno, std::system_category(), path.string() + ": " + problem);
}

std::filesystem::path withSuffix(std::filesystem::path path, const std::string& suffix) {
    return path += suffix;
}

/** An open file that is closed with the object. */
class OpenFile {
public:
    /** `descriptor` as open(2) gave it; its errno belongs to the caller. */
    explicit OpenFile(int descriptor) : _descriptor(descriptor) {}
    ~OpenFile() {
        if (_descriptor >= 0) {
            ::close(_descriptor);
        }
    }
    OpenFile(const OpenFile&) = delete;
    OpenFile& operator=(const OpenFile&) = delete;

    bool isOpen() const { return _descriptor >= 0; }
    int descriptor() const { return _descriptor; }

private:
    int _descriptor;
};

/** As mkdir -p does, with a mode that gives nobody else more than reading. */
void createMissingFolders(const std::filesystem::path& folder) {
    std::error_code ignored;
    if (std::filesystem::is_directory(folder, ignored)) {
        return;
    }
    createMissingFolders(folder.parent_path());
    if (::mkdir(folder.c_str(), 0755) != 0 && errno != EEXIST) {
        fail(folder, "cannot be created");
    }
}

std::string readAll(const OpenFile& file, const std::filesystem::path& path) {
    std::string text;
    std::array<char, 65536> block;
    for (;;) {
        const ssize_t size = ::read(file.descriptor(), block.data(), block.size());
        if (size > 0) {
            text.append(block.data(), static_cast<std::size_t>(size));
        } else if (size == 0) {
            return text;
        } else if (errno != EINTR) {
            fail(path, "cannot be read");
        }
    }
}

void writeAll(const OpenFile& file, const std::filesystem::path& path, std::string_view text) {
    while (!text.empty()) {
        const ssize_t size = ::write(file.descriptor(), text.data(), text.size());
        if (size >= 0) {
            text.remove_prefix(static_cast<std::size_t>(size));
        } else if (errno != EINTR) {
            fail(path, "cannot be written");
        }
    }
}

PowerRequest parseRequest(const std::string& node, const nlohmann::json& value) {
    const nlohmann::json& request = value.at(requestKey);
    const auto* const transition = std::ranges::find_if(
        powerTransitions, [&](const PowerTransition& candidate) { return request == candidate.name; });
    if (transition == powerTransitions.end()) {
        throw std::invalid_argument("unknown request " + request.dump() + " of node " + node);
    }
    const nlohmann::json& over = value.at(overKey);
    if (!over.is_number_unsigned() || !std::in_range<std::int64_t>(over.get<std::uint64_t>())) {
        throw std::invalid_argument("time " + over.dump() + " of node " + node + " is not in milliseconds since 1970");
    }
    return {transition, TimePoint(std::chrono::milliseconds(over.get<std::int64_t>()))};
}

/** @throws nlohmann::json::exception or std::invalid_argument where the text is no state file's. */
PowerRequests parse(const std::string& text) {
    const nlohmann::json document = nlohmann::json::parse(text);
    const nlohmann::json& nodes = document.at(nodesKey);
    if (!nodes.is_object()) {
        throw std::invalid_argument(std::string(nodesKey) + " is no object");
    }
    PowerRequests requests;
    for (const auto& [node, request] : nodes.items()) {
        requests.emplace(node, parseRequest(node, request));
    }
    return requests;
}

std::string format(const PowerRequests& requests) {
    nlohmann::json nodes = nlohmann::json::object();
    for (const auto& [node, request] : requests) {
        nodes[node] = {{requestKey, request.transition->name}, {overKey, request.over.time_since_epoch().count()}};
    }
    return nlohmann::json{{nodesKey, nodes}}.dump(2) + '\n';
}

/** The first "<file>.damaged-<UTC time>-<number>" that does not exist. */
std::filesystem::path nameForDamaged(const std::filesystem::path& file) {
    const std::time_t now = std::time(nullptr);
    std::tm utc{};
    ::gmtime_r(&now, &utc);
    std::array<char, sizeof "20261120T123107Z"> time{};
    std::strftime(time.data(), time.size(), "%Y%m%dT%H%M%SZ", &utc);
    for (unsigned int number = 1;; ++number) {
        auto name = withSuffix(file, std::string(".damaged-") + time.data() + '-' + std::to_string(number));
        std::error_code ignored;
        if (!std::filesystem::exists(std::filesystem::symlink_status(name, ignored))) {
            return name;
        }
    }
}

} // namespace

/** Keeps every other thread and process from replacing the file; readers are not kept from anything. */
class StateFile::Lock {
public:
    /** Waits until nobody else has the lock. */
    explicit Lock(const std::filesystem::path& stateFile)
        : _path(withSuffix(stateFile, ".lock")), _file(::open(_path.c_str(), O_RDONLY | O_CREAT | O_CLOEXEC, 0644)) {
        if (!_file.isOpen()) {
            fail(_path, "cannot be opened");
        }
        while (::flock(_file.descriptor(), LOCK_EX) != 0) {
            if (errno != EINTR) {
                fail(_path, "cannot be locked");
            }
        }
    }

private:
    const std::filesystem::path _path;
    const OpenFile _file;
};

// A guest does not know when its host changes the working directory, hence the absolute path.
StateFile::StateFile(const std::filesystem::path& file) : _file(std::filesystem::absolute(file)) {}

std::shared_ptr<const PowerRequests> StateFile::read() {
    const std::optional<FileSignature> signature = currentSignature();
    {
        const std::lock_guard guard(_mutex);
        if (_content.signature == signature) {
            return _content.requests;
        }
    }
    Content content = load();
    if (!content.damage.empty()) {
        try {
            content = loadOrSetAside(Lock(_file));
        } catch (const std::system_error& error) {
            report(alwaysWrittenLevel, "The state file " + _file.string() + " is damaged (" + content.damage +
                                           "): the simulated machine starts from its configured states. The file "
                                           "cannot be set aside: " +
                                           error.what());
        }
    }
    const std::lock_guard guard(_mutex);
    _content = content;
    return content.requests;
}

std::shared_ptr<const PowerRequests> StateFile::write(const std::string& node, const PowerRequest& request) {
    createMissingFolders(_file.parent_path());
    const Lock lock(_file);
    const Content content = loadOrSetAside(lock);
    auto requests = std::make_shared<PowerRequests>(*content.requests);
    requests->insert_or_assign(node, request);
    store(*requests, content.signature, lock);
    return requests;
}

std::optional<FileSignature> StateFile::currentSignature() const {
    struct stat status {};
    if (::stat(_file.c_str(), &status) == 0) {
        return FileSignature(status);
    }
    if (errno == ENOENT) {
        return std::nullopt;
    }
    fail(_file, "cannot be read");
}

StateFile::Content StateFile::load() const {
    // Opening what is no regular file must not wait for its other end.
    const OpenFile file(::open(_file.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
    if (!file.isOpen()) {
        if (errno == ENOENT) {
            return {};
        }
        fail(_file, "cannot be read");
    }
    struct stat status {};
    if (::fstat(file.descriptor(), &status) != 0) {
        fail(_file, "cannot be read");
    }
    if (!S_ISREG(status.st_mode)) {
        throw std::system_error(EINVAL, std::system_category(), _file.string() + ": is not a regular file");
    }
    Content content;
    content.signature = FileSignature(status);
    const std::string text = readAll(file, _file);
    try {
        content.requests = std::make_shared<PowerRequests>(parse(text));
    } catch (const nlohmann::json::exception& error) {
        content.damage = error.what();
    } catch (const std::invalid_argument& error) {
        content.damage = error.what();
    }
    return content;
}

StateFile::Content StateFile::loadOrSetAside(const Lock& /*lock*/) const {
    Content content = load();
    if (content.damage.empty()) {
        return content;
    }
    const std::filesystem::path aside = nameForDamaged(_file);
    if (::rename(_file.c_str(), aside.c_str()) != 0) {
        fail(_file, "damaged (" + content.damage + "), cannot be renamed to " + aside.string());
    }
    report(alwaysWrittenLevel, "The state file " + _file.string() + " is damaged (" + content.damage +
                                   ") and was set aside as " + aside.string() +
                                   ": the simulated machine starts from its configured states");
    return {};
}

void StateFile::store(const PowerRequests& requests, const std::optional<FileSignature>& replaced,
                      const Lock& /*lock*/) const {
    const std::filesystem::path replacement = withSuffix(_file, ".new");
    // A process that was killed while it wrote has left its own.
    if (::unlink(replacement.c_str()) != 0 && errno != ENOENT) {
        fail(replacement, "cannot be removed");
    }
    const OpenFile file(::open(replacement.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0644));
    if (!file.isOpen()) {
        fail(replacement, "cannot be created");
    }
    try {
        writeAll(file, replacement, format(requests));
        // File systems give the same time to everything within a few milliseconds and use an inode number again at
        // once; the signature of two contents must differ all the same.
        std::chrono::nanoseconds modified = std::chrono::system_clock::now().time_since_epoch();
        if (replaced && replaced->modified >= modified) {
            modified = replaced->modified + std::chrono::nanoseconds(1);
        }
        const auto seconds = std::chrono::floor<std::chrono::seconds>(modified);
        const struct timespec time {
            static_cast<time_t>(seconds.count()), static_cast<long>((modified - seconds).count())
        };
        const std::array<struct timespec, 2> times = {time, time};
        if (::futimens(file.descriptor(), times.data()) != 0 || ::fsync(file.descriptor()) != 0 ||
            ::rename(replacement.c_str(), _file.c_str()) != 0) {
            fail(replacement, "cannot be put in place");
        }
    } catch (...) {
        ::unlink(replacement.c_str());
        throw;
    }
    // The new file is whole and in place. Where this fails, a power failure can bring the former one back: no reason to
    // call the request refused.
    const OpenFile folder(::open(_file.parent_path().c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (folder.isOpen()) {
        ::fsync(folder.descriptor());
    }
}

} // namespace Norv::Agent
