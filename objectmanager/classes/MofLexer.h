/**
 * The words of the Managed Object Format (DSP0004). Used by the reader of class declarations only.
 */
#ifndef CLASSES_MOFLEXER_H
#define CLASSES_MOFLEXER_H

#include <cstddef>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager {

/** A schema file that cannot be used. what() is one line: "file:line: found this, expected that". */
class SchemaError : public std::runtime_error {
public:
    SchemaError(const std::string& place, const std::string& message) : std::runtime_error(place + ": " + message) {}
};

/** The form in which errors name a place. */
std::string placeOf(std::string_view file, std::size_t line);

struct Token {
    enum class Kind { identifier, number, string, character, punctuation, end };

    Kind kind = Kind::end;
    /** As it stands in the file; of strings and characters what is quoted, escapes resolved. */
    std::string text;
    /** Counted from 1. */
    std::size_t line = 1;
};

/** The token as errors name it. */
std::string describe(const Token& token);

/**
 * The tokens of a text, ended by one of kind end. Comments and compiler directives are left out; adjacent strings are
 * one.
 *
 * @param file the name that errors give.
 * @throws SchemaError
 */
std::vector<Token> tokensOfMof(std::string_view text, std::string_view file);

} // namespace ObjectManager

#endif
