/** What a provider returns. */
#ifndef BROKER_RESULT_H
#define BROKER_RESULT_H

#include "broker/Request.h"

#include <vector>

namespace ObjectManager {

struct PathContent;
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

    /* In the order in which they were returned. Paths and instances become values when they are asked for. */

    std::size_t pathCount() const { return _paths.size(); }
    ObjectPath path(std::size_t index) const;
    std::size_t instanceCount() const { return _instances.size(); }
    /** A path without keys takes them from the properties where it can. */
    Instance instance(std::size_t index) const;
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
    const Content* keep(const Handle* object, Content& content);

    Request& _request;
    CMPIResult* _handle;
    bool _closed = false;
    /** In the request's memory. */
    std::vector<const PathContent*> _paths;
    std::vector<const InstanceContent*> _instances;
    std::vector<Value> _data;
    std::vector<CimError> _errors;
};

} // namespace ObjectManager

#endif
