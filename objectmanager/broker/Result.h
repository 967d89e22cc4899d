/** The objects and values that a provider returns from an operation. */
#ifndef BROKER_RESULT_H
#define BROKER_RESULT_H

#include "broker/Request.h"

#include <vector>

namespace ObjectManager {

struct PathContent;
struct InstanceContent;

/**
 * Collects the objects and values that a provider returns in one operation. If the provider changes or releases an
 * object after it has returned it, the result does not change. A result must be destroyed before its request.
 */
class Result {
public:
    /** @throws what the request's memory throws. */
    explicit Result(Request& request);
    Result(const Result&) = delete;
    Result& operator=(const Result&) = delete;
    ~Result();

    /** The result in the form in which the provider gets it. It holds nothing once this object was destroyed. */
    const CMPIResult* handle() const { return _handle; }

    /** Whether the provider has called returnDone: the result is complete then. */
    bool closed() const { return _closed; }
    /** Whether the provider returned neither objects nor values nor errors. */
    bool empty() const { return _paths.empty() && _instances.empty() && _data.empty() && _errors.empty(); }

    /*
     * These give the returned objects and values in the order in which the provider returned them. An index must be
     * less than the count. Paths and instances are converted into values at each call.
     */

    std::size_t pathCount() const { return _paths.size(); }
    ObjectPath path(std::size_t index) const;
    std::size_t instanceCount() const { return _instances.size(); }
    /** An instance with its full path (`fullInstance` in Objects.h). */
    Instance instance(std::size_t index) const;
    const std::vector<Value>& data() const { return _data; }
    const std::vector<CimError>& errors() const { return _errors; }

    /*
     * These do the work of the slots in CMPIResultFT. They return CMPI_RC_ERR_FAILED if the result is closed or the
     * request may not have another object, and the codes of `contentOf` and `readValue` (Objects.h) if the object or
     * value cannot be used. The request then learns of every breach of the rules.
     */

    CMPIStatus returnPath(const CMPIObjectPath* path);
    CMPIStatus returnInstance(const CMPIInstance* instance);
    CMPIStatus returnData(const CMPIValue* value, CMPIType type);
    CMPIStatus returnError(const CMPIError* error);
    CMPIStatus close();

private:
    /**
     * Whether the result is open. If it is not, the attempt to return one more object is reported to the request.
     *
     * @param attempt the kind of object, with its article.
     */
    bool open(const char* attempt);
    /** Whether the result is open, and the request may have another object. */
    bool mayTake(const char* attempt);
    template <typename Handle, typename Content>
    const Content* keep(const Handle* object, Content& content);

    Request& _request;
    CMPIResult* _handle;
    bool _closed = false;
    /** The returned paths and instances lie in the request's memory. */
    std::vector<const PathContent*> _paths;
    std::vector<const InstanceContent*> _instances;
    std::vector<Value> _data;
    std::vector<CimError> _errors;
};

} // namespace ObjectManager

#endif
