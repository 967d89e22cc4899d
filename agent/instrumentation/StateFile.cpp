#include "StateFile.h"

#include "Report.h"
#include "base/Descriptor.h"
#include "base/Folders.h"
#include "base/LockFile.h"
#include "base/RegularFile.h"
#include "base/UtcText.h"

#include <nlohmann/json.hpp>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdint>
#include <initializer_list>
#include <stdexcept>
#include <string_view>
#include <system_error>
#include <utility>
#include <vector>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace Norv::Agent {

namespace {

constexpr const char* nodesKey = "nodes";
constexpr const char* requestKey = "request";
constexpr const char* overKey = "over";
constexpr const char* afterKey = "after";

/** How long to wait while another process holds the lock. */
constexpr std::chrono::seconds patience{5};

/** @throws std::system_error with the number in errno. */
[[noreturn]] void fail(const std::filesystem::path& path, const std::string& problem) {
    throw std::system_error(errno, std::system_category(), path.string() + ": " + problem);
}

std::filesystem::path withSuffix(std::filesystem::path path, const std::string& suffix) {
    return path += suffix;
}

void writeAll(const Descriptor& file, const std::filesystem::path& path, std::string_view text) {
    while (!text.empty()) {
        const ssize_t size = ::write(file.number(), text.data(), text.size());
        if (size > 0) {
            text.remove_prefix(static_cast<std::size_t>(size));
        } else if (size == 0 || errno != EINTR) {
            errno = size == 0 ? ENOSPC : errno;
            fail(path, "cannot be written");
        }
    }
}

/**
 * Reads a state file's text value by value. A parsed document is not used, since its destructor allocates memory and
 * ends the process if there is none. Values other than the requests are ignored.
 */
class Reader final : public nlohmann::json_sax<nlohmann::json> {
public:
    /** @throws std::invalid_argument if the text is not that of a state file. */
    static PowerRequests read(const std::string& text) {
        Reader reader;
        nlohmann::json::sax_parse(text, &reader);
        if (!reader._hasNodes) {
            throw std::invalid_argument(std::string(nodesKey) + " is missing");
        }
        return std::move(reader._requests);
    }

    bool null() override { return refuse("null"); }
    bool boolean(bool value) override { return refuse(value ? "true" : "false"); }
    bool number_integer(number_integer_t value) override { return refuse(std::to_string(value)); }
    bool number_float(number_float_t /*value*/, const string_t& text) override { return refuse(text); }
    bool binary(binary_t& /*value*/) override { return refuse("binary"); }

    bool number_unsigned(number_unsigned_t value) override {
        if (!isField(overKey) || !std::in_range<std::int64_t>(value)) {
            return refuse(std::to_string(value));
        }
        _over = TimePoint(std::chrono::milliseconds(static_cast<std::int64_t>(value)));
        return true;
    }

    bool string(string_t& value) override {
        const auto* const transition = std::ranges::find(powerTransitions, value, &PowerTransition::name);
        if ((!isField(requestKey) && !isField(afterKey)) || transition == powerTransitions.end()) {
            return refuse('"' + value + '"');
        }
        (isField(requestKey) ? _transition : _after) = transition;
        return true;
    }

    bool start_object(std::size_t /*elements*/) override {
        if (_keys.size() == 3) {
            refuse("an object");
        }
        _hasNodes = _hasNodes || isAt({nodesKey});
        _keys.emplace_back();
        return true;
    }

    bool end_object() override {
        _keys.pop_back();
        if (_keys.size() == 2 && _keys.front() == nodesKey) {
            finishNode(_keys.back());
        }
        return true;
    }

    bool key(string_t& value) override {
        _keys.back() = value;
        return true;
    }

    // An array is a level with an empty key.
    bool start_array(std::size_t /*elements*/) override {
        refuse("an array");
        _keys.emplace_back();
        return true;
    }

    bool end_array() override {
        _keys.pop_back();
        return true;
    }

    bool parse_error(std::size_t /*position*/, const std::string& /*token*/,
                     const nlohmann::detail::exception& error) override {
        throw std::invalid_argument(error.what());
    }

private:
    bool isAt(std::initializer_list<std::string_view> keys) const { return std::ranges::equal(_keys, keys); }

    /** Whether the current value is the one called `field` of a node. */
    bool isField(std::string_view field) const {
        return _keys.size() == 3 && _keys.front() == nodesKey && _keys.back() == field;
    }

    /**
     * Handles a value of an unexpected type: throws if it is one of a request, else ignores it. @return true, to go on.
     */
    bool refuse(const std::string& found) const {
        const bool isNode = _keys.size() == 2 && _keys.front() == nodesKey;
        if (isAt({nodesKey})) {
            throw std::invalid_argument(std::string(nodesKey) + " is no object");
        }
        if (isField(requestKey) || isField(afterKey)) {
            throw std::invalid_argument("unknown request " + found + " of node " + _keys[1]);
        }
        if (isField(overKey)) {
            throw std::invalid_argument("time " + found + " of node " + _keys[1] +
                                        " is not in milliseconds since 1970");
        }
        if (isNode) {
            throw std::invalid_argument("node " + _keys[1] + " is no object");
        }
        return true;
    }

    void finishNode(const std::string& node) {
        if (_transition == nullptr || !_over) {
            throw std::invalid_argument("node " + node + " lacks " + (_transition == nullptr ? requestKey : overKey));
        }
        _requests.insert_or_assign(node, PowerRequest{_transition, *_over, _after});
        _transition = nullptr;
        _after = nullptr;
        _over.reset();
    }

    /** The keys that lead to the current value. */
    std::vector<std::string> _keys;
    bool _hasNodes = false;
    const PowerTransition* _transition = nullptr;
    const PowerTransition* _after = nullptr;
    std::optional<TimePoint> _over;
    PowerRequests _requests;
};

/** @throws nlohmann::json::exception if a node's name is not valid UTF-8. */
std::string format(const PowerRequests& requests) {
    std::string text;
    for (const auto& [node, request] : requests) {
        text.append(text.empty() ? "\n" : ",\n");
        text.append("    ").append(nlohmann::json(node).dump()).append(": {\n      \"");
        if (request.after != nullptr) {
            text.append(afterKey).append("\": \"").append(request.after->name).append("\",\n      \"");
        }
        text.append(overKey);
        text.append("\": ").append(std::to_string(request.over.time_since_epoch().count())).append(",\n      \"");
        text.append(requestKey).append("\": \"").append(request.transition->name).append("\"\n    }");
    }
    return std::string("{\n  \"") + nodesKey + "\": {" + text + (text.empty() ? "}\n}\n" : "\n  }\n}\n");
}

/** The first "<file>.damaged-<UTC time>-<number>" that does not exist. */
std::filesystem::path nameForDamaged(const std::filesystem::path& file) {
    // The basic form of ISO 8601: in names of files, colons are a nuisance.
    std::string time = UtcText(std::chrono::system_clock::now()).inSeconds();
    std::erase_if(time, [](char c) { return c == '-' || c == ':'; });
    for (unsigned int number = 1;; ++number) {
        auto name = withSuffix(file, ".damaged-" + time + '-' + std::to_string(number));
        std::error_code ignored;
        if (!std::filesystem::exists(std::filesystem::symlink_status(name, ignored))) {
            return name;
        }
    }
}

} // namespace

// The path is made absolute, since the host program may change its working directory at any time.
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
            content = loadOrSetAside(lock());
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

std::shared_ptr<const PowerRequests> StateFile::update(const std::function<void(PowerRequests&)>& change) {
    createMissingFolders(_file.parent_path());
    const LockFile held = lock();
    const Content content = loadOrSetAside(held);
    auto requests = std::make_shared<PowerRequests>(*content.requests);
    change(*requests);
    store(*requests, content.signature, held);
    return requests;
}

LockFile StateFile::lock() const {
    return {withSuffix(_file, ".lock"), Deadline(patience)};
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
    const std::optional<FileContent> file = readRegularFile(_file);
    if (!file) {
        return {};
    }
    Content content;
    content.signature = file->signature;
    try {
        content.requests = std::make_shared<PowerRequests>(Reader::read(file->text));
    } catch (const std::invalid_argument& error) {
        content.damage = error.what();
    }
    return content;
}

StateFile::Content StateFile::loadOrSetAside(const LockFile& /*held*/) const {
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
                      const LockFile& /*held*/) const {
    const std::filesystem::path replacement = withSuffix(_file, ".new");
    const std::filesystem::path parent = _file.parent_path();
    // A process that was killed while it wrote has left this file behind.
    if (::unlink(replacement.c_str()) != 0 && errno != ENOENT) {
        fail(replacement, "cannot be removed");
    }
    const Descriptor file(::open(replacement.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0644));
    if (!file.isOpen()) {
        fail(replacement, "cannot be created");
    }
    try {
        writeAll(file, replacement, format(requests));
        // Two contents must have different signatures, but file systems give the same time to all changes within a few
        // milliseconds and reuse inode numbers at once.
        std::chrono::nanoseconds modified = std::chrono::system_clock::now().time_since_epoch();
        if (replaced && replaced->modified >= modified) {
            modified = replaced->modified + std::chrono::nanoseconds(1);
        }
        const auto seconds = std::chrono::floor<std::chrono::seconds>(modified);
        const struct timespec time {
            static_cast<time_t>(seconds.count()), static_cast<long>((modified - seconds).count())
        };
        const std::array<struct timespec, 2> times = {time, time};
        if (::futimens(file.number(), times.data()) != 0 || ::fsync(file.number()) != 0 ||
            ::rename(replacement.c_str(), _file.c_str()) != 0) {
            fail(replacement, "cannot be put in place");
        }
    } catch (...) {
        ::unlink(replacement.c_str());
        throw;
    }
    // The new file is complete and in place. If this synchronization fails, a power failure can bring the former file
    // back; that is no reason to report the request as refused. Nothing from here on may throw.
    const Descriptor folder(::open(parent.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (folder.isOpen()) {
        ::fsync(folder.number());
    }
}

} // namespace Norv::Agent
