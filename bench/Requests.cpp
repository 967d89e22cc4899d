#include "Requests.h"

#include <stdexcept>

namespace Bench {

namespace {

constexpr std::string_view instanceElement = "<INSTANCE ";
constexpr std::string_view instanceNameElement = "<INSTANCENAME ";
constexpr std::string_view errorElement = "<ERROR ";

const std::string nameSpace = "<LOCALNAMESPACEPATH><NAMESPACE NAME=\"root\"/><NAMESPACE NAME=\"cimv2\"/>"
                              "</LOCALNAMESPACEPATH>";

std::string message(const std::string& call) {
    return "<?xml version=\"1.0\" encoding=\"utf-8\"?><CIM CIMVERSION=\"2.0\" "
           "DTDVERSION=\"2.0\">"
           "<MESSAGE ID=\"1\" PROTOCOLVERSION=\"1.0\"><SIMPLEREQ>" +
           call + "</SIMPLEREQ></MESSAGE></CIM>";
}

std::string key(const std::string& name, const std::string& value) {
    return "<KEYBINDING NAME=\"" + name + "\"><KEYVALUE VALUETYPE=\"string\">" + value + "</KEYVALUE></KEYBINDING>";
}

const std::string service =
    "<INSTANCENAME CLASSNAME=\"TALVO_PowerManagementService\">" +
    key("CreationClassName", "TALVO_PowerManagementService") + key("Name", "PowerStateManagement_node0") +
    key("SystemCreationClassName", "TALVO_ComputerSystem") + key("SystemName", "bench.example") + "</INSTANCENAME>";

const std::string system = "<INSTANCENAME CLASSNAME=\"TALVO_ComputerSystem\">" +
                           key("CreationClassName", "TALVO_ComputerSystem") + key("Name", "bench.example") +
                           "</INSTANCENAME>";

Request intrinsic(const std::string& method, const std::string& parameter, const std::string& value,
                  std::string_view objectBegin, std::size_t objectsPerNode, std::size_t objects) {
    return {method,
            method,
            "root/cimv2",
            message("<IMETHODCALL NAME=\"" + method + "\">" + nameSpace + "<IPARAMVALUE NAME=\"" + parameter + "\">" +
                    value + "</IPARAMVALUE></IMETHODCALL>"),
            objectBegin,
            objectsPerNode,
            objects};
}

Request ofClass(const std::string& method, std::string_view objectBegin) {
    return intrinsic(method, "ClassName", "<CLASSNAME NAME=\"TALVO_PowerManagementService\"/>", objectBegin, 1, 0);
}

/** A request for the power state On, which is refused, so that the machine's state never changes. */
Request refusedMethodCall() {
    constexpr const char* method = "RequestPowerStateChange";
    return {"InvokeMethod",
            method,
            "root/cimv2%3ATALVO_PowerManagementService",
            message("<METHODCALL NAME=\"" + std::string(method) + "\"><LOCALINSTANCEPATH>" + nameSpace + service +
                    "</LOCALINSTANCEPATH><PARAMVALUE NAME=\"PowerState\" "
                    "PARAMTYPE=\"uint16\"><VALUE>2</VALUE>"
                    "</PARAMVALUE><PARAMVALUE NAME=\"ManagedElement\" "
                    "PARAMTYPE=\"reference\"><VALUE.REFERENCE>"
                    "<LOCALINSTANCEPATH>" +
                    nameSpace + system + "</LOCALINSTANCEPATH></VALUE.REFERENCE></PARAMVALUE></METHODCALL>"),
            errorElement,
            0,
            1};
}

} // namespace

std::string Request::text(std::string_view headers) const {
    return "POST /cimom HTTP/1.1\r\nHost: localhost\r\nContent-Type: "
           "application/xml; charset=\"utf-8\"\r\n"
           "CIMOperation: MethodCall\r\nCIMMethod: " +
           method + "\r\nCIMObject: " + object + "\r\n" + std::string(headers) +
           "Content-Length: " + std::to_string(body.size()) + "\r\n\r\n" + body;
}

void Request::check(const std::string& replyBody, std::size_t nodes) const {
    std::size_t found = 0;
    for (std::size_t at = 0; (at = replyBody.find(objectBegin, at)) != std::string::npos; ++at) {
        ++found;
    }
    const std::size_t expected = objectsPerNode * nodes + objects;
    if (found != expected) {
        throw std::runtime_error(name + ": found " + std::to_string(found) + " of " + std::string(objectBegin) +
                                 ", expected " + std::to_string(expected) + ": " + replyBody);
    }
}

const std::vector<Request>& requests() {
    // Of the two computer systems that are found, one is found through each
    // association of services with systems.
    static const std::vector<Request> all = {
        intrinsic("GetInstance", "InstanceName", service, instanceElement, 0, 1),
        ofClass("EnumerateInstances", instanceElement),
        ofClass("EnumerateInstanceNames", instanceNameElement),
        intrinsic("Associators", "ObjectName", service, instanceElement, 1, 3),
        intrinsic("References", "ObjectName", service, instanceElement, 1, 3),
        refusedMethodCall(),
    };
    return all;
}

} // namespace Bench
