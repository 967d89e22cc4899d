/**
 * What the object manager tells of itself to clients that know nothing yet but its address: who it is, which namespaces
 * there are, and how it can be reached (DMTF DSP1071's forerunner, with the classes CIM_ObjectManager, CIM_Namespace
 * and CIM_ObjectManagerCommunicationMechanism).
 */
#ifndef INTEROP_OWNPROVIDERS_H
#define INTEROP_OWNPROVIDERS_H

#include "dispatch/Providers.h"

#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace Norv::Provider {
class ServedClass;
}

namespace ObjectManager::Interop {

/** How clients on the network reach the object manager. */
struct Communication {
    /** Scheme, host and port. */
    std::string url;
    /** Whether clients have to log in. */
    bool authenticated = false;
};

struct Facts {
    /** Of the program, for example "1.0.0". */
    std::string version;
    std::vector<std::string> nameSpaces;
    /** Nothing as long as it does not answer clients on the network. */
    std::optional<Communication> communication{};
};

/** The providers with the location "orvcim". */
class OwnProviders final : public BuiltInProviders {
public:
    explicit OwnProviders(Facts facts);
    ~OwnProviders() override;

    /** Clients on the network are answered from now on. */
    void answerOn(const Communication& communication);

    std::string_view location() const override { return "orvcim"; }
    CMPIInstanceMI* instanceProvider(std::string_view provider, const CMPIBroker* broker) override;
    CMPIAssociationMI* associationProvider(std::string_view provider, const CMPIBroker* broker) override;

private:
    Norv::Provider::ServedClass* find(std::string_view provider) const;
    Facts facts() const;

    mutable std::mutex _mutex;
    Facts _facts;
    std::map<std::string, std::unique_ptr<Norv::Provider::ServedClass>, std::less<>> _providers;
};

} // namespace ObjectManager::Interop

#endif
