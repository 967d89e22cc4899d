/**
 * One request: a broker, a reference path, and a machine without nodes, fresh for every test.
 */
#ifndef SRC_REQUESTFIXTURE_H
#define SRC_REQUESTFIXTURE_H

#include "Agent.h"
#include "RecordingBroker.h"
#include "Transcript.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace OrvTest {

class RequestFixture : public testing::Test {
protected:
    RequestFixture() { transcript.clear(); }

    /** Expects that no object of the agent's libraries is left over, whatever the test did. */
    ~RequestFixture() override {
        EXPECT_EQ(agent.messageBuffers, 0);
        EXPECT_EQ(agent.instrumentations, 0);
        agent.reset();
        transcript.clear();
    }

    /** Nodes without properties, one for each path. */
    void haveNodes(const std::vector<std::string>& paths) {
        for (const std::string& path : paths) {
            agent.nodes.push_back({path, {}, {}});
        }
    }

    /** Gives `count` nodes, too many for a transcript. */
    void haveMany(std::size_t count) {
        transcript.pause();
        for (std::size_t number = 0; number < count; ++number) {
            agent.nodes.push_back({std::to_string(number), {}, {}});
        }
    }

    Agent& agent = Agent::instance();
    Transcript& transcript = Transcript::instance();
    RecordingBroker broker;
    CMPIObjectPath* ref = broker.path("ref", "root/cimv2", "TALVO_PowerManagementService");
};

/** Gives an address its name in the transcript for as long as the object lives. */
class NamedAddress {
public:
    NamedAddress(const void* address, const std::string& name) : _address(address) {
        Transcript::instance().name(address, name);
    }
    ~NamedAddress() { Transcript::instance().forget(_address); }
    NamedAddress(const NamedAddress&) = delete;
    NamedAddress& operator=(const NamedAddress&) = delete;

private:
    const void* _address;
};

} // namespace OrvTest

#endif
