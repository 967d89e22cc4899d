/**
 * A program that uses the instrumentation library, for tests of what happens once in a process, or between processes.
 * It runs the commands in its arguments one after another, each with a new cursor:
 *
 *     list               each node: its text, property 123, property 125
 *     write NODE VALUE   writes property 123 of a node
 *     machine            which machine it is
 *     stay               keeps a cursor in use, in a thread and in an object that is destroyed last
 *
 * and prints their results, then the log records that were written meanwhile.
 */
#include "RecordedLog.h"

#include "Norv/Instrumentation.h"
#include "Norv/Machine.h"

#include <array>
#include <atomic>
#include <cstdlib>
#include <iostream>
#include <memory>
#include <span>
#include <string>
#include <thread>
#include <vector>

using namespace Norv;

namespace {

/** As Norv::Machine numbers them. */
constexpr std::array machineNames = {"none", "simulated", "real"};

void list() {
    Instrumentation node;
    node.selectNode(NodeLexicon::POWER_MANAGEMENT_NODE);
    for (; node; ++node) {
        unsigned int state = 0;
        std::vector<unsigned int> states;
        std::cout << node.convertPathToString(node.getPathToNode()) << ' '
                  << (node.getProperty(NodeLexicon::POWER_STATE, state) ? std::to_string(state) : "unknown");
        node.getProperty(NodeLexicon::POWER_STATE_LIST, states);
        for (const unsigned int each : states) {
            std::cout << ' ' << each;
        }
        std::cout << '\n';
    }
}

void write(const std::string& path, unsigned int value) {
    Instrumentation node;
    node.selectNode(NodeLexicon::POWER_MANAGEMENT_NODE);
    while (node && node.convertPathToString(node.getPathToNode()) != path) {
        ++node;
    }
    std::cout << (node.setProperty(NodeLexicon::POWER_STATE, value) ? "accepted" : "refused") << '\n';
}

/** Constructed before any object of the library, and so destroyed after them. */
class LastUser {
public:
    ~LastUser() {
        if (cursor) {
            unsigned int state = 0;
            const bool told = cursor->selectNode(NodeLexicon::POWER_MANAGEMENT_NODE) &&
                              cursor->getProperty(NodeLexicon::POWER_STATE, state);
            std::cout << "at the end " << cursor->getPathToNode() << ' ' << (told ? std::to_string(state) : "unknown")
                      << std::endl;
        }
    }

    std::unique_ptr<Instrumentation> cursor;
};

LastUser lastUser;

void stay() {
    lastUser.cursor = std::make_unique<Instrumentation>();
    static std::atomic<bool> uses = false;
    std::thread([] {
        for (;;) {
            Instrumentation node;
            node.selectNode(NodeLexicon::POWER_MANAGEMENT_NODE);
            static_cast<void>(node.getPathToNode());
            if (!uses.exchange(true)) {
                uses.notify_one();
            }
        }
    }).detach();
    uses.wait(false);
}

} // namespace

int main(int count, char** values) {
    const std::span arguments(values, static_cast<std::size_t>(count));
    for (std::size_t i = 1; i < arguments.size(); ++i) {
        const std::string command = arguments[i];
        if (command == "list") {
            list();
        } else if (command == "write" && i + 2 < arguments.size()) {
            write(arguments[i + 1], static_cast<unsigned int>(std::stoul(arguments[i + 2])));
            i += 2;
        } else if (command == "stay") {
            stay();
        } else if (command == "machine") {
            std::cout << machineNames.at(static_cast<std::size_t>(orvInstrumentationMachine1())) << '\n';
        } else {
            std::cerr << "unknown command " << command << '\n';
            return EXIT_FAILURE;
        }
    }
    for (const std::string& record : AgentTest::takeLog()) {
        std::cout << record << '\n';
    }
}
