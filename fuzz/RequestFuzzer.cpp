/*
 * Reads requests in the form of the wire cases, which are its corpus. Every request must get a reply, which is a
 * well-formed document or a refusal. No provider is called.
 */
#include "WireCase.h"
#include "cimxml/Markup.h"
#include "registry/RegistrationReader.h"

#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <iostream>

using namespace ObjectManager;

namespace {

/** The shipped registrations, without any kind of provider. */
Registry registryWithoutProviders() {
    std::vector<Registration> registrations = readRegistrations(std::filesystem::path(FUZZ_SCHEMA));
    for (Registration& registration : registrations) {
        registration.instance = false;
        registration.method = false;
        registration.association = false;
    }
    return Registry(registrations);
}

[[noreturn]] void fail(const CimXml::HttpReply& reply) {
    std::cerr << "unexpected reply: " << CimXml::textOf(reply) << std::endl;
    std::abort();
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    static const Catalogue catalogue = readCatalogue(FUZZ_SCHEMA);
    static Dispatcher dispatcher(registryWithoutProviders(), {{}, &catalogue, nullptr});
    static CimXml::Service service(dispatcher, catalogue);

    for (const CimXml::WireCase& given : CimXml::readWireCases({reinterpret_cast<const char*>(data), size})) {
        const CimXml::HttpReply reply = service.answer(given.request(), given.caller);
        if (reply.status == 200) {
            CimXml::parseMarkup(reply.body);
        } else if (reply.status == 500) {
            fail(reply);
        }
    }
    return 0;
}
