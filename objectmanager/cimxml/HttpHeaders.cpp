#include "cimxml/HttpHeaders.h"

#include "basics/Trimmed.h"
#include "cimxml/Markup.h"
#include "cimxml/ProtocolError.h"
#include "cimxml/StatusCodes.h"
#include "classes/Literals.h"

#include <algorithm>
#include <charconv>
#include <iterator>
#include <optional>
#include <utility>

namespace ObjectManager::CimXml {

namespace {

constexpr std::string_view extension = "http://www.dmtf.org/cim/mapping/http/v1.";
constexpr std::string_view replyExtension = "http://www.dmtf.org/cim/mapping/http/v1.0 ; ns=";

/** The pieces of a text between separators, without the white space around them. */
std::vector<std::string_view> split(std::string_view text, char separator) {
    std::vector<std::string_view> pieces;
    for (std::size_t start = 0; start <= text.size();) {
        const std::size_t end = std::min(text.find(separator, start), text.size());
        pieces.push_back(trimmed(text.substr(start, end - start)));
        start = end + 1;
    }
    return pieces;
}

std::string_view unquoted(std::string_view text) {
    return text.size() >= 2 && text.front() == '"' && text.back() == '"' ? text.substr(1, text.size() - 2) : text;
}

/**
 * The value of a parameter of a header value such as 'text/xml; charset="utf-8"'; no value if the
 * parameter is missing.
 */
std::optional<std::string_view> parameterOf(std::string_view value, std::string_view name) {
    const std::vector<std::string_view> pieces = split(value, ';');
    for (auto piece = pieces.begin() + 1; piece != pieces.end(); ++piece) {
        const std::size_t equals = piece->find('=');
        if (equals != std::string_view::npos && equalNames(trimmed(piece->substr(0, equals)), name)) {
            return unquoted(trimmed(piece->substr(equals + 1)));
        }
    }
    return std::nullopt;
}

/** Whether a list such as 'text/xml, application/xml;q=0.5' accepts one of the names. The weight 0 excludes a name. */
bool accepts(std::string_view list, std::initializer_list<std::string_view> names) {
    for (const std::string_view entry : split(list, ',')) {
        const std::string_view name = split(entry, ';').front();
        const std::string_view weight = parameterOf(entry, "q").value_or("1");
        const bool ruledOut = weight.find_first_not_of("0.") == std::string_view::npos;
        const bool named = std::any_of(names.begin(), names.end(), [&](auto other) { return equalNames(name, other); });
        if (named && !ruledOut) {
            return true;
        }
    }
    return false;
}

bool takesApplicationXml(std::string_view accept) {
    return accepts(accept, {"application/xml", "application/*", "*/*"});
}

/** The extension that a declaration such as '"URI" ; ns=73' names. */
std::string_view extensionOf(std::string_view declaration) {
    return unquoted(split(declaration, ';').front());
}

/** The two digits that a declaration gives to CIM's headers; no value if it declares another extension. */
std::optional<std::string> numberOf(std::string_view declaration) {
    const std::string_view number = parameterOf(declaration, "ns").value_or("");
    const bool digits = number.size() == 2 && number.find_first_not_of("0123456789") == std::string_view::npos;
    return digits && extensionOf(declaration).starts_with(extension) ? std::optional<std::string>(number)
                                                                     : std::nullopt;
}

/** Replaces each "%41" in a header value by its byte. A '%' without two hexadecimal digits stands for itself. */
std::string decoded(std::string_view value) {
    std::string text;
    for (std::size_t i = 0; i < value.size(); ++i) {
        const std::string_view digits = value.substr(i + 1, 2);
        unsigned char byte = 0;
        const auto [end, error] = std::from_chars(digits.data(), digits.data() + digits.size(), byte, 16);
        if (value[i] == '%' && digits.size() == 2 && error == std::errc() && end == digits.data() + digits.size()) {
            text += static_cast<char>(byte);
            i += digits.size();
        } else {
            text += value[i];
        }
    }
    return text;
}

/** The reverse of `decoded`: the text as one line of ASCII. */
std::string encoded(std::string_view text) {
    constexpr std::string_view digits = "0123456789ABCDEF";
    std::string value;
    for (const char character : text) {
        const auto byte = static_cast<unsigned char>(character);
        if (byte < ' ' || byte > '~' || character == '%') {
            value.append({'%', digits[byte >> 4U], digits[byte & 0xFU]});
        } else {
            value += character;
        }
    }
    return value;
}

/** Refuses a request with another mandatory extension: RFC 2774 forbids to answer it without that extension. */
void requireOwnOnly(const std::vector<std::string_view>& mandatory) {
    const auto foreign = std::find_if(mandatory.begin(), mandatory.end(), [](std::string_view declaration) {
        return !extensionOf(declaration).starts_with(extension);
    });
    if (foreign != mandatory.end()) {
        throw ProtocolError(Http::notExtended, nullptr,
                            "found the mandatory extension " + std::string(extensionOf(*foreign)) + ", expected " +
                                std::string(extension) + "0 only");
    }
}

/** The headers in which a reply to M-POST declares the extension. */
std::vector<std::pair<std::string, std::string>> extensionHeaders(const std::string& prefix) {
    if (prefix.empty()) {
        return {};
    }
    return {{"Ext", ""},
            {"Cache-Control", "no-cache"},
            {"Man", std::string(replyExtension) + prefix.substr(0, prefix.size() - 1)}};
}

} // namespace

RequestHeaders::RequestHeaders(const HttpRequest& request) : _request(request), _extended(request.method == "M-POST") {
    if (!_extended && request.method != "POST") {
        throw ProtocolError(Http::methodNotAllowed, nullptr,
                            "found the HTTP method " + request.method + ", expected POST or M-POST");
    }
    for (const char* header : {"Man", "Opt"}) {
        for (const std::string_view declaration : listOf(header)) {
            const auto number = numberOf(declaration);
            if (number && _prefix.empty()) {
                _prefix = *number + '-';
            }
        }
    }
    if (_extended && _prefix.empty()) {
        throw ProtocolError(Http::notExtended, nullptr,
                            "found no header Man with " + std::string(extension) + "0, which M-POST requires");
    }
    if (_extended) {
        requireOwnOnly(listOf("Man"));
    }
}

std::vector<std::string_view> RequestHeaders::listOf(std::string_view name) const {
    std::vector<std::string_view> list;
    for (const auto& [header, value] : _request.headers) {
        if (equalNames(header, name)) {
            const std::vector<std::string_view> entries = split(value, ',');
            std::copy_if(entries.begin(), entries.end(), std::back_inserter(list),
                         [](std::string_view entry) { return !entry.empty(); });
        }
    }
    return list;
}

const std::string* RequestHeaders::findOwn(std::string_view name) const {
    const std::string whole = prefixed(name);
    const std::string* found = nullptr;
    for (const auto& [header, value] : _request.headers) {
        if (!equalNames(header, whole) && !equalNames(header, name)) {
            continue;
        }
        if (found != nullptr) {
            throw headerMismatch("found the header " + std::string(name) + " twice, expected it once");
        }
        found = &value;
    }
    return found;
}

void RequestHeaders::check() const {
    checkTypes();
    if (findOwn("CIMExport") != nullptr) {
        throw ProtocolError(Http::notImplemented, "unsupported-operation", "found an export, expected an operation");
    }
    const std::string* operation = findOwn("CIMOperation");
    if (operation == nullptr) {
        throw ProtocolError(Http::badRequest, nullptr,
                            "found no header " + prefixed("CIMOperation") + ", which a CIM operation requires");
    }
    if (!equalNames(trimmed(*operation), "MethodCall")) {
        throw ProtocolError(Http::badRequest, "unsupported-operation",
                            "found the CIMOperation \"" + *operation + "\", expected MethodCall");
    }
    if (findOwn("CIMBatch") != nullptr) {
        throw ProtocolError(Http::notImplemented, "multiple-requests-unsupported",
                            "found several operations in one request, expected one");
    }
    const std::string* version = findOwn("CIMProtocolVersion");
    if (version != nullptr && !trimmed(*version).starts_with("1.")) {
        throw ProtocolError(Http::notImplemented, "unsupported-protocol-version",
                            "found the CIMProtocolVersion \"" + *version + "\", expected 1.x");
    }
}

void RequestHeaders::checkTypes() const {
    const std::string* type = _request.header("Content-Type");
    const std::string_view media = type == nullptr ? std::string_view() : split(*type, ';').front();
    const std::string_view charset =
        type == nullptr ? std::string_view() : parameterOf(*type, "charset").value_or("utf-8");
    if ((!equalNames(media, "application/xml") && !equalNames(media, "text/xml")) ||
        (!equalNames(charset, "utf-8") && !equalNames(charset, "us-ascii"))) {
        throw ProtocolError(Http::unsupportedMediaType, nullptr,
                            "found the Content-Type \"" + (type == nullptr ? "" : *type) +
                                "\", expected application/xml or text/xml in utf-8");
    }
    const std::string* encoding = _request.header("Content-Encoding");
    if (encoding != nullptr && !equalNames(trimmed(*encoding), "identity")) {
        throw ProtocolError(Http::unsupportedMediaType, nullptr,
                            "found the Content-Encoding \"" + *encoding + "\", expected none");
    }
    const std::string* accept = _request.header("Accept");
    if (accept != nullptr && !takesApplicationXml(*accept) && !accepts(*accept, {"text/xml", "text/*"})) {
        throw ProtocolError(Http::notAcceptable, nullptr,
                            "found the Accept \"" + *accept + "\", expected a list with application/xml or text/xml");
    }
    const std::string* charsets = _request.header("Accept-Charset");
    if (charsets != nullptr && !accepts(*charsets, {"utf-8", "*"})) {
        throw ProtocolError(Http::notAcceptable, nullptr,
                            "found the Accept-Charset \"" + *charsets + "\", expected a list with utf-8");
    }
}

void RequestHeaders::checkAgainst(const Message& message) const {
    const std::string* version = findOwn("CIMProtocolVersion");
    if (version != nullptr && trimmed(*version) != message.protocolVersion()) {
        throw headerMismatch("found the CIMProtocolVersion \"" + *version + "\", expected \"" +
                             message.protocolVersion() + "\" as in the body");
    }
    const std::string* method = findOwn("CIMMethod");
    if (method == nullptr || !equalNames(trimmed(decoded(*method)), message.method())) {
        throw headerMismatch(
            (method == nullptr ? "found no header CIMMethod" : "found the CIMMethod \"" + *method + '"') +
            ", expected \"" + message.method() + "\" as in the body");
    }
    checkObject(message);
}

/** The header must name the namespace of the body and, if the body calls a method of a class, also the class. */
void RequestHeaders::checkObject(const Message& message) const {
    const std::string* object = findOwn("CIMObject");
    const std::string path = object == nullptr ? std::string() : decoded(*object);
    std::string_view nameSpace = trimmed(path);
    nameSpace.remove_prefix(nameSpace.starts_with('/') ? 1 : 0);
    std::string_view className;
    if (const std::size_t colon = nameSpace.find(':'); colon != std::string_view::npos) {
        className = nameSpace.substr(colon + 1);
        className = className.substr(0, className.find('.'));
        nameSpace = nameSpace.substr(0, colon);
    }
    std::string expected = message.nameSpace();
    bool same = object != nullptr && equalNames(nameSpace, expected);
    if (!message.isIntrinsic()) {
        const std::string target =
            requiredAttribute(message.target(), message.target().name == "CLASSNAME" ? "NAME" : "CLASSNAME");
        same = same && equalNames(className, target);
        expected += ':' + target;
    }
    if (!same) {
        throw headerMismatch(
            (object == nullptr ? "found no header CIMObject" : "found the CIMObject \"" + *object + '"') +
            ", expected \"" + expected + "\" as in the body");
    }
}

const char* RequestHeaders::replyType() const {
    const std::string* accept = _request.header("Accept");
    return accept == nullptr || takesApplicationXml(*accept) ? "application/xml; charset=\"utf-8\""
                                                             : "text/xml; charset=\"utf-8\"";
}

std::string RequestHeaders::host() const {
    const std::string* host = _request.header("Host");
    return host == nullptr ? std::string() : *host;
}

std::vector<std::pair<std::string, std::string>> RequestHeaders::ofAnswer(std::chrono::microseconds taken) const {
    std::vector<std::pair<std::string, std::string>> headers = extensionHeaders(replyPrefix());
    headers.emplace_back("Content-Type", replyType());
    headers.emplace_back(replyPrefix() + "CIMOperation", "MethodResponse");
    headers.emplace_back(replyPrefix() + "WBEMServerResponseTime", std::to_string(taken.count()));
    return headers;
}

std::vector<std::pair<std::string, std::string>> trailersOfFailure(CMPIrc code, const std::string& description,
                                                                   const std::string& prefix) {
    return {{prefix + "CIMStatusCode", std::to_string(sentCode(code))},
            {prefix + "CIMStatusCodeDescription", encoded(description)}};
}

std::vector<std::pair<std::string, std::string>> headersOfFailure(const ProtocolError& error,
                                                                  const std::string& prefix) {
    std::vector<std::pair<std::string, std::string>> headers = extensionHeaders(prefix);
    if (error.status() == Http::methodNotAllowed) {
        headers.emplace_back("Allow", "POST, M-POST");
    }
    if (error.cimError() != nullptr) {
        headers.emplace_back(prefix + "CIMError", error.cimError());
    }
    return headers;
}

} // namespace ObjectManager::CimXml
