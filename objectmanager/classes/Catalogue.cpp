#include "classes/Catalogue.h"

#include "classes/Files.h"
#include "classes/Literals.h"
#include "classes/MofReader.h"

#include <fmt/format.h>

#include <algorithm>
#include <iterator>
#include <utility>

namespace ObjectManager {

namespace {

/** What the qualifiers of an element become where they are declared again. */
Qualifiers merged(const Qualifiers& inherited, Qualifiers own) {
    std::copy_if(inherited.begin(), inherited.end(), std::back_inserter(own),
                 [&own](const NamedValue& q) { return find(own, q.name) == nullptr; });
    return own;
}

/** Adds the elements of a class to those that it inherits. */
template <typename T>
void addElements(std::vector<T>& elements, const std::vector<T>& own, const Class& owner) {
    for (T element : own) {
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
                              fmt::format("found {} {}, expected the type {} that it is inherited with",
                                          typeName(element.type), element.name, typeName(inherited->type)));
        }
        element.qualifiers = merged(inherited->qualifiers, std::move(element.qualifiers));
        element.origin = inherited->origin;
        *inherited = std::move(element);
    }
}

/** Declarations by name, and with what each of them inherits. */
class Completion {
public:
    explicit Completion(std::vector<Class> declarations) {
        for (Class& declared : declarations) {
            const auto [known, added] = _declared.try_emplace(declared.name, declared);
            if (!added) {
                throw SchemaError(declared.place,
                                  fmt::format("found a second declaration of {}, expected none beside {}",
                                              declared.name, known->second.place));
            }
        }
    }

    std::vector<Class> classes() const {
        std::vector<Class> whole;
        for (const auto& [name, declared] : _declared) {
            whole.push_back(complete(declared, 0));
            checkReferences(whole.back());
        }
        return whole;
    }

private:
    /** `descendants` counts the classes on the way down to the one that is completed. */
    Class complete(const Class& declared, std::size_t descendants) const {
        Class whole = declared;
        whole.properties.clear();
        whole.methods.clear();
        if (!declared.superClass.empty()) {
            Class inherited = complete(superClassOf(declared, descendants), descendants + 1);
            whole.properties = std::move(inherited.properties);
            whole.methods = std::move(inherited.methods);
        }
        addElements(whole.properties, declared.properties, declared);
        addElements(whole.methods, declared.methods, declared);
        return whole;
    }

    const Class& superClassOf(const Class& declared, std::size_t descendants) const {
        const auto ancestor = _declared.find(declared.superClass);
        if (ancestor == _declared.end() || descendants > _declared.size()) {
            throw SchemaError(declared.place,
                              fmt::format("found {} as superclass of {}, expected {}", declared.superClass,
                                          declared.name,
                                          ancestor == _declared.end() ? "a declared class" : "no descendant of it"));
        }
        return ancestor->second;
    }

    void checkReferences(const Class& whole) const {
        const auto check = [&](const Element& element) {
            if (!element.referenceClass.empty() && !_declared.contains(element.referenceClass)) {
                throw SchemaError(whole.place, fmt::format("found {} REF {} in {}, expected a declared class",
                                                           element.referenceClass, element.name, whole.name));
            }
        };
        std::for_each(whole.properties.begin(), whole.properties.end(), check);
        for (const Method& method : whole.methods) {
            std::for_each(method.parameters.begin(), method.parameters.end(), check);
        }
    }

    std::map<std::string, Class, NameLess> _declared;
};

} // namespace

Catalogue::Catalogue(std::vector<Class> declarations) {
    for (Class& whole : Completion(std::move(declarations)).classes()) {
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
    std::vector<Class> declarations;
    for (const auto& file : filesOf(folder, ".mof")) {
        std::vector<Class> declared = readMof(readFile(file), file.string());
        std::move(declared.begin(), declared.end(), std::back_inserter(declarations));
    }
    return Catalogue(std::move(declarations));
}

} // namespace ObjectManager
