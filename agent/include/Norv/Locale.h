/**
 * Texts in the language of the environment: liborvlocale.so.1.
 */
#ifndef NORV_LOCALE_H
#define NORV_LOCALE_H

#include <string>

namespace Norv {

/** The texts of one resource library in one language. Lives as long as the process; opaque to users. */
class ResourceLibrary;

namespace Locale {

/**
 * The language in force: the first of LC_ALL, LC_MESSAGES and LANG that is set and not empty decides. The process's
 * own locale is neither read nor changed.
 *
 * @return a number for `getResourceLibrary`; a language without texts counts as English.
 */
unsigned int getLanguageId();

/**
 * The texts of a resource library.
 *
 * @param number the resource library; 2 holds the texts of power management.
 * @param language a result of `getLanguageId`.
 * @return the texts, valid as long as the process runs. An unknown number or language gives a library without texts.
 */
const ResourceLibrary& getResourceLibrary(unsigned int number, unsigned int language);

} // namespace Locale

/** One text of a resource library. */
class ResourceString {
public:
    /** Looks up the text behind `id`; where the library has none, the text is the id itself. */
    ResourceString(const ResourceLibrary& library, const std::wstring& id);

    /** The text; valid as long as this object. */
    operator const std::wstring&() const;

private:
    std::wstring _text;
};

/** The text in UTF-8; what is no Unicode character becomes U+FFFD. */
std::string make_string(const std::wstring& text);

} // namespace Norv

#endif
