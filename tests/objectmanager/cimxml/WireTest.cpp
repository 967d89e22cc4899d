/*
 * Every file in cases/ has requests with their exact replies. If the environment variable ORV_RECORD_CASES is set, the
 * replies are written into the files; look at the difference before you commit it.
 */
#include "RecordingOutlet.h"
#include "ServiceFixture.h"
#include "WireCase.h"
#include "basics/Files.h"

#include <algorithm>
#include <cctype>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>

namespace ObjectManager::CimXml {
namespace {

/** Whether the document is valid by the document type of replies. If not, xmllint says why on standard error. */
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

class WireTest : public ServiceFixture, public testing::WithParamInterface<std::filesystem::path> {
protected:
    /** The content of the simulated machine's state file; empty as long as there is none. */
    static std::string stateOfMachine() { return exists(stateFile()) ? contentOf(stateFile()) : std::string(); }
};

TEST_P(WireTest, IsAnsweredExactly) {
    Enumerations::TimePoint now;
    int contexts = 0;
    Service service = serviceWith({.enumerations = {.count = 4, .bytes = 14'000, .time = std::chrono::seconds(60)},
                                   .clock = [&] { return now; },
                                   .newContext = [&] { return "context " + std::to_string(++contexts); }});
    std::string recorded;
    for (const WireCase& given : readWireCases(contentOf(GetParam()))) {
        now += given.pause;
        const std::string machine = stateOfMachine();
        RecordingOutlet outlet;
        HttpRequest request = given.request();
        request.outlet = &outlet;
        const HttpReply reply = outlet.joined(service.answer(request, given.caller));
        recorded += (recorded.empty() ? "" : std::string(requestSeparator)) + given.requestText +
                    std::string(replySeparator) + textOf(reply);
        if (std::getenv("ORV_RECORD_CASES") == nullptr) {
            EXPECT_EQ(textOf(reply), given.reply);
            EXPECT_TRUE(reply.status != 200 || isValid(reply.body));
            if (reply.status != 200 || reply.body.find("<ERROR ") != std::string::npos) {
                EXPECT_EQ(stateOfMachine(), machine) << "the machine moved";
            }
        }
    }
    if (std::getenv("ORV_RECORD_CASES") != nullptr) {
        std::ofstream(GetParam(), std::ios::binary) << recorded;
    }
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
