#include "server/HttpParser.h"

#include "basics/Printable.h"
#include "basics/Trimmed.h"
#include "server/HttpStatus.h"

#include <fmt/format.h>

#include <algorithm>
#include <cctype>
#include <charconv>

namespace ObjectManager::Server {

namespace {

constexpr std::string_view lineEnd = "\r\n";

[[noreturn]] void refuse(const std::string& problem) {
    throw HttpError(Status::badRequest, problem);
}

/** Whether a byte may be in the name of a method or header (RFC 9110, section 5.6.2). */
bool isTokenCharacter(char character) {
    constexpr std::string_view others = "!#$%&'*+-.^_`|~";
    return std::isalnum(static_cast<unsigned char>(character)) != 0 || others.find(character) != std::string_view::npos;
}

bool isToken(std::string_view text) {
    return !text.empty() && std::all_of(text.begin(), text.end(), isTokenCharacter);
}

/** Whether a byte may be in the value of a header (RFC 9110, section 5.5). */
bool isValueCharacter(char character) {
    return character == '\t' || (static_cast<unsigned char>(character) >= ' ' && character != '\x7f');
}

bool isTargetCharacter(char character) {
    return character > ' ' && character != '\x7f';
}

/** Removes the blanks that may stand around values of headers (RFC 9110, section 5.6.3), and no other white space. */
std::string_view withoutBlanks(std::string_view text) {
    return trimmed(text, " \t");
}

/** Removes the first line from the text, and returns it. The text must contain the line's end. */
std::string_view takeLine(std::string_view& text) {
    const std::size_t end = text.find('\n');
    if (end == 0 || text[end - 1] != '\r') {
        refuse("found the end of a line without a carriage return, expected both");
    }
    const std::string_view line = text.substr(0, end - 1);
    text.remove_prefix(end + 1);
    return line;
}

void parseRequestLine(std::string_view line, RequestHead& head, int& minorVersion) {
    const std::size_t methodEnd = line.find(' ');
    const std::size_t targetEnd = line.rfind(' ');
    const std::string_view version = line.substr(targetEnd + 1);
    head.method = line.substr(0, methodEnd);
    head.target = line.substr(methodEnd + 1, std::max(targetEnd, methodEnd + 1) - methodEnd - 1);
    if (head.target.empty() || !std::all_of(head.target.begin(), head.target.end(), isTargetCharacter)) {
        refuse("found a request line with blanks or control characters in its target, expected none");
    }
    constexpr std::string_view ours = "HTTP/1.";
    if (!version.starts_with(ours) || version.size() != ours.size() + 1 || std::isdigit(version.back()) == 0) {
        throw HttpError(Status::versionNotSupported, std::string(Status::reasonOf(Status::versionNotSupported)));
    }
    minorVersion = version.back() - '0';
}

void parseHeader(std::string_view line, HttpHeaders& headers) {
    if (line.front() == ' ' || line.front() == '\t') {
        refuse("found a header that goes on in the next line, expected it in one");
    }
    const std::size_t colon = line.find(':');
    const std::string_view name = line.substr(0, colon);
    if (colon == std::string_view::npos || !isToken(name)) {
        refuse(fmt::format("found \"{}\", expected the name of a header, followed by a colon", printable(name)));
    }
    const std::string_view value = withoutBlanks(line.substr(colon + 1));
    if (!std::all_of(value.begin(), value.end(), isValueCharacter)) {
        refuse(fmt::format("found a control character in the header {}, expected none", name));
    }
    headers.emplace_back(name, value);
}

/** The value of a header that may occur once only, or, if it may be repeated, always with the same value. */
std::optional<std::string_view> onlyValue(const HttpHeaders& headers, std::string_view name, const char* problem,
                                          bool mayBeRepeated) {
    std::optional<std::string_view> found;
    for (const auto& [each, value] : headers) {
        if (equalTokens(each, name)) {
            if (found && !(mayBeRepeated && *found == value)) {
                refuse(problem);
            }
            found = value;
        }
    }
    return found;
}

Framing framingOf(const HttpHeaders& headers, int minorVersion) {
    constexpr const char* several = "found several lengths of the body, expected one";
    const auto length = onlyValue(headers, "Content-Length", several, true);
    const auto coding = onlyValue(headers, "Transfer-Encoding", several, true);
    if (length && coding) {
        refuse(several);
    }
    Framing framing;
    if (coding) {
        if (!equalTokens(*coding, "chunked")) {
            throw HttpError(Status::notImplemented,
                            fmt::format("found the Transfer-Encoding \"{}\", expected chunked", printable(*coding)));
        }
        if (minorVersion == 0) {
            refuse("found the header Transfer-Encoding in HTTP/1.0, expected Content-Length");
        }
        framing.chunked = true;
    } else if (length) {
        const char* const end = length->data() + length->size();
        const auto [rest, error] = std::from_chars(length->data(), end, framing.length);
        if (error == std::errc::result_out_of_range && rest == end) {
            throw HttpError(Status::contentTooLarge, std::string(Status::reasonOf(Status::contentTooLarge)));
        }
        if (error != std::errc() || rest != end) {
            refuse(fmt::format("found the Content-Length \"{}\", expected a number", printable(*length)));
        }
    }
    return framing;
}

bool hasToken(const HttpHeaders& headers, std::string_view name, std::string_view token) {
    return std::any_of(headers.begin(), headers.end(), [&](const auto& header) {
        if (!equalTokens(header.first, name)) {
            return false;
        }
        std::string_view rest = header.second;
        while (!rest.empty()) {
            const std::size_t comma = std::min(rest.find(','), rest.size());
            if (equalTokens(withoutBlanks(rest.substr(0, comma)), token)) {
                return true;
            }
            rest.remove_prefix(std::min(comma + 1, rest.size()));
        }
        return false;
    });
}

} // namespace

bool mayBeRequestLine(std::string_view text) {
    const std::size_t end = text.find('\n');
    const std::string_view line = text.substr(0, end);
    const std::size_t methodEnd = std::min(line.find(' '), line.size());
    constexpr std::string_view protocol = " HTTP/";
    return std::all_of(line.begin(), line.begin() + static_cast<std::ptrdiff_t>(methodEnd), isTokenCharacter) &&
           (end == std::string_view::npos || (methodEnd != 0 && line.rfind(protocol) != std::string_view::npos));
}

std::optional<std::size_t> sizeOfHead(std::string_view received) {
    // A line that ends without a carriage return counts here, too; parseHead refuses it.
    for (std::size_t end = received.find('\n'); end != std::string_view::npos; end = received.find('\n', end + 1)) {
        const std::string_view rest = received.substr(end + 1);
        if (rest.starts_with('\n')) {
            return end + 2;
        }
        if (rest.starts_with(lineEnd)) {
            return end + 1 + lineEnd.size();
        }
    }
    return std::nullopt;
}

RequestHead parseHead(std::string_view text) {
    RequestHead head;
    int minorVersion = 0;
    parseRequestLine(takeLine(text), head, minorVersion);
    for (std::string_view line = takeLine(text); !line.empty(); line = takeLine(text)) {
        parseHeader(line, head.headers);
    }
    const auto host = onlyValue(head.headers, "Host", "found several headers Host, expected one", false);
    if (!host && minorVersion > 0) {
        refuse("found no header Host, expected one");
    }
    head.host = host.value_or("");
    head.framing = framingOf(head.headers, minorVersion);
    head.keepAlive = minorVersion > 0 ? !hasToken(head.headers, "Connection", "close")
                                      : hasToken(head.headers, "Connection", "keep-alive");
    head.takesChunks = minorVersion > 0;
    head.takesTrailers = head.takesChunks && hasToken(head.headers, "TE", "trailers");
    head.expectsContinue = minorVersion > 0 && hasToken(head.headers, "Expect", "100-continue");
    return head;
}

std::string hostNameOf(std::string_view host) {
    if (host.starts_with('[')) {
        host = host.substr(1, host.find(']') - 1);
    } else {
        host = host.substr(0, host.find(':'));
    }
    if (host.ends_with('.')) {
        host.remove_suffix(1);
    }
    std::string name(host);
    std::transform(name.begin(), name.end(), name.begin(), [](unsigned char c) { return std::tolower(c); });
    return name;
}

void ChunkedBody::take(std::string& received, std::string& data) {
    constexpr std::size_t longestSizeLine = 200;
    std::string_view rest = received;
    const auto advance = [&](std::size_t size) { rest.remove_prefix(size); };
    bool stuck = false;
    while (!stuck && _part != Part::end) {
        std::optional<std::string_view> line;
        switch (_part) {
        case Part::size:
            line = lineOf(rest, longestSizeLine);
            if (line) {
                const std::string_view digits = withoutBlanks(line->substr(0, line->find(';')));
                const char* const end = digits.data() + digits.size();
                constexpr int hexadecimal = 16;
                const auto [last, error] = std::from_chars(digits.data(), end, _missing, hexadecimal);
                if (error != std::errc() || last != end) {
                    refuse(fmt::format("found the size \"{}\" of a chunk, expected hexadecimal digits",
                                       printable(digits)));
                }
                advance(line->size() + lineEnd.size());
                _part = _missing == 0 ? Part::trailers : Part::data;
            }
            break;
        case Part::data: {
            const std::size_t size = std::min<std::uint64_t>(_missing, rest.size());
            line = size == 0 ? std::nullopt : std::optional(rest.substr(0, size));
            data.append(rest.substr(0, size));
            advance(size);
            _missing -= size;
            _part = _missing == 0 ? Part::dataEnd : Part::data;
            break;
        }
        case Part::dataEnd:
            line = lineOf(rest, 0);
            if (line) {
                advance(lineEnd.size());
                _part = Part::size;
            }
            break;
        case Part::trailers:
            line = lineOf(rest, _mostTrailers - _trailers);
            if (line) {
                _trailers += line->size();
                advance(line->size() + lineEnd.size());
                _part = line->empty() ? Part::end : Part::trailers;
            }
            break;
        case Part::end:
            break;
        }
        stuck = !line;
    }
    received.erase(0, received.size() - rest.size());
}

std::optional<std::string_view> ChunkedBody::lineOf(std::string_view received, std::size_t most) const {
    const std::size_t end = received.find('\n');
    if (end == std::string_view::npos ? received.size() > most + lineEnd.size() : end > most + 1) {
        refuse("found no end of a line in a chunked body where it has to be");
    }
    if (end == std::string_view::npos) {
        return std::nullopt;
    }
    if (end == 0 || received[end - 1] != '\r') {
        refuse("found the end of a line without a carriage return in a chunked body, expected both");
    }
    return received.substr(0, end - 1);
}

} // namespace ObjectManager::Server
