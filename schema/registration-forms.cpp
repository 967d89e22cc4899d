/**
 * Makes the registration files of one provider library from the table of all providers:
 *
 *   registration-forms TABLE LOCATION NAME VERSION FOLDER
 *
 * It writes FOLDER/NAME.reg for the embedded object manager, FOLDER/sfcb/NAME.reg for sfcb, which reads the same format
 * but refuses unknown keys, and FOLDER/pg/NAME.mof for object managers that take instances of PG_ProviderModule,
 * PG_Provider and PG_ProviderCapabilities.
 */
#include "classes/SchemaFiles.h"
#include "registry/RegistrationReader.h"
#include "registry/RegistrationWriter.h"

#include <cstdlib>
#include <exception>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <stdexcept>
#include <string>
#include <vector>

namespace {

void write(const std::filesystem::path& file, const std::string& text) {
    std::filesystem::create_directories(file.parent_path());
    std::ofstream stream(file);
    stream << text;
    stream.close();
    if (!stream) {
        throw std::runtime_error(file.string() + " cannot be written");
    }
}

void makeForms(const std::string& table, const std::string& location, const std::string& name,
               const std::string& version, const std::filesystem::path& folder) {
    auto registrations = ObjectManager::readRegistrations(ObjectManager::readFile(table), table);
    std::erase_if(registrations, [&](const auto& registration) { return registration.location != location; });
    write(folder / (name + ".reg"), ObjectManager::registrationSections(registrations));
    write(
        folder / "pg" / (name + ".mof"),
        ObjectManager::registrationInstances(registrations, {name, "The orv-power-state-management project", version}));
    for (auto& registration : registrations) {
        registration.methods.clear();
    }
    write(folder / "sfcb" / (name + ".reg"), ObjectManager::registrationSections(registrations));
}

} // namespace

int main(int argc, char* argv[]) {
    const std::vector<std::string> arguments(argv + 1, argv + argc);
    if (arguments.size() != 5) {
        std::cerr << "usage: registration-forms TABLE LOCATION NAME VERSION FOLDER\n";
        return EXIT_FAILURE;
    }
    try {
        makeForms(arguments[0], arguments[1], arguments[2], arguments[3], arguments[4]);
    } catch (const std::exception& error) {
        std::cerr << "registration-forms: " << error.what() << '\n';
        return EXIT_FAILURE;
    }
    return EXIT_SUCCESS;
}
