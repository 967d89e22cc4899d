#include "TableReader.h"

#include "Configuration.h"

#include <algorithm>
#include <cmath>
#include <locale>
#include <sstream>

namespace Norv::Agent {

namespace {

// The value in the notation of the file, on one line.
std::string describe(const toml::node& node) {
    if (node.is_table()) {
        return "a table";
    }
    if (node.is_array()) {
        return "a list";
    }
    std::ostringstream text;
    text.imbue(std::locale::classic());
    text << toml::toml_formatter{node, toml::format_flags::allow_unicode_strings};
    return text.str();
}

// The key in the notation of the file: a name with other characters than letters, digits, dashes and underscores is
// quoted.
std::string describe(const toml::key& key) {
    const auto isBare = [](char character) {
        return std::isalnum(character, std::locale::classic()) || character == '-' || character == '_';
    };
    std::string text(key.str());
    return !text.empty() && std::ranges::all_of(text, isBare) ? text : describe(toml::value<std::string>(text));
}

double secondsOf(std::chrono::milliseconds duration) {
    return std::chrono::duration<double>(duration).count();
}

} // namespace

std::string Seconds::expected() const {
    std::ostringstream text;
    text.imbue(std::locale::classic());
    text << "a number of seconds from " << secondsOf(low) << " to " << secondsOf(high);
    return text.str();
}

std::optional<std::chrono::milliseconds> Seconds::accept(const toml::node& node) const {
    if (!node.is_number()) {
        return std::nullopt;
    }
    const double value = *node.value<double>();
    // Written so that "not a number" is out of range, too.
    if (!(value >= secondsOf(low) && value <= secondsOf(high))) {
        return std::nullopt;
    }
    return std::chrono::milliseconds{std::llround(value * 1000)};
}

std::optional<std::string> Text::accept(const toml::node& node) {
    auto value = node.value_exact<std::string>();
    return value && !value->empty() ? value : std::nullopt;
}

std::optional<std::filesystem::path> AbsolutePath::accept(const toml::node& node) {
    const auto value = node.value_exact<std::string_view>();
    return value && value->starts_with('/') ? std::optional<std::filesystem::path>(*value) : std::nullopt;
}

std::optional<std::string> NodePath::accept(const toml::node& node) {
    auto value = node.value_exact<std::string>();
    constexpr auto isControl = [](unsigned char character) { return character < 0x20 || character == 0x7f; };
    const bool wellFormed = value && !value->empty() && value->front() != '/' && value->back() != '/' &&
                            value->find("//") == std::string::npos && std::ranges::none_of(*value, isControl);
    return wellFormed ? value : std::nullopt;
}

void TableReader::readTable(const char* key, const std::function<void(TableReader&)>& read) {
    if (const toml::node* node = find(key)) {
        TableReader table = tableAt(*node, key);
        read(table);
        table.finish();
    }
}

bool TableReader::readTables(const char* key, const std::function<void(TableReader&)>& read) {
    const toml::array* array = findArray(key, "a list of tables");
    if (array == nullptr) {
        return false;
    }
    std::size_t index = 0;
    for (const toml::node& node : *array) {
        TableReader table = tableAt(node, elementKey(key, index++));
        read(table);
        table.finish();
    }
    return true;
}

void TableReader::reject(const char* key, const std::string& expected) const {
    if (const toml::node* node = _table.get(key)) {
        rejectValue(*node, key, expected);
    }
    rejectAt(_table.source(), key, "missing", expected);
}

void TableReader::finish() const {
    for (const auto& [key, node] : _table) {
        if (std::ranges::find(_known, key.str()) == _known.end()) {
            std::string expected = "one of";
            for (const char* known : _known) {
                expected += std::string(known == _known.front() ? " " : ", ") + known;
            }
            rejectAt(key.source(), describe(key), "unknown key", expected);
        }
    }
}

const toml::node* TableReader::find(const char* key) {
    _known.push_back(key);
    return _table.get(key);
}

const toml::array* TableReader::findArray(const char* key, const std::string& expected) {
    const toml::node* node = find(key);
    if (node != nullptr && !node->is_array()) {
        rejectValue(*node, key, expected);
    }
    return node == nullptr ? nullptr : node->as_array();
}

std::string TableReader::elementKey(const char* key, std::size_t index) {
    return key + ('[' + std::to_string(index) + ']');
}

std::string TableReader::nameOf(std::string_view key) const {
    return _name.empty() ? std::string(key) : _name + '.' + std::string(key);
}

TableReader TableReader::tableAt(const toml::node& node, std::string_view key) const {
    const toml::table* table = node.as_table();
    if (table == nullptr) {
        rejectValue(node, key, "a table");
    }
    return {*table, _file, nameOf(key)};
}

void TableReader::rejectAt(const toml::source_region& place, std::string_view key, const std::string& value,
                           const std::string& expected) const {
    throw ConfigurationError(_file + ':' + std::to_string(place.begin.line) + ": " + nameOf(key) + ": " + value +
                             ": expected " + expected);
}

void TableReader::rejectValue(const toml::node& node, std::string_view key, const std::string& expected) const {
    rejectAt(node.source(), key, describe(node), expected);
}

} // namespace Norv::Agent
