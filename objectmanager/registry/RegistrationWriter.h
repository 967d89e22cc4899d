/**
 * Writes provider registrations in the forms that object managers take.
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
 * The instances of PG_ProviderModule, PG_Provider and PG_ProviderCapabilities in MOF: one for the module, one for each
 * provider, and one for each class.
 *
 * @param registrations of one library.
 * @throws std::invalid_argument where there is none, where they are of several libraries, or where a class has a kind
 * of provider that these instances have no number for.
 */
std::string registrationInstances(const std::vector<Registration>& registrations, const ProviderModule& module);

} // namespace ObjectManager

#endif
