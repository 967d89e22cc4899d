#include "ServiceFixture.h"
#include "WireCase.h"
#include "basics/Files.h"
#include "cimxml/ValueReader.h"

#include <gmock/gmock.h>

#include <atomic>
#include <filesystem>
#include <thread>

namespace ObjectManager::CimXml {
namespace {

using testing::HasSubstr;
using testing::Not;

class ServiceTest : public ServiceFixture {
protected:
    static HttpReply enumerate(const std::string& className) {
        return answer("POST", requestHeaders("EnumerateInstances"),
                      requestBody("EnumerateInstances", "<IPARAMVALUE NAME=\"ClassName\"><CLASSNAME NAME=\"" +
                                                            className + "\"/></IPARAMVALUE>"));
    }
};

/** Cuts each request off at each of its bytes: the rest is refused, and never taken for another request. */
TEST_F(ServiceTest, RefusesEveryRequestThatIsCutOff) {
    const std::string whole =
        requestBody("GetInstance", "<IPARAMVALUE NAME=\"InstanceName\"><INSTANCENAME CLASSNAME=\"Test_Disk\">"
                                   "<KEYBINDING NAME=\"Name\"><KEYVALUE>a&amp;<![CDATA[b]]></KEYVALUE></KEYBINDING>"
                                   "</INSTANCENAME></IPARAMVALUE>");
    for (std::size_t length = 0; length < whole.size(); ++length) {
        const HttpReply reply = answer("POST", requestHeaders("GetInstance"), whole.substr(0, length));
        ASSERT_EQ(reply.status, 400U) << length;
        ASSERT_EQ(headerOf(reply, "CIMError"), "request-not-well-formed") << length;
    }
    EXPECT_EQ(answer("POST", requestHeaders("GetInstance"), whole).status, 200U);
}

/** Lists that are searched for each name have a limit, so that no request keeps a thread busy for long. */
TEST_F(ServiceTest, BoundsHowManyNamesARequestLists) {
    std::string keys;
    std::string names;
    std::string properties;
    for (std::size_t i = 0; i <= maximumNames; ++i) {
        const std::string name = "n" + std::to_string(i);
        keys += "<KEYBINDING NAME=\"" + name + "\"><KEYVALUE>x</KEYVALUE></KEYBINDING>";
        names += "<VALUE>" + name + "</VALUE>";
        properties += "<PROPERTY NAME=\"" + name + "\" TYPE=\"string\"/>";
    }
    const std::pair<std::string, std::string> requests[] = {
        {"GetInstance", "<IPARAMVALUE NAME=\"InstanceName\"><INSTANCENAME CLASSNAME=\"No_Such\">" + keys +
                            "</INSTANCENAME></IPARAMVALUE>"},
        {"GetClass", "<IPARAMVALUE NAME=\"PropertyList\"><VALUE.ARRAY>" + names + "</VALUE.ARRAY></IPARAMVALUE>"},
        {"CreateInstance", "<IPARAMVALUE NAME=\"NewInstance\"><INSTANCE CLASSNAME=\"No_Such\">" + properties +
                               "</INSTANCE></IPARAMVALUE>"}};
    for (const auto& [method, parameters] : requests) {
        const HttpReply reply = answer("POST", requestHeaders(method), requestBody(method, parameters));
        EXPECT_THAT(reply.body, HasSubstr("<ERROR CODE=\"4\" DESCRIPTION=\"found more than 1000 ")) << method;
    }
}

TEST_F(ServiceTest, NamesTheHostItselfWhereTheClientDoesNot) {
    auto headers = requestHeaders("AssociatorNames", "root/cimv2");
    headers.erase(headers.begin());
    const HttpReply reply = answer(
        "POST", headers,
        requestBody("AssociatorNames",
                    "<IPARAMVALUE NAME=\"ObjectName\"><INSTANCENAME CLASSNAME=\"TALVO_PowerManagementCapabilities\">"
                    "<KEYVALUE>chassis/blade1</KEYVALUE></INSTANCENAME></IPARAMVALUE>",
                    "root/cimv2"));
    EXPECT_THAT(reply.body, HasSubstr("<HOST>"));
    EXPECT_THAT(reply.body, Not(HasSubstr("<HOST></HOST>")));
}

/** The provider returns 0 whether or not the machine accepted the request. */
TEST_F(ServiceTest, TellsThatTheMachineRefused) {
    const WireCase reboot = readWireCase(contentOf(std::filesystem::path(TEST_CASES) / "invoke.wire"));
    const auto status = [&] {
        const std::string body = service().answer(reboot.request(), reboot.caller).body;
        return body.substr(0, body.find('\n', body.find("<ERROR")));
    };
    EXPECT_THAT(status(), Not(HasSubstr("<ERROR")));
    std::filesystem::remove(stateFile());
    std::filesystem::create_directories(stateFile() / "in the way");
    EXPECT_THAT(status(), HasSubstr("<ERROR CODE=\"1\" DESCRIPTION=\"Power request refused: reboot of "));
    std::filesystem::remove_all(stateFile());
    EXPECT_THAT(status(), Not(HasSubstr("<ERROR")));
}

TEST_F(ServiceTest, RecordsNothingThatForgesOrTurnsALineOfTheLog) {
    std::string target;
    ServiceSettings settings;
    settings.recorder = [&](const Audit::CallRecord& record) { target = record.target; };
    Service recording = serviceWith(settings);
    WireCase invocation = readWireCase(contentOf(std::filesystem::path(TEST_CASES) / "stranger-invokes.wire"));
    const std::string name = "machine.example";
    invocation.body.replace(invocation.body.find(name), name.size(), "a\u202eb\u009bc");
    recording.answer(invocation.request(), invocation.caller);
    EXPECT_THAT(target, HasSubstr("a\\xe2\\x80\\xaeb\\xc2\\x9bc"));
}

TEST_F(ServiceTest, AnswersSeveralThreadsAtOnce) {
    const std::string disks = enumerate("Test_Disk").body;
    const std::string failure = enumerate("Test_Fails").body;
    ASSERT_THAT(disks, HasSubstr("<INSTANCE "));
    ASSERT_THAT(failure, HasSubstr("<ERROR CODE=\"2\""));
    std::atomic<int> wrong = 0;
    std::vector<std::thread> threads;
    for (int i = 0; i < 8; ++i) {
        threads.emplace_back([&] {
            for (int j = 0; j < 50; ++j) {
                wrong += enumerate("Test_Disk").body != disks;
                wrong += enumerate("Test_Fails").body != failure;
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(wrong, 0);
}

} // namespace
} // namespace ObjectManager::CimXml
