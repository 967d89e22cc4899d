/* Reads object paths in URI form. A path that can be read must be written in a form that is read as the same path. */
#include "text/ObjectPathText.h"

#include <cstdint>
#include <cstdlib>
#include <iostream>

using namespace ObjectManager;

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    static const Catalogue catalogue = readCatalogue(FUZZ_SCHEMA);
    const std::string_view text(reinterpret_cast<const char*>(data), size);
    ObjectPath path;
    try {
        path = parseObjectPath(text, catalogue, "root/cimv2");
    } catch (const ObjectPathError&) {
        return 0;
    }
    const std::string written = formatObjectPath(path);
    if (!(parseObjectPath(written, catalogue, "root/other") == path)) {
        std::cerr << "read as something else: " << written << std::endl;
        std::abort();
    }
    return 0;
}
