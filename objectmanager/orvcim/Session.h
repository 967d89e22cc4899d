/**
 * One run of the program: its options, and the object manager that answers.
 */
#ifndef ORVCIM_SESSION_H
#define ORVCIM_SESSION_H

#include "agentlog/LogTap.h"
#include "classes/Catalogue.h"
#include "dispatch/Dispatcher.h"
#include "interop/OwnProviders.h"
#include "orvcim/ServeOptions.h"
#include "power/PowerRequests.h"
#include "text/Writer.h"

#include <filesystem>
#include <memory>
#include <optional>
#include <ostream>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager::Orvcim {

/** The class whose instances manage the machine's power. */
inline constexpr const char* powerServiceClass = "TALVO_PowerManagementService";

/** The options and arguments of the command line. */
struct Options {
    std::string nameSpace = "root/cimv2";
    Format format = Format::table;
    PropertyList properties;
    /** Folders that are searched for provider libraries before the program's own ones. */
    std::vector<std::filesystem::path> providerFolders;
    /** The folder of class declarations and registrations; empty for the program's own. */
    std::filesystem::path schemaFolder;
    /** Whether to change the power state of any machine without asking for confirmation. */
    bool yes = false;
    /** The path of the service to use; empty to use the only one. */
    std::string service;
    /** How long to wait until the request is done; no value to return without waiting. */
    std::optional<double> waitSeconds;
    /** Whether to show every change of the power states until the program is interrupted. */
    bool watch = false;
    /** The argument CLASS or PATH. */
    std::string target;
    std::string method;
    /** The arguments NAME=VALUE. */
    std::vector<std::string> arguments;
    /** Which associations to follow, and to which objects. */
    AssociationFilter filter;
    ServeOptions serve;
};

/** A wrong command line. what() is one line. */
class UsageError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/** A failure of a command that is not a CIM error. what() is one line. */
class Failure : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/** The object manager with the schema and the providers that the options name. */
class Session {
public:
    /**
     * @param options,out must outlive the session.
     * @throws SchemaError
     */
    Session(const Options& options, std::ostream& out);

    const Options& options() const { return _options; }
    const std::filesystem::path& schemaFolder() const { return _schemaFolder; }
    const Catalogue& catalogue() const { return _catalogue; }
    Dispatcher& dispatcher() { return _dispatcher; }
    LogTap& log() { return _log; }
    Interop::OwnProviders& ownProviders() { return _ownProviders; }
    Writer& writer() { return *_writer; }
    std::ostream& out() { return _out; }

    /**
     * Parses the name of a class. @return a path without keys.
     *
     * @throws UsageError, ObjectPathError
     */
    ObjectPath classPath(std::string_view text) const;

    /**
     * Parses the path of an instance.
     *
     * @throws ObjectPathError if the text is not an object path, CimError if a key of the class is missing.
     */
    ObjectPath instancePath(std::string_view text) const;

    /**
     * The properties that the command line asks for, spelled as the class declares them.
     *
     * @throws CimError if the class has no such property.
     */
    PropertyList propertiesOf(const ObjectPath& path) const;

    /**
     * Loads a provider of power management, which loads the agent's libraries.
     *
     * @return why the provider cannot be used, in one line; empty if it can.
     */
    std::string loadAgent();
    /** Whether the agent says that the machine is a simulated one. Loads the agent first. */
    bool isSimulated();

    /** The caller on whose behalf all operations run: the user of the program. */
    static Invocation invocation();

private:
    const Options& _options;
    std::filesystem::path _schemaFolder;
    Catalogue _catalogue;
    LogTap _log;
    PowerRequestRule _powerRequests;
    Registry _registry;
    Interop::OwnProviders _ownProviders;
    Dispatcher _dispatcher;
    std::ostream& _out;
    std::unique_ptr<Writer> _writer;
};

} // namespace ObjectManager::Orvcim

#endif
