/**
 * The kinds of providers in registrations.
 */
#ifndef REGISTRY_PROVIDERTYPES_H
#define REGISTRY_PROVIDERTYPES_H

#include "registry/Registry.h"

#include <array>
#include <optional>
#include <string_view>

namespace ObjectManager {

struct ProviderType {
    /** The name in .reg files. */
    std::string_view name;
    bool Registration::*flag;
    /** The number in PG_ProviderCapabilities.ProviderType; no value if that property has no number for it. */
    std::optional<int> capability;
};

inline constexpr std::array<ProviderType, 5> providerTypes{{{"instance", &Registration::instance, 2},
                                                            {"association", &Registration::association, 3},
                                                            {"indication", &Registration::indication, 4},
                                                            {"method", &Registration::method, 5},
                                                            {"property", &Registration::property, std::nullopt}}};

} // namespace ObjectManager

#endif
