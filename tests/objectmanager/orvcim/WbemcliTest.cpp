/* A stock client gets the same answers as the command line, for each of its operations and every class. */
#include "Serving.h"

#include <gmock/gmock.h>
#include <nlohmann/json.hpp>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <regex>
#include <sstream>

namespace OrvcimTest {
namespace {

using Json = nlohmann::json;
using testing::EndsWith;
using testing::HasSubstr;

/**
 * The meaning of a path or value, whichever program wrote it: the client orders keys differently, leaves out quotes
 * within quotes, and adds the host.
 */
std::string essence(std::string text) {
    text = std::regex_replace(text, std::regex("(//machine[.]example|localhost:[0-9]+)/"), "");
    text = std::regex_replace(text, std::regex("[\\\\\"]"), "");
    text = std::regex_replace(text, std::regex("(:TALVO_[A-Za-z]+)[.]"), "$1,");
    std::vector<std::string> parts;
    std::istringstream stream(text);
    for (std::string part; std::getline(stream, part, ',');) {
        parts.push_back(part);
    }
    std::sort(parts.begin(), parts.end());
    std::string sorted;
    for (const std::string& part : parts) {
        sorted += part + ',';
    }
    return sorted;
}

std::string textOf(const Json& value) {
    if (!value.is_array()) {
        return value.is_string() ? value.get<std::string>() : value.dump();
    }
    std::string text;
    for (const Json& element : value) {
        text += (text.empty() ? "" : ",") + textOf(element);
    }
    return text;
}

/** Objects with their properties, each as lines that are sorted. */
using Objects = std::vector<std::string>;

/** The objects in the client's output with -nl. Properties without a value are left out, since the command line leaves
 * them out. */
Objects clientsObjects(const std::string& out) {
    std::vector<std::vector<std::string>> objects;
    std::istringstream stream(out);
    for (std::string line; std::getline(stream, line);) {
        if (line.starts_with('-') && line.ends_with('=')) {
            continue;
        }
        if (line.starts_with('-')) {
            objects.back().push_back(essence(line.substr(1)));
        } else if (!line.empty()) {
            objects.push_back({essence(line)});
        }
    }
    Objects result;
    for (std::vector<std::string>& object : objects) {
        std::sort(object.begin() + 1, object.end());
        std::string text;
        for (const std::string& line : object) {
            text += line + '\n';
        }
        result.push_back(text);
    }
    std::sort(result.begin(), result.end());
    return result;
}

/** Collects every object anywhere in the command line's JSON. */
void collect(const Json& json, std::vector<Json>& found) {
    if (json.is_object() && json.contains("path")) {
        found.push_back(json);
    } else if (json.is_structured()) {
        for (const auto& each : json) {
            collect(each, found);
        }
    }
}

Objects commandLinesObjects(const Json& json) {
    std::vector<Json> found;
    collect(json, found);
    std::string text;
    for (const Json& object : found) {
        text += object["path"].get<std::string>() + '\n';
        if (object.contains("properties")) {
            for (const auto& [name, value] : object["properties"].items()) {
                text += '-' + name + '=' + textOf(value) + '\n';
            }
        }
    }
    return clientsObjects(text);
}

class WbemcliTest : public ServingTest {
protected:
    WbemcliTest() {
        configure("[[instrumentation.simulated.node]]\npath = \"chassis/blade1\"\n"
                  "[[instrumentation.simulated.node]]\npath = \"chassis/blade2\"\npower-states = [2]\n");
        serve();
    }

    Json inProcess(std::vector<std::string> arguments) const {
        arguments.insert(arguments.end(), {"--format", "json"});
        return Json::parse(answerOf(arguments));
    }

    /** Ends the simulated machine's reboot now. */
    void rebootIsOver() const {
        const std::filesystem::path file = _folder / "state.json";
        std::stringstream state;
        state << std::ifstream(file).rdbuf();
        const std::filesystem::path replacement = _folder / "state.json.new";
        std::ofstream(replacement) << std::regex_replace(state.str(), std::regex("(\"over\":\\s*)[0-9]+"), "$010");
        std::filesystem::rename(replacement, file);
    }

    static std::string clientsAnswer(const std::vector<std::string>& arguments) {
        const Outcome outcome = wbemcli(arguments);
        EXPECT_EQ(outcome.err, "");
        EXPECT_EQ(outcome.status, 0);
        return outcome.out;
    }

    /** An instance's path as the client and as the command line write it. */
    struct Path {
        std::string commandLines;
        std::string clients;
    };

    std::vector<Path> pathsOf(const std::string& className) const {
        std::vector<Path> paths;
        std::istringstream names(clientsAnswer({"ein", url("root/cimv2:" + className)}));
        for (const Json& name : inProcess({"names", className})) {
            std::string line;
            std::getline(names, line);
            EXPECT_EQ(essence(line), essence(name["path"]));
            paths.push_back({name["path"], "http://" + line});
        }
        return paths;
    }
};

class WbemcliClassTest : public WbemcliTest, public testing::WithParamInterface<const char*> {};

INSTANTIATE_TEST_SUITE_P(Class, WbemcliClassTest,
                         testing::Values("TALVO_ComputerSystem", "TALVO_PowerManagementService",
                                         "TALVO_PowerManagementCapabilities", "TALVO_AssociatedPowerManagementService",
                                         "TALVO_PowerManagementElementCapabilities",
                                         "TALVO_PowerManagementHostedService"),
                         [](const auto& tested) { return std::string(tested.param).substr(6); });

TEST_P(WbemcliClassTest, EnumeratesTheSameInstances) {
    const std::string className = GetParam();
    const Objects names = commandLinesObjects(inProcess({"names", className}));
    EXPECT_FALSE(names.empty());
    EXPECT_EQ(clientsObjects(clientsAnswer({"ein", url("root/cimv2:" + className)})), names);
    EXPECT_EQ(clientsObjects(clientsAnswer({"ei", "-nl", url("root/cimv2:" + className)})),
              commandLinesObjects(inProcess({"instances", className})));
}

TEST_P(WbemcliClassTest, GetsTheSameInstanceAndProperties) {
    for (const Path& path : pathsOf(GetParam())) {
        const Json instance = inProcess({"get", path.commandLines});
        EXPECT_EQ(clientsObjects(clientsAnswer({"gi", "-nl", path.clients})), commandLinesObjects(instance));
        std::vector<Json> found;
        collect(instance, found);
        for (const auto& [name, value] : found.at(0)["properties"].items()) {
            std::string answer = clientsAnswer({"gp", path.clients, name});
            ASSERT_THAT(answer, EndsWith("\n"));
            answer.pop_back();
            EXPECT_EQ(essence(answer), essence(textOf(value))) << name;
        }
    }
}

TEST_P(WbemcliClassTest, FollowsTheSameAssociations) {
    const std::pair<const char*, const char*> operations[] = {
        {"ain", "associator-names"}, {"ai", "associators"}, {"rin", "reference-names"}, {"ri", "references"}};
    for (const Path& path : pathsOf(GetParam())) {
        for (const auto& [client, command] : operations) {
            EXPECT_EQ(clientsObjects(clientsAnswer({client, "-nl", path.clients})),
                      commandLinesObjects(inProcess({command, path.commandLines})))
                << client << ' ' << path.clients;
        }
    }
}

TEST_P(WbemcliClassTest, KnowsTheSameClass) {
    const std::string className = GetParam();
    std::vector<std::string> properties;
    for (const Json& known : inProcess({"classes"})) {
        if (known["class"] == className) {
            for (const Json& property : known["properties"]) {
                properties.push_back(property["name"].get<std::string>() + "=");
            }
        }
    }
    std::string expected = "localhost:" + _port + "/root/cimv2:" + className + ' ';
    for (const std::string& property : properties) {
        expected += (property == properties.front() ? "" : ",") + property;
    }
    EXPECT_EQ(clientsAnswer({"gc", url("root/cimv2:" + className)}), expected + '\n');
    EXPECT_THAT(clientsAnswer({"ec", url("root/cimv2")}), HasSubstr(expected + '\n'));
    EXPECT_THAT(clientsAnswer({"ecn", url("root/cimv2")}),
                HasSubstr("localhost:" + _port + "/root/cimv2:" + className + '\n'));
}

TEST_P(WbemcliClassTest, IsToldThatNothingElseCanBeChanged) {
    const Path path = pathsOf(GetParam()).at(0);
    // The client gets the instance first, and sends no other property.
    std::vector<Json> found;
    collect(inProcess({"get", path.commandLines}), found);
    const auto property = found.at(0)["properties"].begin();
    const std::string change = property.key() + "=5";
    std::vector<std::vector<std::string>> changes = {
        {"ci", path.clients, change}, {"mi", path.clients, change}, {"di", path.clients}};
    if (textOf(*property).find(":TALVO_") == std::string::npos) { // a reference makes the client crash
        changes.push_back({"sp", path.clients, change});
    }
    for (const std::vector<std::string>& arguments : changes) {
        const Outcome outcome = wbemcli(arguments);
        EXPECT_THAT(outcome.err + outcome.out, HasSubstr("(7) CIM_ERR_NOT_SUPPORTED")) << arguments.front();
        EXPECT_NE(outcome.status, 0) << arguments.front();
    }
}

TEST_F(WbemcliTest, RestrictsAssociationsInTheSameWay) {
    const std::pair<std::vector<std::string>, std::vector<std::string>> restrictions[] = {
        {{"-ac", "CIM_HostedService"}, {"--assoc-class", "CIM_HostedService"}},
        {{"-arc", "CIM_Capabilities"}, {"--result-class", "CIM_Capabilities"}},
        {{"-ar", "ServiceProvided"}, {"--role", "ServiceProvided"}},
        {{"-arr", "Capabilities"}, {"--result-role", "Capabilities"}},
    };
    for (auto [client, command] : restrictions) {
        client.insert(client.begin(), "ain");
        client.push_back(url(_service));
        command.insert(command.begin(), {"associator-names", _service});
        const Objects expected = commandLinesObjects(inProcess(command));
        EXPECT_FALSE(expected.empty()) << client[1];
        EXPECT_EQ(clientsObjects(clientsAnswer(client)), expected) << client[1];
    }
}

TEST_F(WbemcliTest, IsToldWhatDoesNotExist) {
    const std::pair<std::vector<std::string>, const char*> cases[] = {
        {{"ein", url("root/cimv2:Nothing")}, "(5) CIM_ERR_INVALID_CLASS"},
        {{"gc", url("root/cimv2:Nothing")}, "there is no class Nothing"},
        {{"ein", url("root/nowhere:TALVO_ComputerSystem")}, "(3) CIM_ERR_INVALID_NAMESPACE"},
        {{"gi", url("root/cimv2:TALVO_PowerManagementCapabilities.InstanceID=\"nothing\"")}, "(6) CIM_ERR_NOT_FOUND"},
        {{"gp", url(_capabilities), "Nothing"}, "(12) CIM_ERR_NO_SUCH_PROPERTY"},
        {{"cm", url(_service), "Nothing"}, "(17) CIM_ERR_METHOD_NOT_FOUND"},
        {{"dc", url("root/cimv2:TALVO_ComputerSystem")}, "(7) CIM_ERR_NOT_SUPPORTED"},
    };
    for (const auto& [arguments, error] : cases) {
        const Outcome outcome = wbemcli(arguments);
        EXPECT_THAT(outcome.err + outcome.out, HasSubstr(error)) << arguments[0] << ' ' << arguments[1];
        EXPECT_NE(outcome.status, 0) << arguments[0] << ' ' << arguments[1];
    }
}

/** Uses only the client: goes from the host to its power state, and watches a reboot. */
TEST_F(WbemcliTest, Reboots) {
    configure("reboot-time = 3600\n[[instrumentation.simulated.node]]\npath = \"system\"\n");
    serve();
    const auto lineOf = [](std::string text) { return text.substr(0, text.find('\n')); };
    const std::string system = "http://" + lineOf(clientsAnswer({"ein", url("root/cimv2:TALVO_ComputerSystem")}));
    const std::string service =
        "http://" + lineOf(clientsAnswer({"ain", "-ac", "TALVO_AssociatedPowerManagementService", system}));
    EXPECT_THAT(clientsAnswer({"ain", "-arc", "TALVO_PowerManagementCapabilities", service}), HasSubstr("InstanceID"));
    const auto state = [&] { return clientsAnswer({"ri", "-arc", "TALVO_AssociatedPowerManagementService", system}); };
    EXPECT_THAT(state(), HasSubstr("PowerState=2,"));

    const std::string request =
        "RequestPowerStateChange.PowerState=5,ManagedElement=" + system.substr(system.find("root/"));
    const std::string answer = clientsAnswer({"cm", service, request});
    EXPECT_THAT(answer, EndsWith("RequestPowerStateChange: 0\n"));
    EXPECT_THAT(state(), HasSubstr("PowerState=1,"));

    rebootIsOver();
    EXPECT_THAT(state(), HasSubstr("PowerState=2,"));
}

TEST_F(WbemcliTest, IsToldWhyARequestIsRefused) {
    const Outcome outcome =
        wbemcli({"cm", url(_service), "RequestPowerStateChange.PowerState=2,ManagedElement=" + _system});
    EXPECT_THAT(outcome.err + outcome.out, HasSubstr("Requested Power State change Not Supported"));
    EXPECT_NE(outcome.status, 0);
}

/** The commands and the output that the guide shows: the lines of its code blocks. */
std::vector<std::string> guide() {
    std::ifstream file(ORVCIM_CLIENTS_GUIDE);
    std::vector<std::string> lines;
    bool shown = false;
    for (std::string line; std::getline(file, line);) {
        if (line.starts_with("```")) {
            shown = line == "```console";
        } else if (shown) {
            lines.push_back(line);
        }
    }
    return lines;
}

TEST_F(WbemcliTest, DoesWhatTheGuideShows) {
    configure("[[instrumentation.simulated.node]]\npath = \"system\"\n");
    serve();
    std::string expected;
    std::string script = "exec 2>&1\n";
    for (const std::string& line : guide()) {
        expected += line + '\n';
        if (line.starts_with("$ ")) {
            const std::string command =
                std::regex_replace(line.substr(2), std::regex("localhost:5988"), "localhost:" + _port);
            script += "cat <<'TYPED'\n" + line + "\nTYPED\n" + command + '\n';
        }
    }
    ASSERT_NE(expected, "");
    const std::string shown = runProcess({"bash", "-c", script}, {{"LC_ALL", "C"}}).out;
    EXPECT_EQ(std::regex_replace(shown, std::regex("localhost:" + _port), "localhost:5988"), expected);
}

} // namespace
} // namespace OrvcimTest
