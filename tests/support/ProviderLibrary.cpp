#include "ProviderLibrary.h"

#include <dlfcn.h>
#include <stdexcept>

namespace OrvTest {
namespace {

template <typename MI>
MI* make(void* factory, const CMPIBroker& broker, CMPIStatus* status) {
    using Factory = MI* (*)(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
    return reinterpret_cast<Factory>(factory)(&broker, nullptr, status);
}

} // namespace

const std::string ProviderLibrary::file = ORV_PROVIDER_LIBRARY;

ProviderLibrary::ProviderLibrary() : _handle(dlopen(file.c_str(), RTLD_NOW | RTLD_LOCAL)) {
    if (_handle == nullptr) {
        throw std::runtime_error(dlerror());
    }
}

ProviderLibrary::~ProviderLibrary() {
    dlclose(_handle);
}

void* ProviderLibrary::symbol(const std::string& name) const {
    void* address = dlsym(_handle, name.c_str());
    if (address == nullptr) {
        throw std::runtime_error(dlerror());
    }
    return address;
}

CMPIInstanceMI* ProviderLibrary::instanceMI(const std::string& provider, const CMPIBroker& broker, CMPIStatus* status) {
    return make<CMPIInstanceMI>(symbol(provider + "_Create_InstanceMI"), broker, status);
}

CMPIMethodMI* ProviderLibrary::methodMI(const std::string& provider, const CMPIBroker& broker, CMPIStatus* status) {
    return make<CMPIMethodMI>(symbol(provider + "_Create_MethodMI"), broker, status);
}

CMPIAssociationMI* ProviderLibrary::associationMI(const std::string& provider, const CMPIBroker& broker,
                                                  CMPIStatus* status) {
    return make<CMPIAssociationMI>(symbol(provider + "_Create_AssociationMI"), broker, status);
}

} // namespace OrvTest
