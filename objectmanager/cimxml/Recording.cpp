#include "cimxml/Recording.h"

#include "basics/Printable.h"
#include "cimxml/ValueReader.h"
#include "text/MofText.h"
#include "text/ObjectPathText.h"

#include <algorithm>
#include <functional>
#include <string_view>

namespace ObjectManager::CimXml {

namespace {

/* Limits in bytes: a line of the log is cut at 1000, and the outcome of the call, at its end, must not be cut off. */
constexpr std::size_t longestText = 300;
constexpr std::size_t longestName = 80;
/* The reason is the end of the line; the journal, where lines are not cut, gets more of it. */
constexpr std::size_t longestReason = 2000;

/** Puts a text in quotes, unless it is one word. */
std::string valueText(const std::string& text) {
    constexpr std::string_view wordCharacters = "+-.0123456789ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz";
    return !text.empty() && text.find_first_not_of(wordCharacters) == std::string::npos ? text
                                                                                        : mofLiteral(stringValue(text));
}

std::string attributeOf(const XmlElement& element, std::string_view name) {
    const std::string* const value = element.attribute(name);
    return value == nullptr ? std::string() : *value;
}

/** The text of the path that `read` returns; `otherwise` if it cannot be read. */
std::string pathText(const std::function<ObjectPath()>& read, const std::string& otherwise) {
    try {
        return formatObjectPath(read());
    } catch (const std::exception&) {
        return otherwise;
    }
}

std::string textOf(const XmlElement& element, const ValueReader& reader) {
    if (element.name == "VALUE") {
        return valueText(element.text);
    }
    if (element.name == "VALUE.REFERENCE") {
        return pathText([&] { return reader.reference(element); }, "a reference that names nothing");
    }
    if (element.name == "INSTANCENAME") {
        return pathText([&] { return reader.instanceName(element); }, attributeOf(element, "CLASSNAME"));
    }
    if (element.name == "CLASSNAME") {
        return attributeOf(element, "NAME");
    }
    std::string text;
    for (const XmlElement& child : element.children) {
        text += (text.empty() ? "" : ", ") + textOf(child, reader);
    }
    return element.name + " {" + text + '}';
}

std::string argumentsText(const Message& message, const ValueReader& reader) {
    std::string text;
    for (const Argument& argument : message.arguments()) {
        text += (text.empty() ? "" : ", ") + argument.name + '=' +
                (argument.content == nullptr ? "NULL" : textOf(*argument.content, reader));
    }
    return text;
}

} // namespace

Audit::CallRecord recordOf(const Message& message, const Server::Caller& caller, const Catalogue& catalogue,
                           Audit::Verdict verdict, const std::string& reason) {
    const ValueReader reader(catalogue, message.nameSpace());
    std::string target = message.nameSpace();
    std::string className;
    if (!message.isIntrinsic()) {
        const XmlElement& named = message.target();
        const bool isClass = named.name == "CLASSNAME";
        className = attributeOf(named, isClass ? "NAME" : "CLASSNAME");
        target = pathText([&] { return isClass ? reader.className(named) : reader.instanceName(named); },
                          target + ':' + className);
    }
    return {std::chrono::system_clock::now(),
            caller.address,
            caller.user,
            printable(target, longestText),
            printable(className, longestName),
            printable(message.method(), longestName),
            printable(argumentsText(message, reader), longestText),
            verdict,
            printable(reason, longestReason)};
}

} // namespace ObjectManager::CimXml
