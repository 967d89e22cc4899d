#ifndef LOCALE_RESOURCELIBRARY_H
#define LOCALE_RESOURCELIBRARY_H

#include <string>
#include <string_view>
#include <unordered_map>

namespace Norv {

/** Texts by their ids. */
class ResourceLibrary {
public:
    /** Has no texts. */
    ResourceLibrary() = default;

    /**
     * The texts of a message catalogue: the content of a file as gettext compiles it (.mo), in UTF-8.
     *
     * @throws std::runtime_error, saying what is wrong, where the catalogue is damaged.
     */
    explicit ResourceLibrary(std::string_view content);

    /** The text behind `id`, or `id` itself where there is none. */
    const std::wstring& find(const std::wstring& id) const;

private:
    std::unordered_map<std::wstring, std::wstring> _texts;
};

} // namespace Norv

#endif
