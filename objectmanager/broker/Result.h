/** What a provider returns. */
#ifndef BROKER_RESULT_H
#define BROKER_RESULT_H

#include "broker/Request.h"

#include <vector>

namespace ObjectManager {

struct InstanceContent;

/**
 * Collects what a provider returns in one operation; what the provider does to an object afterwards changes nothing
 * here. Ends before its request.
 */
class Result {
public:
    explicit Result(Request& request);
    Result(const Result&) = delete;
    Result& operator=(const Result&) = delete;
    ~Result();

    /** What the provider is given. */
    const CMPIResult* handle() const { return _handle; }

    /** Whether the provider said that nothing more comes. */
    bool closed() const { return _closed; }
    /** Whether nothing at all was returned. */
    bool empty() const { return _paths.empty() && _instances.empty() && _data.empty() && _errors.empty(); }

    /**
     * Gives the paths of instances the keys that they lack and that can be taken from the properties. To be called once
     * the provider has ended.
     */
    void completePaths();

    /* In the order in which they were returned; paths and instances lie in the memory of the request. */

    std::size_t pathCount() const { return _paths.size(); }
    const ObjectPath& path(std::size_t index) const { return *_paths[index]; }
    std::size_t instanceCount() const { return _instances.size(); }
    const Instance& instance(std::size_t index) const;
    const std::vector<Value>& data() const { return _data; }
    const std::vector<CimError>& errors() const { return _errors; }

    /* The slots' work: refused with CMPI_RC_ERR_FAILED once the result is closed. */

    CMPIStatus returnPath(const CMPIObjectPath* path);
    CMPIStatus returnInstance(const CMPIInstance* instance);
    CMPIStatus returnData(const CMPIValue* value, CMPIType type);
    CMPIStatus returnError(const CMPIError* error);
    CMPIStatus close();

private:
    bool open(const char* attempt);
    /** Whether the result is open, and the request may have one more object. */
    bool mayTake(const char* attempt);
    template <typename Handle, typename Content>
    Content* keep(const Handle* object, Content& content);

    Request& _request;
    CMPIResult* _handle;
    bool _closed = false;
    /** In the request's memory. */
    std::vector<const ObjectPath*> _paths;
    std::vector<InstanceContent*> _instances;
    std::vector<Value> _data;
    std::vector<CimError> _errors;
};

} // namespace ObjectManager

#endif
