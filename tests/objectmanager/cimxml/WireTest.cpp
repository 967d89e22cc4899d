/*
 * Requests as they come over the wire, and the exact replies. Every file in cases/ is one:
 *
 *     # What it is about.
 *     POST operator                       the HTTP method and who asks: operator, reader or stranger
 *     CIMOperation: MethodCall            headers, and after an empty line the body
 *     ==== 200                            the status of the reply
 *     CIMOperation: MethodResponse        its headers, and after an empty line its body
 *
 * With ORV_RECORD_CASES in the environment the replies are written into the files, to be looked at before they are
 * committed.
 */
#include "ServiceFixture.h"

#include <algorithm>
#include <cctype>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <map>
#include <sstream>
#include <stdexcept>

namespace ObjectManager::CimXml {
namespace {

constexpr std::string_view separator = "==== ";

const std::map<std::string, Caller> callers = {{"operator", {"operator", true, true}},
                                               {"reader", {"reader", true, false}},
                                               {"stranger", {"stranger", false, false}}};

struct Case {
    /** Up to the separator, as it stands in the file. */
    std::string requestText;
    std::string method;
    std::string caller;
    std::vector<std::pair<std::string, std::string>> headers;
    std::string body;
    /** Behind the separator. */
    std::string reply;
};

std::string contentOf(const std::filesystem::path& file) {
    std::ifstream stream(file, std::ios::binary);
    return {std::istreambuf_iterator<char>(stream), {}};
}

Case readCase(const std::filesystem::path& file) {
    const std::string text = contentOf(file);
    const std::size_t found = text.find('\n' + std::string(separator));
    const std::size_t end = found == std::string::npos ? text.size() : found + 1;
    Case read;
    read.requestText = text.substr(0, end);
    read.reply = end == text.size() ? "" : text.substr(end + separator.size());
    std::istringstream lines(read.requestText);
    std::string line;
    while (std::getline(lines, line) && line.starts_with('#')) {
    }
    std::istringstream(line) >> read.method >> read.caller;
    while (std::getline(lines, line) && !line.empty()) {
        const std::size_t colon = line.find(": ");
        read.headers.emplace_back(line.substr(0, colon), line.substr(std::min(colon + 2, line.size())));
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

/** Whether the document is what the document type of replies allows. xmllint says on standard error why it is not. */
bool isValid(const std::string& document) {
    std::FILE* lint = popen("xmllint --noout --nonet --dtdvalid " TEST_DOCUMENT_TYPE " -", "w");
    if (lint == nullptr) {
        return false;
    }
    const bool written = std::fwrite(document.data(), 1, document.size(), lint) == document.size();
    return pclose(lint) == 0 && written;
}

std::vector<std::filesystem::path> cases() {
    std::vector<std::filesystem::path> files(std::filesystem::directory_iterator(TEST_CASES), {});
    std::sort(files.begin(), files.end());
    return files;
}

class WireTest : public ServiceFixture, public testing::WithParamInterface<std::filesystem::path> {};

TEST_P(WireTest, isAnsweredExactly) {
    const Case given = readCase(GetParam());
    const HttpReply reply = answer(given.method, given.headers, given.body, callers.at(given.caller));
    if (std::getenv("ORV_RECORD_CASES") != nullptr) {
        std::ofstream(GetParam(), std::ios::binary) << given.requestText << separator << textOf(reply);
        return;
    }
    EXPECT_EQ(textOf(reply), given.reply);
    EXPECT_TRUE(reply.status != 200 || isValid(reply.body));
}

std::string nameOf(const testing::TestParamInfo<std::filesystem::path>& tested) {
    std::string name = tested.param.stem().string();
    std::replace_if(
        name.begin(), name.end(), [](unsigned char c) { return std::isalnum(c) == 0; }, '_');
    return name;
}

INSTANTIATE_TEST_SUITE_P(Cases, WireTest, testing::ValuesIn(cases()), nameOf);

} // namespace
} // namespace ObjectManager::CimXml
