#include "orvcim/Session.h"

#include "registry/RegistrationReader.h"
#include "text/ObjectPathText.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <pwd.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <utility>

namespace ObjectManager::Orvcim {

namespace {

/* The folders of an installed program's parts, relative to the program's folder. In a build tree the parts are in the
   same places, or in lib beside the program's folder. */
constexpr const char* schemaFolderFromProgram = ORVCIM_SCHEMA_FOLDER;
constexpr std::array<const char*, 2> libraryFoldersFromProgram = {"../lib", ORVCIM_LIBRARY_FOLDER};

std::filesystem::path programFolder() {
    return std::filesystem::read_symlink("/proc/self/exe").parent_path();
}

std::filesystem::path schemaFolderOf(const Options& options) {
    return options.schemaFolder.empty() ? (programFolder() / schemaFolderFromProgram).lexically_normal()
                                        : options.schemaFolder;
}

std::vector<std::filesystem::path> libraryFoldersOf(const Options& options) {
    std::vector<std::filesystem::path> folders = options.providerFolders;
    for (const char* folder : libraryFoldersFromProgram) {
        const auto path = (programFolder() / folder).lexically_normal();
        if (std::find(folders.begin(), folders.end(), path) == folders.end()) {
            folders.push_back(path);
        }
    }
    return folders;
}

} // namespace

Session::Session(const Options& options, std::ostream& out)
    : _options(options), _schemaFolder(schemaFolderOf(options)), _catalogue(readCatalogue(_schemaFolder)),
      _powerRequests(_catalogue, _log), _registry(readRegistrations(_schemaFolder)),
      _ownProviders({ORVCIM_VERSION, _registry.nameSpaces()}),
      _dispatcher(_registry, {libraryFoldersOf(options), &_catalogue, &_log, {&_powerRequests}, &_ownProviders}),
      _out(out), _writer(makeWriter(options.format, out, _catalogue)) {}

ObjectPath Session::classPath(std::string_view text) const {
    ObjectPath path = parseObjectPath(text, _catalogue, _options.nameSpace);
    if (!path.keys.empty()) {
        throw UsageError(fmt::format("found the keys of an instance in {}, expected the name of a class", text));
    }
    return path;
}

ObjectPath Session::instancePath(std::string_view text) const {
    ObjectPath path = parseObjectPath(text, _catalogue, _options.nameSpace);
    std::vector<std::string> missing;
    for (const std::string& key : _catalogue.keyNames(path.className)) {
        if (find(path.keys, key) == nullptr) {
            missing.push_back(key);
        }
    }
    if (!missing.empty()) {
        throw CimError(CMPI_RC_ERR_INVALID_PARAMETER,
                       fmt::format("found no {}, expected every key of {}", fmt::join(missing, ", "), path.className));
    }
    return path;
}

PropertyList Session::propertiesOf(const ObjectPath& path) const {
    PropertyList properties = _options.properties;
    const Class* known = _catalogue.find(path.className);
    if (properties && known != nullptr) {
        for (std::string& name : *properties) {
            const Property* property = known->property(name);
            if (property == nullptr) {
                throw CimError(CMPI_RC_ERR_NO_SUCH_PROPERTY, fmt::format("{} has no property {}", known->name, name));
            }
            name = property->name;
        }
    }
    return properties;
}

std::string Session::loadAgent() {
    try {
        _dispatcher.enumerateInstanceNames(invocation(), {{}, _options.nameSpace, powerServiceClass, {}});
    } catch (const CimError& error) {
        return error.what();
    }
    return "";
}

bool Session::isSimulated() {
    if (!_log.isSimulated()) {
        loadAgent();
    }
    return _log.isSimulated();
}

Invocation Session::invocation() {
    Invocation invocation;
    if (const passwd* user = getpwuid(geteuid())) {
        invocation.principal = user->pw_name;
    }
    return invocation;
}

} // namespace ObjectManager::Orvcim
