/**
 * The answers of operations, written for people (table), for programs (JSON) or in the Managed Object Format.
 */
#ifndef TEXT_WRITER_H
#define TEXT_WRITER_H

#include "classes/Catalogue.h"
#include "model/Model.h"
#include "model/Operations.h"

#include <memory>
#include <ostream>
#include <string>
#include <vector>

namespace ObjectManager {

enum class Format { table, json, mof };

class Writer {
public:
    virtual ~Writer() = default;

    virtual void names(const std::vector<ObjectPath>& paths) = 0;
    virtual void instances(const std::vector<Instance>& instances) = 0;
    virtual void instance(const Instance& instance) = 0;
    virtual void associatedNames(const std::vector<Associated<ObjectPath>>& found) = 0;
    virtual void associatedInstances(const std::vector<Associated<Instance>>& found) = 0;
    /** @param classes with everything that they inherit. */
    virtual void classes(const std::vector<Class>& classes) = 0;
    /** @param outputs the output arguments. */
    virtual void methodResult(const Method& method, const Value& returnValue,
                              const std::vector<NamedValue>& outputs) = 0;
    /**
     * Instances summed up: people get the rows, programs the instances.
     *
     * @param rows as many cells each; the first has the names of the columns.
     */
    virtual void summary(const std::vector<std::vector<std::string>>& rows, const std::vector<Instance>& instances) = 0;
};

/** @param out,catalogue are used as long as the writer lives. */
std::unique_ptr<Writer> makeWriter(Format format, std::ostream& out, const Catalogue& catalogue);

/**
 * A value for people: texts without quotes, one line, and behind a code what it means.
 *
 * @param element the declaration of what has the value; null where it is not known.
 */
std::string plainText(const Value& value, const Element* element);

} // namespace ObjectManager

#endif
