#include "orvcim/AgentExamination.h"
#include "orvcim/Commands.h"
#include "text/Layout.h"

#include <fmt/format.h>
#include <fmt/ranges.h>
#include <nlohmann/json.hpp>

namespace ObjectManager::Orvcim {

namespace {

using Json = nlohmann::ordered_json;

struct Finding {
    const Registration& registration;
    ProviderReport provider;
    /** What is wrong with the class's declaration; empty if nothing is. */
    std::string schemaProblem;

    bool good() const { return provider.usable() && schemaProblem.empty(); }
};

Finding findingOf(Session& session, const Registration& registration) {
    const bool declared = session.catalogue().find(registration.className) != nullptr;
    return {registration, session.dispatcher().check(registration),
            declared ? "" : fmt::format("the class is not declared in {}", session.schemaFolder().string())};
}

std::string describe(const FactoryReport& factory) {
    return factory.problem.empty() ? fmt::format("{}: {}, versions {} and {}", factory.factory, factory.miName,
                                                 factory.tableVersion, factory.miVersion)
                                   : fmt::format("{}: {}", factory.factory, factory.problem);
}

constexpr std::size_t tableIndent = 2;

void writeTable(Session& session, const AgentExamination& agent) {
    std::vector<Row> rows;
    for (const auto& [name, value] : agent.facts) {
        rows.push_back(rowOf({name, value}));
    }
    for (const std::string& problem : agent.problems) {
        rows.push_back(rowOf({"problem", problem}));
    }
    session.out() << "Embedded agent: " << (agent.problems.empty() ? "ok" : "not usable") << '\n'
                  << aligned(rows, tableIndent);
}

void writeTable(Session& session, const std::vector<Finding>& findings, const AgentExamination& agent) {
    for (const Finding& finding : findings) {
        const Registration& registration = finding.registration;
        const std::string library =
            finding.provider.library.empty() ? registration.location : finding.provider.library.string();
        std::vector<Row> rows = {rowOf({"namespaces", fmt::format("{}", fmt::join(registration.nameSpaces, ", "))}),
                                 rowOf({"provider", registration.provider}), rowOf({"library", library})};
        for (const FactoryReport& factory : finding.provider.factories) {
            rows.push_back(rowOf({"factory", describe(factory)}));
        }
        for (const std::string& problem : {finding.provider.problem, finding.schemaProblem}) {
            if (!problem.empty()) {
                rows.push_back(rowOf({"problem", problem}));
            }
        }
        session.out() << registration.className << ": " << (finding.good() ? "ok" : "not usable") << '\n'
                      << aligned(rows, tableIndent);
    }
    writeTable(session, agent);
}

void writeJson(Session& session, const std::vector<Finding>& findings, const AgentExamination& agent) {
    Json providers = Json::array();
    for (const Finding& finding : findings) {
        const Registration& registration = finding.registration;
        Json factories = Json::array();
        for (const FactoryReport& factory : finding.provider.factories) {
            factories.push_back({{"factory", factory.factory},
                                 {"name", factory.miName},
                                 {"tableVersion", factory.tableVersion},
                                 {"version", factory.miVersion},
                                 {"problem", factory.problem}});
        }
        providers.push_back({{"class", registration.className},
                             {"namespaces", registration.nameSpaces},
                             {"provider", registration.provider},
                             {"location", registration.location},
                             {"library", finding.provider.library.string()},
                             {"usable", finding.good()},
                             {"problems", Json::array()},
                             {"factories", factories}});
        for (const std::string& problem : {finding.provider.problem, finding.schemaProblem}) {
            if (!problem.empty()) {
                providers.back()["problems"].push_back(problem);
            }
        }
    }
    Json facts = Json::object();
    for (const auto& [name, value] : agent.facts) {
        facts[name] = value;
    }
    const Json json = {{"providers", providers},
                       {"agent", {{"usable", agent.problems.empty()}, {"facts", facts}, {"problems", agent.problems}}}};
    constexpr int indent = 2;
    session.out() << json.dump(indent, ' ', false, Json::error_handler_t::replace) << '\n';
}

} // namespace

void checkProviders(Session& session) {
    if (session.options().format == Format::mof) {
        throw UsageError("found --format mof, expected table or json for check");
    }
    std::vector<Finding> findings;
    std::vector<std::string> unusable;
    for (const Registration& registration : session.dispatcher().registry().registrations()) {
        findings.push_back(findingOf(session, registration));
        if (!findings.back().good()) {
            unusable.push_back(registration.className);
        }
    }
    const AgentExamination agent = examineAgent();
    if (!agent.problems.empty()) {
        unusable.emplace_back("the embedded agent");
    }
    if (session.options().format == Format::json) {
        writeJson(session, findings, agent);
    } else {
        writeTable(session, findings, agent);
    }
    if (!unusable.empty() || findings.empty()) {
        throw Failure(findings.empty() ? fmt::format("found no registration in {}, expected at least one",
                                                     session.schemaFolder().string())
                                       : fmt::format("not usable: {}", fmt::join(unusable, ", ")));
    }
}

} // namespace ObjectManager::Orvcim
