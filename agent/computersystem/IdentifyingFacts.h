/**
 * Facts about the machine that every user may read.
 */
#ifndef COMPUTERSYSTEM_IDENTIFYINGFACTS_H
#define COMPUTERSYSTEM_IDENTIFYINGFACTS_H

#include <string>
#include <vector>

namespace Norv::ComputerSystemProvider {

/** One fact: its description and its value, each one line of UTF-8. */
struct IdentifyingFact {
    std::string description;
    std::string value;

    bool operator==(const IdentifyingFact&) const = default;
};

/** The files from which facts are read. */
struct FactSources {
    /** The folder with the firmware's texts, each in a file of its own. */
    std::string firmware = "/sys/class/dmi/id";
    /** Files that describe the operating system (os-release(5)). The first one that can be read counts. */
    std::vector<std::string> operatingSystem = {"/etc/os-release", "/usr/lib/os-release"};
};

/**
 * The facts that identify the machine: first the hardware and firmware, then the operating system. Whoever asks, only
 * facts that every user may read are used: no serial numbers, no UUID, no machine-id(5).
 *
 * @return the facts in a fixed order. Facts that the machine does not have, or whose text is not one line of UTF-8, are
 *         left out.
 */
std::vector<IdentifyingFact> identifyingFacts(const FactSources& sources = {});

} // namespace Norv::ComputerSystemProvider

#endif
