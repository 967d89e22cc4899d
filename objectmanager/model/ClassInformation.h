/** The interface through which the object manager looks up CIM classes. */
#ifndef MODEL_CLASSINFORMATION_H
#define MODEL_CLASSINFORMATION_H

#include <span>
#include <string>
#include <string_view>

namespace ObjectManager {

/** A reference property of an association class. */
struct ReferenceEnd {
    /** The name of the property. */
    std::string role;
    /** The class of the objects to which the property refers, as the property is declared. */
    std::string className;
};

/**
 * The knowledge about classes that is needed to handle their objects. Names of classes are compared without regard to
 * letter case. Several threads may use it at once.
 */
class ClassInformation {
public:
    ClassInformation() = default;
    ClassInformation(const ClassInformation&) = delete;
    ClassInformation& operator=(const ClassInformation&) = delete;
    virtual ~ClassInformation() = default;

    /** Whether `className` is `superClassName`, or a class that is derived from it directly or indirectly. */
    virtual bool isA(std::string_view className, std::string_view superClassName) const = 0;
    /** The names of a class's key properties; none if the class is not known. They live as long as this object. */
    virtual std::span<const std::string> keyNames(std::string_view className) const = 0;
    /** A class's name as it is declared; null if the class is not known. The name lives as long as this object. */
    virtual const std::string* declaredName(std::string_view className) const = 0;
    /**
     * The reference properties of a class, those that it inherits included; none if it has none, or is not known. They
     * live as long as this object.
     */
    virtual std::span<const ReferenceEnd> references(std::string_view className) const = 0;
};

} // namespace ObjectManager

#endif
