#include "cimxml/Enumerations.h"

#include "cimxml/StatusCodes.h"
#include "model/CimError.h"
#include "model/Model.h"

#include <sys/random.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <system_error>
#include <utility>

namespace ObjectManager::CimXml {

namespace {

/** Half of a limit, rounded up. */
std::size_t shareOfOneUser(std::size_t limit) {
    return limit / 2 + limit % 2;
}

const char* nameOf(Pulled kind) {
    switch (kind) {
    case Pulled::instancesWithPath:
        return "instances with their paths";
    case Pulled::instancePaths:
        return "paths";
    default:
        return "instances that a query selects";
    }
}

CimError limitExceeded(const std::string& found, std::size_t limit, const std::string& what) {
    return {serverLimitsExceeded,
            "found " + found + ", expected at most " + std::to_string(limit) + ' ' + what +
                ": pull the open enumerations to their end, close them, or ask for less at a time"};
}

} // namespace

void Enumerations::requireRoom(std::size_t bytes) const {
    const std::size_t share = shareOfOneUser(_limits.bytes);
    if (bytes > share) {
        throw limitExceeded("more than " + std::to_string(share) + " bytes to be pulled", share,
                            "bytes in the enumerations of one user");
    }
}

std::string Enumerations::open(const EnumerationOwner& owner, Pulled kind, ObjectTexts rest, std::size_t given,
                               std::chrono::milliseconds time) {
    const std::scoped_lock lock(_mutex);
    dropExpired();
    const std::size_t needed = rest.bytes();
    std::size_t ofUser = 0;
    std::size_t bytes = needed;
    std::size_t bytesOfUser = needed;
    for (const auto& [context, enumeration] : _open) {
        const bool own = enumeration.owner.user == owner.user;
        ofUser += own ? 1 : 0;
        bytes += enumeration.objects->bytes();
        bytesOfUser += own ? enumeration.objects->bytes() : 0;
    }
    if (_open.size() >= _limits.count) {
        throw limitExceeded(std::to_string(_open.size()) + " open enumerations", _limits.count, "at a time");
    }
    if (ofUser >= shareOfOneUser(_limits.count)) {
        throw limitExceeded(std::to_string(ofUser) + " open enumerations of this user", shareOfOneUser(_limits.count),
                            "at a time");
    }
    if (bytesOfUser > shareOfOneUser(_limits.bytes)) {
        throw limitExceeded(std::to_string(bytesOfUser) + " bytes", shareOfOneUser(_limits.bytes),
                            "bytes in the enumerations of one user");
    }
    if (bytes > _limits.bytes) {
        throw limitExceeded(std::to_string(bytes) + " bytes", _limits.bytes, "bytes in all enumerations");
    }
    std::string context = _newContext();
    _open.emplace(context, Enumeration{owner, kind, std::make_shared<const ObjectTexts>(std::move(rest)), given, 0,
                                       time, _clock() + time});
    return context;
}

bool Enumerations::pull(const EnumerationOwner& owner, const std::string& context, Pulled kind, std::size_t count,
                        const std::function<void(std::string_view objects)>& take) {
    std::unique_lock lock(_mutex);
    const auto found = find(owner, context);
    Enumeration& enumeration = found->second;
    if (enumeration.kind != kind) {
        throw CimError(invalidEnumerationContext, std::string("found an enumeration of ") + nameOf(enumeration.kind) +
                                                      ", expected one of " + nameOf(kind));
    }
    const std::shared_ptr<const ObjectTexts> objects = enumeration.objects;
    const std::vector<std::size_t>& ends = objects->ends;
    const auto offset = [&](std::size_t index) { return index == 0 ? 0 : ends[index - 1]; };
    const std::size_t next = enumeration.next;
    const std::size_t end = next + std::min(count, ends.size() - next);
    const bool isLast = end == ends.size();
    if (isLast) {
        _open.erase(found);
    } else {
        enumeration.next = end;
        enumeration.expires = _clock() + enumeration.time;
    }
    lock.unlock();
    // The lock is released first, so that other clients need not wait until this one has taken its objects.
    take(std::string_view(objects->text).substr(offset(next), offset(end) - offset(next)));
    return isLast;
}

void Enumerations::close(const EnumerationOwner& owner, const std::string& context) {
    const std::scoped_lock lock(_mutex);
    _open.erase(find(owner, context));
}

std::uint64_t Enumerations::count(const EnumerationOwner& owner, const std::string& context) {
    const std::scoped_lock lock(_mutex);
    const Enumeration& enumeration = find(owner, context)->second;
    return enumeration.givenBefore + enumeration.objects->ends.size();
}

void Enumerations::closeExpired() {
    const std::scoped_lock lock(_mutex);
    dropExpired();
}

void Enumerations::dropExpired() {
    if (_open.empty()) {
        return;
    }
    std::erase_if(_open, [now = _clock()](const auto& entry) { return entry.second.expires <= now; });
}

Enumerations::Map::iterator Enumerations::find(const EnumerationOwner& owner, const std::string& context) {
    dropExpired();
    const auto found = _open.find(context);
    if (found == _open.end() || found->second.owner.user != owner.user ||
        !equalNames(found->second.owner.nameSpace, owner.nameSpace)) {
        throw CimError(invalidEnumerationContext, "found no open enumeration \"" + context +
                                                      "\" of this user in this namespace: it was never opened, was "
                                                      "pulled to its end or closed, or its time is over");
    }
    return found;
}

std::string randomContext() {
    std::array<unsigned char, 16> bytes{};
    if (getrandom(bytes.data(), bytes.size(), 0) != static_cast<ssize_t>(bytes.size())) {
        throw std::system_error(errno, std::generic_category(), "getrandom");
    }
    constexpr std::string_view digits = "0123456789abcdef";
    std::string text;
    for (const unsigned char byte : bytes) {
        text += digits[byte >> 4U];
        text += digits[byte & 0xFU];
    }
    return text;
}

} // namespace ObjectManager::CimXml
