/**
 * The providers with which the object manager describes itself to clients that know only its address: what it is, which
 * namespaces it has, and how to reach it (the classes CIM_ObjectManager, CIM_Namespace and
 * CIM_ObjectManagerCommunicationMechanism of DMTF's CIM schema).
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
    /** The URL, with scheme, host and port. */
    std::string url;
    /** Whether clients have to log in. */
    bool authenticated = false;
};

/** What the object manager tells about itself. */
struct Facts {
    /** The program's version, for example "1.0.0". */
    std::string version;
    std::vector<std::string> nameSpaces;
    /** No value while the object manager does not serve clients on the network. */
    std::optional<Communication> communication{};
};

/** The providers that are registered with the location "orvcim". */
class OwnProviders final : public BuiltInProviders {
public:
    explicit OwnProviders(Facts facts);
    ~OwnProviders() override;

    /** Tells that the object manager serves clients on the network, and how to reach it. */
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
