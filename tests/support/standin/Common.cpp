#include "Norv/Common.h"

#include "Agent.h"
#include "Transcript.h"

namespace Norv {

using OrvTest::Agent;
using OrvTest::Transcript;

std::string getSystemName() {
    Agent::instance().faults.next("getSystemName");
    Transcript::instance().reading("getSystemName()");
    return Agent::instance().systemName;
}

bool isObjPathsEqual(const CMPIObjectPath* left, const CMPIObjectPath* right, bool flag) {
    Agent& agent = Agent::instance();
    Transcript& transcript = Transcript::instance();
    agent.faults.next("isObjPathsEqual");
    const bool equal = agent.pathsEqual && agent.pathsEqual(left, right, flag);
    transcript.call("isObjPathsEqual(" + transcript.nameOf(left) + ", " + transcript.nameOf(right) + ", " +
                    (flag ? "true" : "false") + ") -> " + (equal ? "true" : "false"));
    return equal;
}

} // namespace Norv
