/**
 * Writes provider registrations in the formats that object managers read.
 */
#ifndef REGISTRY_REGISTRATIONWRITER_H
#define REGISTRY_REGISTRATIONWRITER_H

#include "registry/Registry.h"

#include <string>
#include <vector>

namespace ObjectManager {

/** The sections of a .reg file, as `readRegistrations` reads them. */
std::string registrationSections(const std::vector<Registration>& registrations);

/** A provider library, as PG_ProviderModule describes it. */
struct ProviderModule {
    std::string name;
    std::string vendor;
    std::string version;
};

/**
 * The registrations in MOF: an instance of PG_ProviderModule, one of PG_Provider for each provider, and one of
 * PG_ProviderCapabilities for each class.
 *
 * @param registrations of one library.
 * @throws std::invalid_argument if there are no registrations, if they name several libraries, or if a class has a kind
 * of provider that PG_ProviderCapabilities has no number for.
 */
std::string registrationInstances(const std::vector<Registration>& registrations, const ProviderModule& module);

} // namespace ObjectManager

#endif
