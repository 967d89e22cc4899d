/**
 * Pictures by the program dot of Graphviz.
 */
#ifndef ORVCIM_GRAPHVIZ_H
#define ORVCIM_GRAPHVIZ_H

#include <filesystem>
#include <string>
#include <string_view>

namespace ObjectManager::Orvcim {

/** A text as a quoted string of the DOT language. */
std::string dotString(std::string_view text);

/**
 * Draws a graph in the DOT language as SVG into a file, with the dot that PATH names.
 *
 * @throws Failure where there is no such program or it fails, whose own words go to standard error.
 */
void drawSvg(const std::string& graph, const std::filesystem::path& file);

} // namespace ObjectManager::Orvcim

#endif
