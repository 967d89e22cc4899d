#include "IdentifyingFacts.h"

#include "base/RegularFile.h"
#include "base/Utf8.h"

#include <algorithm>
#include <cstddef>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <system_error>

namespace Norv::ComputerSystemProvider {

namespace {

/** A file or variable, and a description of its value for people. */
struct Source {
    const char* name;
    const char* description;
};

/**
 * The kernel lets every user read these files. In the same folder, it lets only root read the serial numbers and the
 * UUID.
 */
constexpr Source firmwareFiles[] = {
    {"sys_vendor", "System vendor"},
    {"product_name", "Product name"},
    {"product_version", "Product version"},
    {"product_family", "Product family"},
    {"product_sku", "Product SKU"},
    {"board_vendor", "Board vendor"},
    {"board_name", "Board name"},
    {"board_version", "Board version"},
    {"board_asset_tag", "Board asset tag"},
    {"chassis_vendor", "Chassis vendor"},
    {"chassis_version", "Chassis version"},
    {"chassis_asset_tag", "Chassis asset tag"},
    {"bios_vendor", "BIOS vendor"},
    {"bios_version", "BIOS version"},
    {"bios_date", "BIOS date"},
};

constexpr Source operatingSystemVariables[] = {
    {"PRETTY_NAME", "Operating system"},
    {"ID", "Operating system identifier"},
    {"VERSION_ID", "Operating system version"},
};

std::string trimmed(const std::string& text) {
    constexpr const char* blanks = " \t\r\n";
    const std::size_t first = text.find_first_not_of(blanks);
    return first == std::string::npos ? "" : text.substr(first, text.find_last_not_of(blanks) - first + 1);
}

/** Whether a text is UTF-8 without control characters. Firmware may contain any bytes, a CIM string may not. */
bool isOneLine(const std::string& text) {
    const std::optional<std::wstring> characters = Agent::wideFrom(text);
    return characters && std::ranges::none_of(*characters, [](wchar_t c) { return c < 0x20 || c == 0x7f; });
}

void append(std::vector<IdentifyingFact>& facts, const char* description, const std::string& value) {
    if (!value.empty() && isOneLine(value)) {
        facts.push_back({description, value});
    }
}

/** The file's lines, without blanks at their ends; no value if the file cannot be read. */
std::optional<std::vector<std::string>> linesOf(const std::string& file) {
    try {
        const auto content = Agent::readRegularFile(file);
        if (!content) {
            return std::nullopt;
        }
        std::vector<std::string> lines;
        for (std::size_t begin = 0; begin < content->text.size();) {
            const std::size_t end = std::min(content->text.find('\n', begin), content->text.size());
            lines.push_back(trimmed(content->text.substr(begin, end - begin)));
            begin = end + 1;
        }
        return lines;
    } catch (const std::system_error&) {
        return std::nullopt;
    }
}

/** A value of an os-release file, without the shell's quotes and backslashes. */
std::string unquoted(std::string_view text) {
    const auto isQuotedWith = [text](char quote) {
        return text.size() > 1 && text.front() == quote && text.back() == quote;
    };
    if (isQuotedWith('\'')) {
        return std::string(text.substr(1, text.size() - 2));
    }
    if (isQuotedWith('"')) {
        text = text.substr(1, text.size() - 2);
    }
    std::string value;
    for (std::size_t i = 0; i < text.size(); ++i) {
        const bool escapes = text[i] == '\\' && i + 1 < text.size();
        value += escapes ? text[++i] : text[i];
    }
    return value;
}

/** The variables of an os-release file. The last assignment of each counts. */
std::map<std::string, std::string> variablesOf(const std::vector<std::string>& lines) {
    std::map<std::string, std::string> variables;
    for (const std::string& line : lines) {
        const std::size_t assignment = line.find('=');
        if (assignment != std::string::npos && line.front() != '#') {
            variables[line.substr(0, assignment)] = unquoted(std::string_view(line).substr(assignment + 1));
        }
    }
    return variables;
}

} // namespace

std::vector<IdentifyingFact> identifyingFacts(const FactSources& sources) {
    std::vector<IdentifyingFact> facts;
    for (const auto& [file, description] : firmwareFiles) {
        const auto lines = linesOf(sources.firmware + '/' + file);
        if (lines && lines->size() == 1) {
            append(facts, description, lines->front());
        }
    }
    for (const std::string& file : sources.operatingSystem) {
        if (const auto lines = linesOf(file)) {
            auto variables = variablesOf(*lines);
            for (const auto& [variable, description] : operatingSystemVariables) {
                append(facts, description, variables[variable]);
            }
            break;
        }
    }
    return facts;
}

} // namespace Norv::ComputerSystemProvider
