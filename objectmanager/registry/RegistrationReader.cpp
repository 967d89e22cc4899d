#include "registry/RegistrationReader.h"

#include "basics/Trimmed.h"
#include "classes/Literals.h"
#include "classes/MofLexer.h"
#include "classes/SchemaFiles.h"
#include "registry/ProviderTypes.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <iterator>
#include <sstream>
#include <string>
#include <utility>

namespace ObjectManager {

namespace {

std::vector<std::string> wordsOf(std::string_view text) {
    std::istringstream stream{std::string(text)};
    return {std::istream_iterator<std::string>(stream), {}};
}

class Reader {
public:
    explicit Reader(std::string_view file) : _file(file) {}

    std::vector<Registration> read(std::string_view text) {
        while (!text.empty()) {
            const std::size_t end = std::min(text.find('\n'), text.size());
            ++_line;
            line(trimmed(text.substr(0, std::min(end, text.find('#')))));
            text.remove_prefix(std::min(end + 1, text.size()));
        }
        endSection();
        return std::move(_registrations);
    }

private:
    void line(std::string_view text) {
        if (text.empty()) {
            return;
        }
        if (text.front() == '[') {
            beginSection(text);
            return;
        }
        const std::size_t colon = text.find(':');
        if (_registrations.empty() || colon == std::string_view::npos) {
            fail(_line, text, _registrations.empty() ? "[CLASS]" : "[CLASS] or KEY: VALUE");
        }
        entry(trimmed(text.substr(0, colon)), trimmed(text.substr(colon + 1)));
    }

    void beginSection(std::string_view text) {
        endSection();
        const std::string_view name = text.back() == ']' ? trimmed(text.substr(1, text.size() - 2)) : "";
        if (name.empty()) {
            fail(_line, text, "[CLASS]");
        }
        _registrations.emplace_back().className = name;
        _sectionLine = _line;
        _keys.clear();
    }

    void entry(std::string_view key, std::string_view value) {
        Registration& registration = _registrations.back();
        if (std::find(_keys.begin(), _keys.end(), key) != _keys.end()) {
            fail(_line, key, fmt::format("every key of [{}] once", registration.className));
        }
        _keys.emplace_back(key);
        if (value.empty()) {
            fail(_line, key, fmt::format("a value behind '{}:'", key));
        }
        if (key == "provider") {
            registration.provider = value;
        } else if (key == "location") {
            registration.location = value;
        } else if (key == "namespace") {
            registration.nameSpaces = wordsOf(value);
        } else if (key == "methods") {
            registration.methods = wordsOf(value);
        } else if (key == "type") {
            types(registration, value);
        } else if (key != "unload" && key != "group") {
            fail(_line, key, "provider, location, type, namespace, methods, unload or group");
        }
    }

    void types(Registration& registration, std::string_view value) {
        for (const std::string& word : wordsOf(value)) {
            const auto* const type = std::find_if(providerTypes.begin(), providerTypes.end(),
                                                  [&word](const ProviderType& t) { return t.name == word; });
            if (type == providerTypes.end()) {
                fail(_line, word, "instance, method, association, property or indication");
            }
            registration.*(type->flag) = true;
        }
    }

    void endSection() {
        if (_registrations.empty()) {
            return;
        }
        std::vector<std::string_view> missing = {"provider", "location", "type", "namespace"};
        std::erase_if(missing, [this](std::string_view key) {
            return std::find(_keys.begin(), _keys.end(), key) != _keys.end();
        });
        if (!missing.empty()) {
            throw SchemaError(placeOf(_file, _sectionLine),
                              fmt::format("found [{}] without {}, expected provider, location, type and namespace",
                                          _registrations.back().className, fmt::join(missing, ", ")));
        }
    }

    [[noreturn]] void fail(std::size_t line, std::string_view found, const std::string& expected) const {
        throw SchemaError(placeOf(_file, line), fmt::format("found '{}', expected {}", found, expected));
    }

    std::string_view _file;
    std::size_t _line = 0;
    std::size_t _sectionLine = 0;
    /** The keys that were found so far in the current section. */
    std::vector<std::string> _keys;
    std::vector<Registration> _registrations;
};

} // namespace

std::vector<Registration> readRegistrations(std::string_view text, std::string_view file) {
    return Reader(file).read(text);
}

std::vector<Registration> readRegistrations(const std::filesystem::path& folder) {
    std::vector<Registration> registrations;
    for (const auto& file : filesOf(folder, ".reg")) {
        std::vector<Registration> read = readRegistrations(readFile(file), file.string());
        std::move(read.begin(), read.end(), std::back_inserter(registrations));
    }
    return registrations;
}

} // namespace ObjectManager
