/**
 * The names of CIM types, and literals (DSP0004), as they are written in class declarations, object paths and
 * arguments.
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

/** A text that is not a literal, or not one of the required type. what() names the text and what was expected. */
class LiteralError : public std::runtime_error {
public:
    LiteralError(std::size_t position, const std::string& message) : std::runtime_error(message), _position(position) {}

    /** Where the mistake is in the text, in bytes from 0. */
    std::size_t position() const { return _position; }

private:
    std::size_t _position;
};

/**
 * The type called `name`, letter case ignored: boolean, char16, an integer, a real, string or datetime. No value for
 * any other name.
 */
std::optional<CMPIType> typeByName(std::string_view name);

/** The name of a type as in a declaration, for example "uint16", "uint16[]" for an array, "reference", "instance". */
std::string typeName(CMPIType type);

bool isInteger(CMPIType type);
bool isReal(CMPIType type);

/**
 * The value of a given type that a text without quotes stands for.
 *
 * @param text of an integer: decimal, hexadecimal (0x1f), octal (017) or binary (101b) digits; of a boolean: TRUE or
 *             FALSE; of a char16: one character; of a string: the string itself; of a datetime: its 25 characters.
 * @param type any type but arrays, references and instances.
 * @throws LiteralError if the text is not a value of the type.
 */
Value valueOfText(std::string_view text, CMPIType type);

/**
 * The value that a text without quotes stands for if its type is not known: TRUE, FALSE, an integer (sint64 if it fits,
 * else uint64) or a real64.
 *
 * @return no value if the text is something else, or an integer that fits into neither type.
 */
std::optional<Value> valueOfUntypedText(std::string_view text);

/**
 * Reads a literal in quotes.
 *
 * @param text contains the literal.
 * @param[in,out] position of the opening quote, which is single or double; set to the position behind the closing
 * quote.
 * @return the quoted text in UTF-8, with its escape sequences replaced.
 * @throws LiteralError if the closing quote is missing or an escape sequence is unknown.
 */
std::string readQuoted(std::string_view text, std::size_t& position);

/** The text as a literal between two `quote`s, with the escape sequences that it needs. */
std::string inQuotes(std::string_view text, char quote = '"');

/** The character as text in UTF-8. */
std::string utf8(char16_t character);

} // namespace ObjectManager

#endif
