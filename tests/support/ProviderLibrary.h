/**
 * Loads and uses the built provider library as an object manager does: by its file name and exported factories.
 */
#ifndef SUPPORT_PROVIDERLIBRARY_H
#define SUPPORT_PROVIDERLIBRARY_H

#include "cmpift.h"

#include <string>

namespace OrvTest {

/**
 * Loads the library, and unloads it at the end. The agent's libraries that it needs are the stand-ins, which the test
 * program has loaded under the same SONAMEs.
 */
class ProviderLibrary {
public:
    /** The library's file. */
    static const std::string file;

    /** @throws std::runtime_error with the loader's reason. */
    ProviderLibrary();
    ~ProviderLibrary();
    ProviderLibrary(const ProviderLibrary&) = delete;
    ProviderLibrary& operator=(const ProviderLibrary&) = delete;

    /*
     * These call the factory of a provider, for example instanceMI("PowerManagementServiceProvider", broker), with
     * `broker` and `status`, and return its result. They throw std::runtime_error if the library exports no such
     * factory.
     */
    CMPIInstanceMI* instanceMI(const std::string& provider, const CMPIBroker& broker, CMPIStatus* status = nullptr);
    CMPIMethodMI* methodMI(const std::string& provider, const CMPIBroker& broker, CMPIStatus* status = nullptr);
    CMPIAssociationMI* associationMI(const std::string& provider, const CMPIBroker& broker,
                                     CMPIStatus* status = nullptr);

private:
    void* symbol(const std::string& name) const;

    void* _handle;
};

} // namespace OrvTest

#endif
