/**
 * Reads a table of a TOML file strictly: a value must have the expected type and range, and an unknown key is an error.
 */
#ifndef AGENT_TABLEREADER_H
#define AGENT_TABLEREADER_H

#include "Toml.h"

#include <chrono>
#include <concepts>
#include <cstdint>
#include <filesystem>
#include <functional>
#include <span>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace Norv::Agent {

// The kinds of values that a key can require. Each kind has
//   expected()      its description, which completes "expected ..." in a message
//   accept(node)    the value of a node; no value if the node is of another kind.

/** Names that stand for values. */
template <typename T>
using Names = std::span<const std::pair<std::string_view, T>>;

/** The names in quotation marks, with separators between them. */
template <typename T>
std::string listOf(Names<T> names, const char* separator) {
    std::string text;
    for (const auto& name : names) {
        text += (text.empty() ? "\"" : separator + std::string("\"")) + std::string(name.first) + '"';
    }
    return text;
}

/** The value that a name stands for; no value if the node is none of the names. */
template <typename T>
std::optional<T> valueOf(Names<T> names, const toml::node& node) {
    for (const auto& [name, value] : names) {
        if (node.value_exact<std::string_view>() == name) {
            return value;
        }
    }
    return std::nullopt;
}

template <std::integral T>
struct Integer {
    T low;
    T high;

    std::string expected() const { return "an integer from " + std::to_string(low) + " to " + std::to_string(high); }
    std::optional<T> accept(const toml::node& node) const {
        const auto value = node.value_exact<std::int64_t>();
        if (!value || std::cmp_less(*value, low) || std::cmp_greater(*value, high)) {
            return std::nullopt;
        }
        return static_cast<T>(*value);
    }
};

/** One of `names`, or a number in a range; the number may be one that a name stands for. */
template <typename T>
struct NumberOrName {
    Integer<T> numbers;
    Names<T> names;

    std::string expected() const { return numbers.expected() + " or one of " + listOf(names, ", "); }
    std::optional<T> accept(const toml::node& node) const {
        const auto named = valueOf(names, node);
        return named ? named : numbers.accept(node);
    }
};

/** A number of seconds, with or without decimals. */
struct Seconds {
    std::chrono::milliseconds low;
    std::chrono::milliseconds high;

    std::string expected() const;
    std::optional<std::chrono::milliseconds> accept(const toml::node& node) const;
};

/** A text that is not empty. */
struct Text {
    static std::string expected() { return "a text that is not empty"; }
    static std::optional<std::string> accept(const toml::node& node);
};

/** An absolute path, which means the same in every process, whatever its working directory. */
struct AbsolutePath {
    static std::string expected() { return "an absolute path"; }
    static std::optional<std::filesystem::path> accept(const toml::node& node);
};

/** Names without control characters, separated by single slashes. */
struct NodePath {
    static std::string expected() { return "names separated by single slashes"; }
    static std::optional<std::string> accept(const toml::node& node);
};

/** One of a few names, each of which stands for a value. */
template <typename T>
struct Choice {
    Names<T> names;

    std::string expected() const { return listOf(names, " or "); }
    std::optional<T> accept(const toml::node& node) const { return valueOf(names, node); }
};

class TableReader {
public:
    /** @param table,file must outlive the reader; `file` is the file's name, for messages. */
    TableReader(const toml::table& table, const std::string& file, std::string name = "")
        : _table(table), _file(file), _name(std::move(name)) {}

    /**
     * Sets `target` to the key's value; leaves it unchanged if the table has no such key.
     *
     * @return whether the table has the key.
     * @throws ConfigurationError if the value is not of that kind. The other members throw it in the same case.
     */
    template <typename Kind, typename Target>
    bool read(const char* key, const Kind& kind, Target& target) {
        const toml::node* node = find(key);
        if (node != nullptr) {
            target = accepted(*node, kind, key);
        }
        return node != nullptr;
    }

    /** The same for a key that must be present. */
    template <typename Kind, typename Target>
    void require(const char* key, const Kind& kind, Target& target) {
        if (!read(key, kind, target)) {
            reject(key, kind.expected());
        }
    }

    /** The same for a list of such values. */
    template <typename Kind, typename Element>
    bool readList(const char* key, const Kind& kind, std::vector<Element>& target) {
        const toml::array* array = findArray(key, "a list, each element " + kind.expected());
        if (array == nullptr) {
            return false;
        }
        target.clear();
        for (const toml::node& node : *array) {
            target.push_back(accepted(node, kind, elementKey(key, target.size())));
        }
        return true;
    }

    /** Calls `read` with a reader of the table behind the key, if there is one. */
    void readTable(const char* key, const std::function<void(TableReader&)>& read);

    /**
     * Calls `read` with a reader of each table in the list behind the key, in their order.
     *
     * @return whether the table has the key.
     */
    bool readTables(const char* key, const std::function<void(TableReader&)>& read);

    /** Reports that the key's value is wrong, or that the key is missing. */
    [[noreturn]] void reject(const char* key, const std::string& expected) const;

    /** Reports a key that no other call has read. Called after all known keys have been read. */
    void finish() const;

private:
    const toml::node* find(const char* key);
    const toml::array* findArray(const char* key, const std::string& expected);
    static std::string elementKey(const char* key, std::size_t index);
    std::string nameOf(std::string_view key) const;
    TableReader tableAt(const toml::node& node, std::string_view key) const;
    [[noreturn]] void rejectAt(const toml::source_region& place, std::string_view key, const std::string& value,
                               const std::string& expected) const;
    [[noreturn]] void rejectValue(const toml::node& node, std::string_view key, const std::string& expected) const;

    template <typename Kind>
    auto accepted(const toml::node& node, const Kind& kind, std::string_view key) const {
        auto value = kind.accept(node);
        if (!value) {
            rejectValue(node, key, kind.expected());
        }
        return *std::move(value);
    }

    const toml::table& _table;
    const std::string& _file;
    std::string _name;
    std::vector<const char*> _known;
};

} // namespace Norv::Agent

#endif
