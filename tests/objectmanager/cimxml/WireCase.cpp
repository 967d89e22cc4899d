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
    unsigned short pause = 0;
    std::istringstream(line) >> read.method >> read.caller.user >> pause;
    read.pause = std::chrono::seconds(pause);
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

std::vector<WireCase> readWireCases(const std::string& text) {
    const std::string separator = '\n' + std::string(requestSeparator);
    std::vector<WireCase> cases;
    for (std::size_t start = 0; start <= text.size();) {
        const std::size_t found = text.find(separator, start);
        const std::size_t end = found == std::string::npos ? text.size() : found + 1;
        cases.push_back(readWireCase(text.substr(start, end - start)));
        start = found == std::string::npos ? text.size() + 1 : end + requestSeparator.size();
    }
    return cases;
}

std::string textOf(const HttpReply& reply) {
    std::string text = std::to_string(reply.status) + '\n';
    for (const auto& [name, value] : reply.headers) {
        text += name + ": " + value + '\n';
    }
    return text + '\n' + reply.body;
}

} // namespace ObjectManager::CimXml
