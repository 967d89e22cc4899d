#include "ServiceFixture.h"

#include "interop/OwnProviders.h"
#include "power/PowerRequests.h"
#include "registry/RegistrationReader.h"

#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <system_error>

namespace ObjectManager::CimXml {

namespace {

/** The agent's configuration and the simulated machine's state. */
class AgentFolder {
public:
    AgentFolder() {
        std::string name = (std::filesystem::temp_directory_path() / "orv-cimxml-XXXXXX").string();
        if (mkdtemp(name.data()) == nullptr) {
            throw std::system_error(errno, std::generic_category(), name);
        }
        _folder = name;
        const std::string configuration = name + "/agent.toml";
        // A reboot is over at once, so that the next case finds the machine on again.
        std::ofstream(configuration) << "[system]\nname = \"machine.example\"\n"
                                     << "[log]\ndestination = \"file\"\nfile = \"" << name << "/log\"\n"
                                     << "[instrumentation.simulated]\nstate-file = \"" << stateFile().string() << "\"\n"
                                     << "reboot-time = 0\n"
                                     << "[[instrumentation.simulated.node]]\npath = \"chassis/blade1\"\n";
        setenv("ORV_AGENT_CONFIG", configuration.c_str(), 1);
        setenv("LC_ALL", "C", 1);
    }
    AgentFolder(const AgentFolder&) = delete;
    AgentFolder& operator=(const AgentFolder&) = delete;
    ~AgentFolder() {
        std::error_code ignored;
        std::filesystem::remove_all(_folder, ignored);
    }

    std::filesystem::path stateFile() const { return _folder / "state.json"; }

private:
    std::filesystem::path _folder;
};

/** The objects that a service needs, in the order in which they are made. */
struct World {
    AgentFolder agent;
    Catalogue catalogue = readCatalogue(TEST_SCHEMA);
    LogTap log;
    PowerRequestRule powerRequests{catalogue, log};
    Registry registry{readRegistrations(std::filesystem::path(TEST_SCHEMA))};
    Interop::OwnProviders ownProviders{
        {"1.0.0", registry.nameSpaces(), Interop::Communication{"https://server.example:5989", true}}};
    Dispatcher dispatcher{registry,
                          {{TEST_LIBRARIES, TEST_PROVIDERS}, &catalogue, &log, {&powerRequests}, &ownProviders}};
    Service service{dispatcher, catalogue};

    World() {
        dispatcher.broker().setMessageSink([](const BrokerMessage&) {});
    }
};

World& world() {
    static World only;
    return only;
}

} // namespace

Service& ServiceFixture::service() {
    return world().service;
}

Service ServiceFixture::serviceWith(const ServiceSettings& settings) {
    return {world().dispatcher, world().catalogue, settings};
}

std::filesystem::path ServiceFixture::stateFile() {
    return world().agent.stateFile();
}

HttpReply ServiceFixture::answer(const std::string& httpMethod,
                                 std::vector<std::pair<std::string, std::string>> headers, const std::string& body,
                                 const Caller& caller) {
    return service().answer({httpMethod, std::move(headers), body}, caller);
}

std::vector<std::pair<std::string, std::string>> requestHeaders(const std::string& method,
                                                                const std::string& nameSpace) {
    return {{"Host", "server.example:5988"},
            {"Content-Type", "application/xml; charset=\"utf-8\""},
            {"CIMOperation", "MethodCall"},
            {"CIMMethod", method},
            {"CIMObject", nameSpace}};
}

std::string requestBody(const std::string& method, const std::string& parameters, const std::string& nameSpace) {
    std::string path;
    for (std::size_t start = 0; start <= nameSpace.size();) {
        const std::size_t end = std::min(nameSpace.find('/', start), nameSpace.size());
        path += "<NAMESPACE NAME=\"" + nameSpace.substr(start, end - start) + "\"/>";
        start = end + 1;
    }
    return "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\">"
           "<MESSAGE ID=\"1\" PROTOCOLVERSION=\"1.0\"><SIMPLEREQ><IMETHODCALL NAME=\"" +
           method + "\"><LOCALNAMESPACEPATH>" + path + "</LOCALNAMESPACEPATH>" + parameters +
           "</IMETHODCALL></SIMPLEREQ></MESSAGE></CIM>";
}

std::string headerOf(const HttpReply& reply, const std::string& name) {
    for (const auto& [header, value] : reply.headers) {
        if (equalNames(header, name)) {
            return value;
        }
    }
    return {};
}

} // namespace ObjectManager::CimXml
