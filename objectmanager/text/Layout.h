/**
 * Text arranged for a terminal.
 */
#ifndef TEXT_LAYOUT_H
#define TEXT_LAYOUT_H

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager {

/** The longest line, in columns. A single word that is longer is not broken. */
inline constexpr std::size_t lineWidth = 100;

/** The number of columns that a text in UTF-8 fills: one for each character. */
std::size_t columnsOf(std::string_view text);

/**
 * Joins pieces with blanks, and begins a new line if the next piece would exceed `lineWidth`.
 *
 * @param indent columns that are already filled in the first line; each further line begins with as many blanks.
 */
std::string filled(const std::vector<std::string>& pieces, std::size_t indent);

/** The words of a text, which are separated by single blanks. */
std::vector<std::string> wordsOf(std::string_view text);

/** A line of cells. The last cell consists of pieces, none of which may be broken. */
struct Row {
    std::vector<std::string> cells;
    std::vector<std::string> last;
};

/** A row whose last cell may be broken at its blanks. */
Row rowOf(std::vector<std::string> cells);

/**
 * Lines with aligned columns and two blanks between them; the last column is broken into several lines if it exceeds
 * `lineWidth`.
 *
 * @param rows all with the same number of cells.
 * @param indent blanks before each row.
 */
std::string aligned(const std::vector<Row>& rows, std::size_t indent = 0);

} // namespace ObjectManager

#endif
