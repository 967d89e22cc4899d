/**
 * What the machine tells everybody about itself.
 */
#ifndef COMPUTERSYSTEM_IDENTIFYINGFACTS_H
#define COMPUTERSYSTEM_IDENTIFYINGFACTS_H

#include <string>
#include <vector>

namespace Norv::ComputerSystemProvider {

/** One fact: what it is and what the machine says, both in UTF-8 and in one line. */
struct IdentifyingFact {
    std::string description;
    std::string value;

    bool operator==(const IdentifyingFact&) const = default;
};

/** Where facts are read from. */
struct FactSources {
    /** The folder of the firmware's texts, one to a file. */
    std::string firmware = "/sys/class/dmi/id";
    /** The operating system's description (os-release(5)); the first of them that can be read counts. */
    std::vector<std::string> operatingSystem = {"/etc/os-release", "/usr/lib/os-release"};
};

/**
 * The facts that identify the machine: hardware and firmware, then operating system. Only what every user may read is
 * looked at, whoever asks: no serial numbers, no UUID, no machine-id(5).
 *
 * @return the facts in a fixed order. What the machine does not tell, or tells in anything but one line of UTF-8, is
 *         not among them.
 */
std::vector<IdentifyingFact> identifyingFacts(const FactSources& sources = {});

} // namespace Norv::ComputerSystemProvider

#endif
