#ifndef LOCALE_RESOURCELIBRARY_H
#define LOCALE_RESOURCELIBRARY_H

#include <string>
#include <string_view>
#include <unordered_map>

namespace Norv {

/** The texts of one resource library in one language, by their ids. */
class ResourceLibrary {
public:
    /** A library without texts. */
    ResourceLibrary() = default;

    /**
     * @param content of a message catalogue that gettext has compiled (.mo), in UTF-8.
     *
     * @throws std::runtime_error if the catalogue is damaged; what() says how.
     */
    explicit ResourceLibrary(std::string_view content);

    /** The text of `id`, or `id` itself if there is none. */
    const std::wstring& find(const std::wstring& id) const;

private:
    std::unordered_map<std::wstring, std::wstring> _texts;
};

} // namespace Norv

#endif
