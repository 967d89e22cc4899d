/**
 * The tokens of the Managed Object Format (DSP0004). Only the reader of class declarations uses them.
 */
#ifndef CLASSES_MOFLEXER_H
#define CLASSES_MOFLEXER_H

#include <cstddef>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager {

/** A schema file or registration that cannot be used. what() is one line: "file:line: found this, expected that". */
class SchemaError : public std::runtime_error {
public:
    SchemaError(const std::string& place, const std::string& message) : std::runtime_error(place + ": " + message) {}
};

/** A place in a file, as error messages name it: "file:line". */
std::string placeOf(std::string_view file, std::size_t line);

struct Token {
    enum class Kind { identifier, number, string, character, punctuation, end };

    Kind kind = Kind::end;
    /**
     * The token as it stands in the file; of strings and characters, the text between the quotes, with escape sequences
     * replaced.
     */
    std::string text;
    /** The line in which the token begins, counted from 1. */
    std::size_t line = 1;
};

/** The token as error messages name it. */
std::string describe(const Token& token);

/**
 * The tokens of a text; the last one is of the kind `end`. Comments and compiler directives are left out; adjacent
 * strings become one token.
 *
 * @param file the file's name, for error messages.
 * @throws SchemaError
 */
std::vector<Token> tokensOfMof(std::string_view text, std::string_view file);

} // namespace ObjectManager

#endif
