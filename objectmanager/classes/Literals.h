/**
 * CIM's names of types and its literals (DSP0004), as class declarations, object paths and arguments write them.
 */
#ifndef CLASSES_LITERALS_H
#define CLASSES_LITERALS_H

#include "model/Model.h"

#include <cstddef>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>

namespace ObjectManager {

/** A literal that is none, or has no place in the type. what() names the literal and what was expected. */
class LiteralError : public std::runtime_error {
public:
    LiteralError(std::size_t position, const std::string& message) : std::runtime_error(message), _position(position) {}

    /** Where in the text it was found, counted in bytes from 0. */
    std::size_t position() const { return _position; }

private:
    std::size_t _position;
};

/** The type called `name`, letter case ignored: one of boolean, char16, the integers and reals, string, datetime. */
std::optional<CMPIType> typeByName(std::string_view name);

/** The name of a type as declarations write it; "uint16[]" for an array, "reference" and "instance" for those. */
std::string typeName(CMPIType type);

/** The text without the white space at its ends. */
std::string_view trimmed(std::string_view text);

bool isInteger(CMPIType type);
bool isReal(CMPIType type);

/**
 * The value that a text without quotes means in a type.
 *
 * @param text for an integer decimal, hexadecimal (0x1f), octal (017) or binary (101b) digits, for a boolean TRUE or
 *             FALSE, for a char16 the one character, for a string the text itself, for a datetime its 25 characters.
 * @param type no array, no reference and no instance.
 * @throws LiteralError where the text does not say a value of the type.
 */
Value valueOfText(std::string_view text, CMPIType type);

/**
 * The value that a text without quotes means by itself: TRUE, FALSE, an integer (sint64, else uint64) or a real.
 *
 * @return nothing where it means none, or an integer that fits into neither.
 */
std::optional<Value> valueOfUntypedText(std::string_view text);

/**
 * Reads a literal in quotes.
 *
 * @param text where it stands.
 * @param[in,out] position of the opening quote, single or double; afterwards behind the closing one.
 * @return what is quoted, escapes resolved, in UTF-8.
 * @throws LiteralError where the closing quote is missing or an escape is unknown.
 */
std::string readQuoted(std::string_view text, std::size_t& position);

/** The text as a literal between `quote`s, with the escapes that it needs. */
std::string inQuotes(std::string_view text, char quote = '"');

/** The character in UTF-8. */
std::string utf8(char16_t character);

} // namespace ObjectManager

#endif
