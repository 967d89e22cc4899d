#include "orvcim/CommandLine.h"

#include "orvcim/AgentExamination.h"
#include "orvcim/Commands.h"
#include "orvcim/ServeOptions.h"
#include "text/ObjectPathText.h"
#include "text/StatusText.h"

#include <CLI/CLI.hpp>
#include <fmt/format.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <iostream>
#include <map>

namespace ObjectManager::Orvcim {

namespace {

constexpr int failed = 1;
constexpr int badUsage = 2;

using Command = void (*)(Session&);

const std::map<std::string, Format> formats = {{"table", Format::table}, {"json", Format::json}, {"mof", Format::mof}};

/** Declares the commands and options, and parses the command line into them. */
class CommandLine {
public:
    CommandLine() : _app("The object manager of power management, on the command line.", "orvcim") {
        _app.fallthrough();
        _app.set_version_flag("--version", "orvcim " ORVCIM_VERSION);
        generalOptions();
        objectCommands();
        associationCommands();
        powerCommands();
        addServeOptions(add(_app, "serve", "Answer WBEM clients on the network", serve), _options.serve);
        add(_app, "check", "Report which providers load, what the agent can do, and what is wrong or missing",
            checkProviders);
    }

    CLI::App& app() { return _app; }
    const Options& options() const { return _options; }

    /** The command to run. @throws UsageError if the command line names none. */
    Command command() const {
        if (_command == nullptr) {
            throw UsageError(fmt::format("found no command, expected one of {}", fmt::join(_names, ", ")));
        }
        return _command;
    }

    /** Whether the command can do nothing without the agent. */
    bool asksTheAgent() const { return _name != "classes" && _name != "check" && _name != "serve"; }

    /** The beginning of the message for an agent that cannot be used; the reason follows it. */
    std::string whatIsMissing() const { return _name == "power status" ? "the power state is unknown: " : ""; }

    /** What is wrong with a command line that names an unknown command; empty if the command is known. */
    std::string wrongCommand() const {
        const std::vector<std::string> words = _app.remaining(true);
        const std::vector<CLI::App*> given = _app.get_subcommands();
        if (words.empty() || (!given.empty() && (!given.front()->get_subcommands().empty() ||
                                                 given.front()->get_subcommands({}).empty()))) {
            return "";
        }
        const std::string group = given.empty() ? "" : given.front()->get_name() + " ";
        std::vector<std::string> expected;
        std::ranges::copy_if(_names, std::back_inserter(expected),
                             [&](const std::string& name) { return name.starts_with(group); });
        return fmt::format("found no command {}{}, expected one of {}", group, words.front(),
                           fmt::join(expected, ", "));
    }

    /** The class, path or method that the command is about, as error messages name it. */
    std::string subject() const {
        return !_options.method.empty() ? _options.method : !_options.target.empty() ? _options.target : _name;
    }

private:
    static constexpr const char* footer = "The options that 'orvcim --help' shows may be given here too.";

    void generalOptions() {
        _app.add_option("--namespace", _options.nameSpace, "Namespace of the classes")->capture_default_str();
        _app.add_option_function<std::string>(
                "--format", [this](const std::string& format) { _options.format = formats.at(format); },
                "table (the default), json or mof")
            ->check(CLI::IsMember(&formats).description(""))
            ->type_name("FORMAT");
        _app.add_option("--provider-path", _options.providerFolders,
                        "Search this folder for provider libraries first (repeatable)")
            ->type_name("DIR")
            ->allow_extra_args(false);
        _app.add_option("--schema", _options.schemaFolder, "Folder with the class declarations and registrations")
            ->type_name("DIR");
    }

    void objectCommands() {
        add(_app, "classes", "List the classes that providers serve", listClasses);
        addTarget(add(_app, "names", "List the paths of a class's instances", enumerateNames), "CLASS");
        CLI::App& instances = add(_app, "instances", "Show a class's instances", enumerateInstances);
        addTarget(instances, "CLASS");
        addProperties(instances);
        CLI::App& get = add(_app, "get", "Show one instance", getInstance);
        addTarget(get, "PATH");
        addProperties(get);
        CLI::App& invoke = add(_app, "invoke", "Call a method", invokeMethod);
        addTarget(invoke, "PATH");
        invoke.add_option("METHOD", _options.method, "Name of the method")->required()->type_name("");
        invoke.add_option("NAME=VALUE", _options.arguments, "Arguments; for an array, one NAME=VALUE for each element")
            ->type_name("");
    }

    void associationCommands() {
        CLI::App& associators =
            add(_app, "associators", "Show the instances that are associated with an instance", listAssociators);
        addAssociators(associators);
        addProperties(associators);
        addAssociators(add(_app, "associator-names",
                           "List the paths of the instances that are associated with an instance",
                           listAssociatorNames));
        CLI::App& references =
            add(_app, "references", "Show the associations that refer to an instance", listReferences);
        addReferences(references);
        addProperties(references);
        addReferences(add(_app, "reference-names", "List the paths of the associations that refer to an instance",
                          listReferenceNames));
        add(_app, "graph", "Write all instances with their associations as a graph in DOT", writeGraph);
        add(_app, "profiles", "List the profiles, and what they lead to", listProfiles);
    }

    void powerCommands() {
        CLI::App& power = *_app.add_subcommand("power", "See and change the machine's power state");
        power.fallthrough();
        power.footer(footer);
        add(power, "status", "Show the power states", powerStatus)
            .add_flag("--watch", _options.watch, "Show every change until the program is interrupted");
        addPowerRequest(add(power, "reboot", "Reboot the machine", powerReboot));
        addPowerRequest(add(power, "shutdown", "Shut the machine down", powerShutdown));
        add(power, "cancel", "Cancel the reboot or shutdown that is under way", powerCancel);
    }

    CLI::App& add(CLI::App& parent, const std::string& name, const std::string& description, Command toDo) {
        CLI::App& subcommand = *parent.add_subcommand(name, description);
        subcommand.fallthrough();
        subcommand.footer(footer);
        const std::string words = &parent == &_app ? name : parent.get_name() + " " + name;
        _names.push_back(words);
        subcommand.callback([this, words, toDo] {
            _name = words;
            _command = toDo;
        });
        return subcommand;
    }

    void addTarget(CLI::App& subcommand, const std::string& name) {
        subcommand
            .add_option(name, _options.target, name == "PATH" ? "Object path of the instance" : "Name of the class")
            ->required()
            ->type_name("");
    }

    void addAssociators(CLI::App& subcommand) {
        addTarget(subcommand, "PATH");
        addAssociation(subcommand, "--assoc-class");
        addRestriction(subcommand, "--result-class", _options.filter.resultClass,
                       "Only associated objects of this class or its descendants", "CLASS");
        addRestriction(subcommand, "--result-role", _options.filter.resultRole,
                       "Only objects that this reference of the association refers to", "NAME");
    }

    void addReferences(CLI::App& subcommand) {
        addTarget(subcommand, "PATH");
        // Here the result consists of the associations, so both options mean the same.
        addAssociation(subcommand, "--assoc-class,--result-class");
    }

    void addAssociation(CLI::App& subcommand, const std::string& option) {
        addRestriction(subcommand, option, _options.filter.associationClass,
                       "Only associations of this class or its descendants", "CLASS");
        addRestriction(subcommand, "--role", _options.filter.role,
                       "Only associations whose reference of this name refers to the instance", "NAME");
    }

    static void addRestriction(CLI::App& subcommand, const std::string& option, std::string& value,
                               const std::string& description, const std::string& type) {
        subcommand.add_option(option, value, description)->type_name(type);
    }

    void addProperties(CLI::App& subcommand) {
        subcommand
            .add_option_function<std::vector<std::string>>(
                "--properties", [this](const std::vector<std::string>& names) { _options.properties = names; },
                "The properties to show, separated by commas")
            ->delimiter(',')
            ->type_name("NAME,NAME...");
    }

    void addPowerRequest(CLI::App& subcommand) {
        subcommand.add_option("--service", _options.service, "Path of the service, if there are several")
            ->type_name("PATH");
        subcommand
            .add_option_function<std::string>(
                "--wait",
                [this](const std::string& seconds) {
                    _options.waitSeconds = seconds.empty() ? usualWait : std::stod(seconds);
                },
                "Wait until the request is done, for at most SECONDS (default: 300)")
            ->expected(0, 1)
            ->check(CLI::Range(0.0, longestWait).description(""))
            ->type_name("[SECONDS]");
        subcommand.add_flag("--yes", _options.yes, "Do not ask for confirmation, even if the machine is not simulated");
    }

    /* In seconds. */
    static constexpr double usualWait = 300;
    static constexpr double longestWait = 86400;

    CLI::App _app;
    Options _options;
    /** The names of all commands. */
    std::vector<std::string> _names;
    /** The name of the command to run. */
    std::string _name;
    Command _command = nullptr;
};

int report(int status, const std::string& message) {
    std::cerr << "orvcim: " << message << '\n';
    return status;
}

std::string refusalText(const CimError& error) {
    return error.what() + reasonsText(error.reasons, ": ");
}

std::string failureText(const std::string& subject, const CimError& error) {
    // For CMPI_RC_ERR_NOT_FOUND the message says everything; what providers logged would only repeat it.
    const std::string reasons =
        error.code == CMPI_RC_ERR_NOT_FOUND ? "" : reasonsText(error.reasons, "; the provider logged: ");
    return fmt::format("{}: {}: {}{}", subject, statusText(error.code), error.what(), reasons);
}

} // namespace

int run(int argc, const char* const* argv) {
    CommandLine commandLine;
    try {
        commandLine.app().parse(argc, argv);
    } catch (const CLI::Success& success) {
        return commandLine.app().exit(success);
    } catch (const CLI::ParseError& error) {
        if (const std::string wrong = commandLine.wrongCommand(); !wrong.empty()) {
            return report(badUsage, wrong);
        }
        return report(badUsage, fmt::format("{} ('orvcim --help' lists the commands)", error.what()));
    }
    try {
        const Command command = commandLine.command();
        // Without a configuration every provider fails; this one message replaces all of theirs.
        if (const std::string problem = commandLine.asksTheAgent() ? problemOfConfiguration() : ""; !problem.empty()) {
            return report(failed, commandLine.whatIsMissing() + problem + " ('orvcim check' says more)");
        }
        Session session(commandLine.options(), std::cout);
        command(session);
        // Some failures are reported in the agent's log only: the provider's answer is just empty.
        if (const std::string logged = reasonsText(session.log().failuresSince(0), "the provider logged: ");
            !logged.empty()) {
            report(0, logged);
        }
    } catch (const CimError& error) {
        return report(failed, error.refused ? refusalText(error) : failureText(commandLine.subject(), error));
    } catch (const UsageError& error) {
        return report(badUsage, error.what());
    } catch (const ObjectPathError& error) {
        return report(badUsage, error.what());
    } catch (const std::exception& error) {
        return report(failed, error.what());
    }
    if (!std::cout.flush()) {
        return report(failed, "standard output cannot be written");
    }
    return 0;
}

} // namespace ObjectManager::Orvcim
