/**
 * One run of the program: what the person asked for, and the object manager that answers.
 */
#ifndef ORVCIM_SESSION_H
#define ORVCIM_SESSION_H

#include "agentlog/LogTap.h"
#include "classes/Catalogue.h"
#include "dispatch/Dispatcher.h"
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

/** The class whose instances are what the machine's power is managed by. */
inline constexpr const char* powerServiceClass = "TALVO_PowerManagementService";

/** The command line. */
struct Options {
    std::string nameSpace = "root/cimv2";
    Format format = Format::table;
    PropertyList properties;
    /** Searched before the program's own folders. */
    std::vector<std::filesystem::path> providerFolders;
    /** Empty where the program's own is meant. */
    std::filesystem::path schemaFolder;
    /** Do not ask before acting on a machine. */
    bool yes = false;
    /** The path of the service to use; empty where there is one only. */
    std::string service;
    /** How long to wait for what was asked for to be done; not at all where it is not given. */
    std::optional<double> waitSeconds;
    /** Show every change of the power states until the program is ended. */
    bool watch = false;
    /** CLASS or PATH. */
    std::string target;
    std::string method;
    /** NAME=VALUE. */
    std::vector<std::string> arguments;
    /** Which associations to follow, and to what. */
    AssociationFilter filter;
    ServeOptions serve;
};

/** A command line that cannot be done. what() is one line. */
class UsageError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/** A command that failed otherwise than with a CIM error. what() is one line. */
class Failure : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/** The object manager with the schema and the providers that the options name. */
class Session {
public:
    /**
     * @param options,out live longer.
     * @throws SchemaError
     */
    Session(const Options& options, std::ostream& out);

    const Options& options() const { return _options; }
    const std::filesystem::path& schemaFolder() const { return _schemaFolder; }
    const Catalogue& catalogue() const { return _catalogue; }
    Dispatcher& dispatcher() { return _dispatcher; }
    LogTap& log() { return _log; }
    Writer& writer() { return *_writer; }
    std::ostream& out() { return _out; }

    /**
     * The class that a text names, as a path without keys.
     *
     * @throws UsageError, ObjectPathError
     */
    ObjectPath classPath(std::string_view text) const;

    /**
     * The instance that a text names.
     *
     * @throws ObjectPathError, and CimError where a key of the class is missing.
     */
    ObjectPath instancePath(std::string_view text) const;

    /**
     * The properties that were asked for, spelled as the class declares them.
     *
     * @throws CimError where the class has no such property.
     */
    PropertyList propertiesOf(const ObjectPath& path) const;

    /**
     * Loads the provider that knows the agent.
     *
     * @return why it cannot be used, in one line; empty where it can.
     */
    std::string loadAgent();
    /** Whether the agent says that the machine is a simulated one. Loads it. */
    bool isSimulated();

    /** Who asks for the operations: the user of the program. */
    static Invocation invocation();

private:
    const Options& _options;
    std::filesystem::path _schemaFolder;
    Catalogue _catalogue;
    LogTap _log;
    PowerRequestRule _powerRequests;
    Dispatcher _dispatcher;
    std::ostream& _out;
    std::unique_ptr<Writer> _writer;
};

} // namespace ObjectManager::Orvcim

#endif
