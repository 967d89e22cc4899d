/**
 * A CMPI broker for tests: it does what an object manager does, writes every call with its arguments into the
 * transcript, and goes wrong where it is told to.
 *
 * Objects made by a provider are named by kind and number ("path#1", "instance#2"), those made by a test by the test;
 * what belongs to another object by its owner ("path.Name", "instance#1.path"). A call that could have reported its
 * status but was given a null status pointer ends with "no status". Readings in the sense of the transcript are the
 * characters of a string, the namespace of a path, and whether an enumeration goes on.
 *
 * Slots that no provider here has a use for report CMPI_RC_ERR_NOT_SUPPORTED and are recorded like all others.
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

    /** Ends the life of every object that it made. */
    ~RecordingBroker();
    RecordingBroker(const RecordingBroker&) = delete;
    RecordingBroker& operator=(const RecordingBroker&) = delete;

    /** What goes wrong, by the name of the slot in the function table, e.g. "newObjectPath". */
    Faults faults;

    /** What the up-calls yield, by class name. Other classes yield nothing. */
    std::map<std::string, std::vector<CMPIObjectPath*>> instanceNames;
    std::map<std::string, std::vector<CMPIInstance*>> instances;

    /** The key properties of classes, as a schema has them; setting one on an instance also sets it in its path. */
    std::map<std::string, std::vector<std::string>> keyProperties;

    /** What a provider has handed over. */
    struct Returned {
        std::vector<const CMPIInstance*> instances;
        std::vector<const CMPIObjectPath*> paths;
        std::vector<CMPIData> data;
        unsigned int closed = 0;
    };

    /*
     * Objects for the test itself, not recorded. They live as long as the broker. To get an object that holds nothing,
     * set its handle to null.
     */

    CMPIContext* context(const std::string& name);
    CMPIResult* result(const std::string& name);
    static const Returned& returned(const CMPIResult* result);

    /** A path whose keys are texts. */
    CMPIObjectPath* path(const std::string& name, const std::string& nameSpace, const std::string& className,
                         const std::vector<std::pair<std::string, std::string>>& keys = {});
    CMPIInstance* instance(const std::string& name, const CMPIObjectPath* path);

    /** The newest path of that name in the transcript, whoever made it. Throws std::out_of_range where there is none.
     */
    CMPIObjectPath* pathCalled(const std::string& name);

    CMPIString* string(const std::string& name, const std::string& text);
    CMPIDateTime* dateTime(const std::string& name);
    CMPIArgs* args(const std::string& name);

    /** Sets a key or an argument to exactly this, whatever it is. */
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
