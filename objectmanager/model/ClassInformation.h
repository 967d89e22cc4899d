/** What is known of the classes of CIM objects. */
#ifndef MODEL_CLASSINFORMATION_H
#define MODEL_CLASSINFORMATION_H

#include <span>
#include <string>
#include <string_view>

namespace ObjectManager {

/** A reference of an association class. */
struct ReferenceEnd {
    /** The name of the property. */
    std::string role;
    /** The class that it refers to. */
    std::string className;
};

/** What those who handle objects need to know of the classes. Asked from several threads at once. */
class ClassInformation {
public:
    ClassInformation() = default;
    ClassInformation(const ClassInformation&) = delete;
    ClassInformation& operator=(const ClassInformation&) = delete;
    virtual ~ClassInformation() = default;

    /** Whether `className` is `superClassName` or derived from it. */
    virtual bool isA(std::string_view className, std::string_view superClassName) const = 0;
    /** The names of a class's key properties, none where the class is not known. They live as long as this object. */
    virtual std::span<const std::string> keyNames(std::string_view className) const = 0;
    /** A class's name as it is declared; null where the class is not known. Lives as long as this object. */
    virtual const std::string* declaredName(std::string_view className) const = 0;
    /** The references of a class, none where it has none or is not known. They live as long as this object. */
    virtual std::span<const ReferenceEnd> references(std::string_view className) const = 0;
};

} // namespace ObjectManager

#endif
