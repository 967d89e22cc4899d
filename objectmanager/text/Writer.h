/**
 * Writes the answers of operations: for people as a table, for programs as JSON, or in the Managed Object Format.
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
    /** @param classes include the elements that they inherit. */
    virtual void classes(const std::vector<Class>& classes) = 0;
    /** @param outputs the output arguments. */
    virtual void methodResult(const Method& method, const Value& returnValue,
                              const std::vector<NamedValue>& outputs) = 0;
    /**
     * Writes a summary of instances: the table format shows the rows, the other formats the instances.
     *
     * @param rows all have the same number of cells; the first one has the names of the columns.
     */
    virtual void summary(const std::vector<std::vector<std::string>>& rows, const std::vector<Instance>& instances) = 0;
};

/** Makes the writer for a format. @param out,catalogue must outlive the writer. */
std::unique_ptr<Writer> makeWriter(Format format, std::ostream& out, const Catalogue& catalogue);

/**
 * A value for people, on one line: strings without quotes, codes followed by their meaning.
 *
 * @param element the declaration of the property or parameter that has the value; null if it is not known.
 */
std::string plainText(const Value& value, const Element* element);

} // namespace ObjectManager

#endif
