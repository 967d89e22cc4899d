/**
 * A CMPI broker for tests: it does what an object manager does, records every call with its arguments in the
 * transcript, and lets those calls fail for which a test injects a fault.
 *
 * The name of an object that a provider makes has its kind and number ("path#1", "instance#2"); a test names the
 * objects that it makes; the name of an object that belongs to another one begins with its owner ("path.Name",
 * "instance#1.path"). The line of a call with a null status pointer ends with "no status". Readings, as the transcript
 * defines them, are reading the characters of a string, the namespace of a path, and whether an enumeration has more
 * elements.
 *
 * Slots that no provider here uses report CMPI_RC_ERR_NOT_SUPPORTED, and are recorded like all others.
 */
#ifndef SUPPORT_RECORDINGBROKER_H
#define SUPPORT_RECORDINGBROKER_H

#include "Faults.h"
#include "cmpift.h"

#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace OrvTest {

class RecordingBroker : public CMPIBroker {
public:
    /** `name` stands before the calls on this broker in the transcript. */
    explicit RecordingBroker(const std::string& name = "broker");

    /** Destroys every object that the broker made. */
    ~RecordingBroker();
    RecordingBroker(const RecordingBroker&) = delete;
    RecordingBroker& operator=(const RecordingBroker&) = delete;

    /** The faults, by the name of the slot in the function table, e.g. "newObjectPath". */
    Faults faults;

    /** The results of up-calls, by class name. Up-calls for other classes have empty results. */
    std::map<std::string, std::vector<CMPIObjectPath*>> instanceNames;
    std::map<std::string, std::vector<CMPIInstance*>> instances;

    /** The key properties of classes, as in a schema. If one is set on an instance, the path gets the key, too. */
    std::map<std::string, std::vector<std::string>> keyProperties;

    /** The objects and values that a provider has returned to a result. */
    struct Returned {
        std::vector<const CMPIInstance*> instances;
        std::vector<const CMPIObjectPath*> paths;
        std::vector<CMPIData> data;
        unsigned int closed = 0;
    };

    /*
     * These make objects for the test itself, and are not recorded. The objects live as long as the broker. To get an
     * object that holds nothing, set its handle to null.
     */

    CMPIContext* context(const std::string& name);
    CMPIResult* result(const std::string& name);
    static const Returned& returned(const CMPIResult* result);

    /** A path whose keys are texts. */
    CMPIObjectPath* path(const std::string& name, const std::string& nameSpace, const std::string& className,
                         const std::vector<std::pair<std::string, std::string>>& keys = {});
    CMPIInstance* instance(const std::string& name, const CMPIObjectPath* path);

    /** The newest path with this name in the transcript. @throws std::out_of_range if there is none. */
    CMPIObjectPath* pathCalled(const std::string& name);

    CMPIString* string(const std::string& name, const std::string& text);
    CMPIDateTime* dateTime(const std::string& name);
    CMPIArgs* args(const std::string& name);

    /** Sets a key or an argument to `data`, even if its type or state is wrong. */
    static void setKey(CMPIObjectPath* path, const std::string& key, const CMPIData& data);
    static void setArg(CMPIArgs* args, const std::string& argument, const CMPIData& data);

    struct Objects;
    Objects& objects() const { return *_objects; }

private:
    std::unique_ptr<Objects> _objects;
};

/** Values for `setKey` and `setArg`. */
CMPIData uint16Value(CMPIUint16 value);
CMPIData referenceValue(CMPIObjectPath* path);
CMPIData dateTimeValue(CMPIDateTime* dateTime);
CMPIData stringValue(CMPIString* string);
CMPIData nullValue(CMPIType type);

} // namespace OrvTest

#endif
