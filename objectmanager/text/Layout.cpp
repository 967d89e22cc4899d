#include "text/Layout.h"

#include "basics/Utf8.h"

#include <algorithm>
#include <functional>
#include <utility>

namespace ObjectManager {

std::size_t columnsOf(std::string_view text) {
    return static_cast<std::size_t>(std::count_if(text.begin(), text.end(), std::not_fn(continuesCharacter)));
}

std::string filled(const std::vector<std::string>& pieces, std::size_t indent) {
    std::string result;
    std::size_t column = indent;
    for (const std::string& piece : pieces) {
        const std::size_t width = columnsOf(piece);
        if (&piece != &pieces.front()) {
            const bool fits = column + 1 + width <= lineWidth;
            result += fits ? " " : "\n" + std::string(indent, ' ');
            column = fits ? column + 1 : indent;
        }
        result += piece;
        column += width;
    }
    return result;
}

std::vector<std::string> wordsOf(std::string_view text) {
    std::vector<std::string> words;
    while (true) {
        const std::size_t end = text.find(' ');
        words.emplace_back(text.substr(0, end));
        if (end == std::string_view::npos) {
            return words;
        }
        text.remove_prefix(end + 1);
    }
}

Row rowOf(std::vector<std::string> cells) {
    std::vector<std::string> last = wordsOf(cells.back());
    cells.pop_back();
    return {std::move(cells), std::move(last)};
}

std::string aligned(const std::vector<Row>& rows, std::size_t indent) {
    constexpr std::size_t gap = 2;
    if (rows.empty()) {
        return {};
    }
    std::vector<std::size_t> starts = {indent};
    for (std::size_t column = 0; column < rows.front().cells.size(); ++column) {
        std::size_t widest = 0;
        for (const Row& row : rows) {
            widest = std::max(widest, columnsOf(row.cells[column]));
        }
        starts.push_back(starts.back() + widest + gap);
    }
    std::string result;
    for (const Row& row : rows) {
        std::string line;
        for (std::size_t column = 0; column < row.cells.size(); ++column) {
            line.append(starts[column] - columnsOf(line), ' ');
            line += row.cells[column];
        }
        line.append(starts.back() - columnsOf(line), ' ');
        line += filled(row.last, starts.back());
        line.erase(line.find_last_not_of(' ') + 1);
        result += line + '\n';
    }
    return result;
}

} // namespace ObjectManager
