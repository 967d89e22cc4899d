#include "WireCase.h"

#include <algorithm>
#include <iterator>
#include <sstream>

namespace ObjectManager::CimXml {

WireCase readWireCase(const std::string& text) {
    const std::size_t found = text.find('\n' + std::string(replySeparator));
    const std::size_t end = found == std::string::npos ? text.size() : found + 1;
    WireCase read;
    read.requestText = text.substr(0, end);
    read.reply = end == text.size() ? "" : text.substr(end + replySeparator.size());
    std::istringstream lines(read.requestText);
    std::string line;
    while (std::getline(lines, line) && line.starts_with('#')) {
    }
    std::istringstream(line) >> read.method >> read.caller.user;
    read.caller.mayRead = read.caller.user != "stranger";
    read.caller.mayChangePower = read.caller.user == "operator";
    while (std::getline(lines, line) && !line.empty()) {
        const std::size_t colon = std::min(line.find(':'), line.size());
        const std::size_t value = std::min(line.find_first_not_of(' ', colon + 1), line.size());
        read.headers.emplace_back(line.substr(0, colon), line.substr(value));
    }
    read.body = {std::istreambuf_iterator<char>(lines), {}};
    return read;
}

std::string textOf(const HttpReply& reply) {
    std::string text = std::to_string(reply.status) + '\n';
    for (const auto& [name, value] : reply.headers) {
        text += name + ": " + value + '\n';
    }
    return text + '\n' + reply.body;
}

} // namespace ObjectManager::CimXml
