#include "ResourceLibrary.h"

#include "base/Utf8.h"

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <stdexcept>
#include <utility>

namespace Norv {

namespace {

// A compiled catalogue. It begins with seven numbers of 32 bits, in the byte order of the machine that made it: magic
// number, revision, how many messages, where the table of ids and the table of texts begin, and two of a hash table. An
// element of a table is the size and the place of a string.
class Catalogue {
public:
    explicit Catalogue(std::string_view content) : _content(content) {
        const std::uint32_t found = number(0);
        _swapped = found == byteSwapped(magic);
        if (!_swapped && found != magic) {
            throw std::runtime_error("no message catalogue: its first four bytes are not the magic number");
        }
        if (const std::uint32_t major = number(4) >> 16; major != 0) {
            throw std::runtime_error("a message catalogue of revision " + std::to_string(major) + ": expected 0");
        }
    }

    std::size_t size() const { return number(8); }
    std::wstring id(std::size_t index) const { return string(number(12), index); }
    std::wstring text(std::size_t index) const { return string(number(16), index); }

private:
    static constexpr std::uint32_t magic = 0x950412de;

    static constexpr std::uint32_t byteSwapped(std::uint32_t value) {
        return value << 24 | (value & 0xff00) << 8 | (value >> 8 & 0xff00) | value >> 24;
    }

    std::string_view bytes(std::uint64_t place, std::uint64_t size) const {
        if (place > _content.size() || size > _content.size() - place) {
            throw std::runtime_error("ends after " + std::to_string(_content.size()) + " bytes: expected " +
                                     std::to_string(size) + " more at " + std::to_string(place));
        }
        return _content.substr(static_cast<std::size_t>(place), static_cast<std::size_t>(size));
    }

    std::uint32_t number(std::uint64_t place) const {
        std::uint32_t value = 0;
        std::memcpy(&value, bytes(place, sizeof value).data(), sizeof value);
        return _swapped ? byteSwapped(value) : value;
    }

    std::wstring string(std::uint64_t table, std::uint64_t index) const {
        const std::uint64_t element = table + index * 8;
        auto string = Agent::wideFrom(bytes(number(element + 4), number(element)));
        if (!string) {
            throw std::runtime_error("message " + std::to_string(index) + " is not in UTF-8");
        }
        return *std::move(string);
    }

    std::string_view _content;
    bool _swapped = false;
};

} // namespace

ResourceLibrary::ResourceLibrary(std::string_view content) {
    const Catalogue catalogue(content);
    for (std::size_t index = 0; index < catalogue.size(); ++index) {
        _texts.emplace(catalogue.id(index), catalogue.text(index));
    }
    // The text of the empty id is the catalogue's header, not a text for users.
    _texts.erase(L"");
}

const std::wstring& ResourceLibrary::find(const std::wstring& id) const {
    const auto found = _texts.find(id);
    return found == _texts.end() ? id : found->second;
}

} // namespace Norv
