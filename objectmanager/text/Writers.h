/**
 * The writers, one for each format. Private to this folder: others call `makeWriter`.
 */
#ifndef TEXT_WRITERS_H
#define TEXT_WRITERS_H

#include "text/Writer.h"

namespace ObjectManager {

/** Writes for people: one path a line, an instance as a block of aligned lines, codes with their meaning. */
class TableWriter : public Writer {
public:
    TableWriter(std::ostream& out, const Catalogue& catalogue) : _out(out), _catalogue(catalogue) {}

    void names(const std::vector<ObjectPath>& paths) override;
    void instances(const std::vector<Instance>& instances) override;
    void instance(const Instance& instance) override;
    void associatedNames(const std::vector<Associated<ObjectPath>>& found) override;
    void associatedInstances(const std::vector<Associated<Instance>>& found) override;
    void classes(const std::vector<Class>& classes) override;
    void methodResult(const Method& method, const Value& returnValue, const std::vector<NamedValue>& outputs) override;
    void summary(const std::vector<std::vector<std::string>>& rows, const std::vector<Instance>& instances) override;

private:
    void write(const std::vector<Instance>& instances, std::size_t indent);

    std::ostream& _out;
    const Catalogue& _catalogue;
};

/** Writes for programs: one JSON document for each answer. Codes are numbers; paths and datetimes are strings. */
class JsonWriter : public Writer {
public:
    explicit JsonWriter(std::ostream& out) : _out(out) {}

    void names(const std::vector<ObjectPath>& paths) override;
    void instances(const std::vector<Instance>& instances) override;
    void instance(const Instance& instance) override;
    void associatedNames(const std::vector<Associated<ObjectPath>>& found) override;
    void associatedInstances(const std::vector<Associated<Instance>>& found) override;
    void classes(const std::vector<Class>& classes) override;
    void methodResult(const Method& method, const Value& returnValue, const std::vector<NamedValue>& outputs) override;
    void summary(const std::vector<std::vector<std::string>>& rows, const std::vector<Instance>& instances) override;

private:
    std::ostream& _out;
};

/** Writes the Managed Object Format. An object path is written as an instance that has only its keys. */
class MofWriter : public Writer {
public:
    explicit MofWriter(std::ostream& out) : _out(out) {}

    void names(const std::vector<ObjectPath>& paths) override;
    void instances(const std::vector<Instance>& instances) override;
    void instance(const Instance& instance) override;
    void associatedNames(const std::vector<Associated<ObjectPath>>& found) override;
    void associatedInstances(const std::vector<Associated<Instance>>& found) override;
    void classes(const std::vector<Class>& classes) override;
    void methodResult(const Method& method, const Value& returnValue, const std::vector<NamedValue>& outputs) override;
    void summary(const std::vector<std::vector<std::string>>& rows, const std::vector<Instance>& instances) override;

private:
    std::ostream& _out;
};

} // namespace ObjectManager

#endif
