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

/** Columns that a line may fill. A single word that is longer is not broken. */
inline constexpr std::size_t lineWidth = 100;

/** Columns that a text in UTF-8 fills, one a character. */
std::size_t columnsOf(std::string_view text);

/**
 * Joins pieces with blanks, in as many lines as the width demands.
 *
 * @param indent columns that are filled already before the first line; every further line begins with as many blanks.
 */
std::string filled(const std::vector<std::string>& pieces, std::size_t indent);

/** The words of a text, which are separated by single blanks. */
std::vector<std::string> wordsOf(std::string_view text);

/** A line of cells. The last one is given as pieces that must not be broken. */
struct Row {
    std::vector<std::string> cells;
    std::vector<std::string> last;
};

/** A row whose last cell may be broken at its blanks. */
Row rowOf(std::vector<std::string> cells);

/**
 * Lines whose columns are aligned, two blanks between them; the last column is filled within the width.
 *
 * @param rows as many cells each as the first has.
 * @param indent blanks before each row.
 */
std::string aligned(const std::vector<Row>& rows, std::size_t indent = 0);

} // namespace ObjectManager

#endif
