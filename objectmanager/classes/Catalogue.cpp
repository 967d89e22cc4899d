#include "classes/Catalogue.h"

#include "classes/Literals.h"
#include "classes/MofReader.h"
#include "classes/SchemaFiles.h"

#include <fmt/format.h>

#include <algorithm>
#include <iterator>
#include <utility>

namespace ObjectManager {

namespace {

void inheritQualifiers(Element& element, const Element& inherited, const QualifierTypes& types) {
    element.qualifiers = types.merged(inherited.qualifiers, std::move(element.qualifiers));
}

/** A parameter inherits the qualifiers of the inherited method's parameter of the same name. */
void inheritQualifiers(Method& method, const Method& inherited, const QualifierTypes& types) {
    method.qualifiers = types.merged(inherited.qualifiers, std::move(method.qualifiers));
    for (Parameter& parameter : method.parameters) {
        if (const Parameter* known = findElement(inherited.parameters, parameter.name)) {
            inheritQualifiers(parameter, *known, types);
        }
    }
}

/** Adds the elements that a class declares to those that it inherits. */
template <typename T>
void addElements(std::vector<T>& elements, std::vector<T> own, const Class& owner, const QualifierTypes& types) {
    for (T& element : own) {
        element.origin = owner.name;
        element.declaredBy = owner.name;
        const auto inherited = std::find_if(elements.begin(), elements.end(),
                                            [&](const T& e) { return equalNames(e.name, element.name); });
        if (inherited == elements.end()) {
            elements.push_back(std::move(element));
            continue;
        }
        if (inherited->type != element.type) {
            throw SchemaError(owner.place,
                              fmt::format("found {} {}, expected the inherited type {}", typeName(element.type),
                                          element.name, typeName(inherited->type)));
        }
        inheritQualifiers(element, *inherited, types);
        element.origin = inherited->origin;
        *inherited = std::move(element);
    }
}

/** Completes class declarations with what they inherit. */
class Completion {
public:
    /** @param types must outlive this object. */
    Completion(std::vector<Class> declarations, const QualifierTypes& types) : _types(types) {
        for (Class& declared : declarations) {
            convertQualifiers(declared);
            const auto [known, added] = _classes.try_emplace(declared.name);
            if (!added) {
                throw SchemaError(declared.place,
                                  fmt::format("found a second declaration of {}, expected only the one at {}",
                                              declared.name, known->second.declared.place));
            }
            known->second.declared = std::move(declared);
        }
    }

    std::vector<Class> classes() && {
        for (auto& [name, entry] : _classes) {
            checkReferences(complete(entry, 0));
        }
        std::vector<Class> whole;
        whole.reserve(_classes.size());
        for (auto& [name, entry] : _classes) {
            whole.push_back(std::move(entry.declared));
        }
        return whole;
    }

private:
    struct Entry {
        /** The declaration; with what it inherits once it is complete. */
        Class declared;
        bool isComplete = false;
    };

    /** Converts the qualifiers of the class and of its elements to their types. */
    void convertQualifiers(Class& declared) const {
        _types.convert(declared.qualifiers, declared.place);
        for (Property& property : declared.properties) {
            _types.convert(property.qualifiers, declared.place);
        }
        for (Method& method : declared.methods) {
            _types.convert(method.qualifiers, declared.place);
            for (Parameter& parameter : method.parameters) {
                _types.convert(parameter.qualifiers, declared.place);
            }
        }
    }

    /**
     * `descendants` counts the classes between this one and the class whose completion began this: it finds cycles.
     */
    const Class& complete(Entry& entry, std::size_t descendants) {
        Class& whole = entry.declared;
        if (entry.isComplete) {
            return whole;
        }
        std::vector<Property> properties = std::exchange(whole.properties, {});
        std::vector<Method> methods = std::exchange(whole.methods, {});
        if (!whole.superClass.empty()) {
            const Class& inherited = complete(superClassOf(whole, descendants), descendants + 1);
            whole.properties = inherited.properties;
            whole.methods = inherited.methods;
            whole.qualifiers = _types.merged(inherited.qualifiers, std::move(whole.qualifiers));
        }
        addElements(whole.properties, std::move(properties), whole, _types);
        addElements(whole.methods, std::move(methods), whole, _types);
        entry.isComplete = true;
        return whole;
    }

    Entry& superClassOf(const Class& declared, std::size_t descendants) {
        const auto ancestor = _classes.find(declared.superClass);
        if (ancestor == _classes.end() || descendants > _classes.size()) {
            throw SchemaError(
                declared.place,
                fmt::format("found {} as superclass of {}, expected {}", declared.superClass, declared.name,
                            ancestor == _classes.end() ? "a declared class" : "a class that is not its descendant"));
        }
        return ancestor->second;
    }

    void checkReferences(const Class& whole) const {
        const auto check = [&](const Element& element) {
            if (!element.referenceClass.empty() && !_classes.contains(element.referenceClass)) {
                throw SchemaError(whole.place, fmt::format("found {} REF {} in {}, expected a declared class",
                                                           element.referenceClass, element.name, whole.name));
            }
        };
        std::for_each(whole.properties.begin(), whole.properties.end(), check);
        for (const Method& method : whole.methods) {
            std::for_each(method.parameters.begin(), method.parameters.end(), check);
        }
    }

    const QualifierTypes& _types;
    std::map<std::string, Entry, NameLess> _classes;
};

} // namespace

Catalogue::Catalogue(Declarations declarations) : _qualifierTypes(declarations.qualifierTypes) {
    for (Class& whole : Completion(std::move(declarations.classes), _qualifierTypes).classes()) {
        Entry entry;
        for (const Property* key : whole.keys()) {
            entry.keyNames.push_back(key->name);
        }
        for (const Property& property : whole.properties) {
            if (property.type == CMPI_ref) {
                entry.references.push_back({property.name, property.referenceClass});
            }
        }
        entry.whole = std::move(whole);
        const std::string name = entry.whole.name;
        _classes.emplace(name, std::move(entry));
    }
}

const Class* Catalogue::find(std::string_view name) const {
    const auto found = _classes.find(name);
    return found == _classes.end() ? nullptr : &found->second.whole;
}

std::vector<const Class*> Catalogue::all() const {
    std::vector<const Class*> classes;
    classes.reserve(_classes.size());
    for (const auto& [name, entry] : _classes) {
        classes.push_back(&entry.whole);
    }
    return classes;
}

bool Catalogue::isA(std::string_view name, std::string_view ancestor) const {
    if (equalNames(name, ancestor)) {
        return true;
    }
    const Class* known = find(name);
    return known != nullptr && !known->superClass.empty() && isA(known->superClass, ancestor);
}

std::span<const std::string> Catalogue::keyNames(std::string_view name) const {
    const auto found = _classes.find(name);
    return found == _classes.end() ? std::span<const std::string>() : found->second.keyNames;
}

const std::string* Catalogue::declaredName(std::string_view name) const {
    const Class* known = find(name);
    return known == nullptr ? nullptr : &known->name;
}

std::span<const ReferenceEnd> Catalogue::references(std::string_view name) const {
    const auto found = _classes.find(name);
    return found == _classes.end() ? std::span<const ReferenceEnd>() : found->second.references;
}

Catalogue readCatalogue(const std::filesystem::path& folder) {
    Declarations all;
    for (const auto& file : filesOf(folder, ".mof")) {
        Declarations declared = readMof(readFile(file), file.string());
        std::move(declared.classes.begin(), declared.classes.end(), std::back_inserter(all.classes));
        std::move(declared.qualifierTypes.begin(), declared.qualifierTypes.end(),
                  std::back_inserter(all.qualifierTypes));
    }
    return Catalogue(std::move(all));
}

} // namespace ObjectManager
