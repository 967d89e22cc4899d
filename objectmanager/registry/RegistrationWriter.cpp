#include "registry/RegistrationWriter.h"

#include "registry/ProviderTypes.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <iterator>
#include <stdexcept>
#include <string_view>

namespace ObjectManager {

namespace {

std::vector<std::string_view> typeNames(const Registration& registration) {
    std::vector<std::string_view> names;
    for (const ProviderType& type : providerTypes) {
        if (registration.*(type.flag)) {
            names.push_back(type.name);
        }
    }
    return names;
}

std::vector<int> capabilities(const Registration& registration) {
    std::vector<int> numbers;
    for (const ProviderType& type : providerTypes) {
        if (registration.*(type.flag)) {
            if (!type.capability) {
                throw std::invalid_argument(fmt::format("{}: found type '{}', expected one that "
                                                        "PG_ProviderCapabilities has a number for",
                                                        registration.className, type.name));
            }
            numbers.push_back(*type.capability);
        }
    }
    return numbers;
}

/** The location that all registrations have in common. */
const std::string& locationOf(const std::vector<Registration>& registrations) {
    if (registrations.empty()) {
        throw std::invalid_argument("found no registration, expected the registrations of a library");
    }
    const std::string& location = registrations.front().location;
    for (const Registration& registration : registrations) {
        if (registration.location != location) {
            throw std::invalid_argument(fmt::format("{}: found location '{}', expected '{}'", registration.className,
                                                    registration.location, location));
        }
    }
    return location;
}

} // namespace

std::string registrationSections(const std::vector<Registration>& registrations) {
    std::string text;
    for (const Registration& registration : registrations) {
        fmt::format_to(std::back_inserter(text),
                       "[{}]\n"
                       "   provider: {}\n"
                       "   location: {}\n"
                       "   type: {}\n"
                       "   namespace: {}\n",
                       registration.className, registration.provider, registration.location,
                       fmt::join(typeNames(registration), " "), fmt::join(registration.nameSpaces, " "));
        if (!registration.methods.empty()) {
            fmt::format_to(std::back_inserter(text), "   methods: {}\n", fmt::join(registration.methods, " "));
        }
    }
    return text;
}

std::string registrationInstances(const std::vector<Registration>& registrations, const ProviderModule& module) {
    std::string text = fmt::format("instance of PG_ProviderModule {{\n"
                                   "    Name = \"{}\";\n"
                                   "    Vendor = \"{}\";\n"
                                   "    Version = \"{}\";\n"
                                   "    InterfaceType = \"CMPI\";\n"
                                   "    InterfaceVersion = \"2.0.0\";\n"
                                   "    Location = \"{}\";\n"
                                   "}};\n",
                                   module.name, module.vendor, module.version, locationOf(registrations));
    std::vector<std::string> providers;
    for (const Registration& registration : registrations) {
        if (std::find(providers.begin(), providers.end(), registration.provider) != providers.end()) {
            continue;
        }
        providers.push_back(registration.provider);
        fmt::format_to(std::back_inserter(text),
                       "\n"
                       "instance of PG_Provider {{\n"
                       "    ProviderModuleName = \"{}\";\n"
                       "    Name = \"{}\";\n"
                       "}};\n",
                       module.name, registration.provider);
    }
    for (const Registration& registration : registrations) {
        fmt::format_to(std::back_inserter(text),
                       "\n"
                       "instance of PG_ProviderCapabilities {{\n"
                       "    ProviderModuleName = \"{}\";\n"
                       "    ProviderName = \"{}\";\n"
                       "    CapabilityID = \"{}\";\n"
                       "    ClassName = \"{}\";\n"
                       "    Namespaces = {{\"{}\"}};\n"
                       "    ProviderType = {{{}}};\n"
                       "    SupportedProperties = NULL;\n"
                       "    SupportedMethods = {};\n"
                       "}};\n",
                       module.name, registration.provider, registration.className, registration.className,
                       fmt::join(registration.nameSpaces, "\", \""), fmt::join(capabilities(registration), ", "),
                       registration.methods.empty()
                           ? "NULL"
                           : fmt::format("{{\"{}\"}}", fmt::join(registration.methods, "\", \"")));
    }
    return text;
}

} // namespace ObjectManager
