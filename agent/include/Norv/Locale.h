/**
 * Texts in the language of the environment: liborvlocale.so.1.
 */
#ifndef NORV_LOCALE_H
#define NORV_LOCALE_H

#include <string>

namespace Norv {

/**
 * The texts of one resource library in one language. The object lives until the process ends; it is opaque to users.
 */
class ResourceLibrary;

namespace Locale {

/**
 * The current language. The first of the environment variables LC_ALL, LC_MESSAGES and LANG that is set and not empty
 * decides; the process's own locale is neither read nor changed.
 *
 * @return a number for `getResourceLibrary`. For a language without texts, it is the number of English.
 */
unsigned int getLanguageId();

/**
 * The texts of a resource library.
 *
 * @param number the number of the resource library; 2 is that of power management.
 * @param language a result of `getLanguageId`.
 * @return the library, valid until the process ends. For an unknown number or language, it has no texts.
 */
const ResourceLibrary& getResourceLibrary(unsigned int number, unsigned int language);

} // namespace Locale

/** One text of a resource library. */
class ResourceString {
public:
    /** Looks up the text of `id`. If the library has none, the text is the id itself. */
    ResourceString(const ResourceLibrary& library, const std::wstring& id);

    /** The text; valid as long as this object. */
    operator const std::wstring&() const;

private:
    std::wstring _text;
};

/** Converts a text to UTF-8. A wide character that is not a Unicode character becomes U+FFFD. */
std::string make_string(const std::wstring& text);

} // namespace Norv

#endif
