/**
 * The power-managed elements of the machine, as the agent's instrumentation tree shows them.
 */
#ifndef POWERSTATEMANAGEMENT_H
#define POWERSTATEMANAGEMENT_H

#include <exception>
#include <map>
#include <string>
#include <vector>

namespace Norv {

/** The reason why a record could not be filled. The exception owns its text. */
class ProviderException : public std::exception {
public:
    explicit ProviderException(const char* message) : _message(message) {}

    const char* what() const noexcept override { return _message.c_str(); }

private:
    std::string _message;
};

namespace PowerStateManagementServiceProvider {

/**
 * One power-managed element: its names and its power state (CIM_PowerManagementService and
 * CIM_PowerManagementCapabilities, DMTF DSP1027). A plain value: copies share nothing.
 *
 * A setter of a text stores its argument, and returns whether the argument is not empty.
 */
class PowerStateManagement {
public:
    bool setName(std::string name);
    bool setElementName(std::string elementName);
    bool setInstanceID(std::string instanceID);
    bool setCapabilitiesElementName(std::string capabilitiesElementName);

    /**
     * Stores the power state.
     *
     * @param powerState the state by its number in the instrumentation tree: 1 running, 8 hibernating, 10 off. The
     *                   record stores the value of CIM_AssociatedPowerManagementService.PowerState for it: 2 (On), 7
     *                   (Hibernate (Off - Soft)), 12 (Off - Soft Graceful), or 1 (Other) for every other number.
     * @return true.
     */
    bool setPowerState(unsigned int powerState);

    /** The lists of a record are fixed, whatever the tree has: both functions ignore their argument and return true. */
    bool setPowerChangeCapabilities(std::vector<unsigned int> codes);
    bool setPowerStatesSupported(std::vector<unsigned int> codes);

    std::string getName();
    std::string getElementName();
    std::string getInstanceID();
    std::string getCapabilitiesElementName();

    /** The stored power state; 0 if none was stored. */
    unsigned short getPowerState();

    /** Stores and returns 12, which means "Not Applicable" as a requested power state (DSP1027). */
    unsigned short getRequestedPowerState();

    /**
     * Appends 2 (On), 5 (Power Cycle Off - Soft) and 8 (Off - Soft) to the stored list and returns all of it: a second
     * call on the same record returns six codes.
     */
    std::vector<unsigned short> getPowerStatesSupported();

    /** Does the same with its own list and 3 (Power State Settable), 4 (Power Cycling Supported) and 8 (Graceful). */
    std::vector<unsigned short> getPowerChangeCapabilities();

private:
    std::string _name;
    std::string _elementName;
    std::string _instanceID;
    std::vector<unsigned short> _powerChangeCapabilities;
    std::string _capabilitiesElementName;
    std::vector<unsigned short> _powerStatesSupported;
    unsigned short _powerState = 0;
    unsigned short _requestedPowerState = 0;
};

/** Records by their name or instance ID, under which clients know them. */
using Records = std::map<std::string, PowerStateManagement>;

/**
 * Reads the power-management nodes of the instrumentation tree.
 *
 * @param[in,out] instances receives a record for each node. Records that it already holds stay, unless a node has the
 * same key.
 * @param keyProperty "Name" or an empty text: the key of a record is its name; "InstanceID": its instance ID. With any
 *                    other text, no record is stored.
 * @return 0 if the whole tree was read; 1 if it has no power-management node or reading it failed. In the latter case,
 *         the reason is written to standard error, and the map has the records of the nodes before the failure.
 */
unsigned short getPowerStateManagementInstances(Records& instances, std::string keyProperty);

} // namespace PowerStateManagementServiceProvider
} // namespace Norv

#endif
