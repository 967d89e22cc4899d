#include "orvcim/Arguments.h"

#include "classes/Literals.h"
#include "model/CimError.h"
#include "orvcim/Session.h"
#include "text/ObjectPathText.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <utility>

namespace ObjectManager::Orvcim {

namespace {

struct NamedText {
    std::string name;
    std::string value;
};

NamedText split(const std::string& text) {
    const std::size_t sign = text.find('=');
    if (sign == std::string::npos || sign == 0) {
        throw UsageError(fmt::format("found the argument '{}', expected NAME=VALUE", text));
    }
    return {text.substr(0, sign), text.substr(sign + 1)};
}

[[noreturn]] void invalid(const std::string& message) {
    throw CimError(CMPI_RC_ERR_INVALID_PARAMETER, message);
}

std::string inputNames(const Method& method) {
    std::vector<std::string> names;
    for (const Parameter& parameter : method.parameters) {
        if (parameter.isIn()) {
            names.push_back(parameter.name);
        }
    }
    return names.empty() ? "none" : fmt::format("{}", fmt::join(names, ", "));
}

Value referenceOf(const std::string& text, const Parameter& parameter, const Catalogue& catalogue,
                  std::string_view nameSpace) {
    ObjectPath path = parseObjectPath(text, catalogue, nameSpace);
    if (catalogue.find(path.className) != nullptr && !catalogue.isA(path.className, parameter.referenceClass)) {
        invalid(fmt::format("argument {}: found a {}, expected a {}", parameter.name, path.className,
                            parameter.referenceClass));
    }
    return referenceValue(std::move(path));
}

Value elementOf(const std::string& text, const Parameter& parameter, const Catalogue& catalogue,
                std::string_view nameSpace) {
    try {
        const auto type = static_cast<CMPIType>(parameter.type & ~CMPI_ARRAY);
        return type == CMPI_ref ? referenceOf(text, parameter, catalogue, nameSpace) : valueOfText(text, type);
    } catch (const LiteralError& error) {
        invalid(fmt::format("argument {}: {}", parameter.name, error.what()));
    } catch (const ObjectPathError& error) {
        invalid(fmt::format("argument {}: {}", parameter.name, error.what()));
    }
}

/** The value of a parameter, made from the values that were given for it. */
Value valueOf(Value::Array elements, const Parameter& parameter) {
    if ((parameter.type & CMPI_ARRAY) != 0) {
        return arrayValue(static_cast<CMPIType>(parameter.type & ~CMPI_ARRAY), std::move(elements));
    }
    if (elements.size() > 1) {
        invalid(fmt::format("argument {}: found {} values, expected one", parameter.name, elements.size()));
    }
    return std::move(elements.front());
}

} // namespace

std::vector<NamedValue> parseArguments(const std::vector<std::string>& texts, const Method& method,
                                       const Catalogue& catalogue, std::string_view nameSpace) {
    std::vector<NamedText> given;
    for (const std::string& text : texts) {
        given.push_back(split(text));
        const Parameter* parameter = findElement(method.parameters, given.back().name);
        if (parameter == nullptr || !parameter->isIn()) {
            invalid(fmt::format("found the argument {}, expected an input of {}: {}", given.back().name, method.name,
                                inputNames(method)));
        }
    }
    std::vector<NamedValue> arguments;
    for (const Parameter& parameter : method.parameters) {
        Value::Array elements;
        for (const NamedText& text : given) {
            if (equalNames(text.name, parameter.name)) {
                elements.push_back(elementOf(text.value, parameter, catalogue, nameSpace));
            }
        }
        if (!elements.empty()) {
            arguments.push_back({parameter.name, valueOf(std::move(elements), parameter)});
        } else if (hasFlag(parameter.qualifiers, "Required")) {
            invalid(fmt::format("found no argument {}, expected it since {} requires it", parameter.name, method.name));
        }
    }
    return arguments;
}

} // namespace ObjectManager::Orvcim
