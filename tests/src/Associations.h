/**
 * The three associations as their providers' users see them: which objects are linked in which order, and what is
 * logged.
 */
#ifndef SRC_ASSOCIATIONS_H
#define SRC_ASSOCIATIONS_H

#include "Expected.h"
#include "ProviderLibrary.h"
#include "RequestFixture.h"

#include <string>
#include <vector>

namespace OrvTest {

/** A text for each of the four association operations. */
struct OperationTexts {
    std::string associatorNames;
    std::string associators;
    std::string referenceNames;
    std::string references;

    const std::string& of(const std::string& operation) const;
};

/** One end of an association. */
struct End {
    std::string property;
    std::string className;
    /** The class of its objects; null for computer systems, which come through the object manager. */
    const ElementClass* element;
    /** The texts that are logged if its objects are not available. */
    OperationTexts failures;
    /** Whether AssociatorNames puts its paths into the source's namespace and on the managed system. */
    bool namesPlaced = false;
    /** Other spellings of its class that a result class may have; without any, result classes are not looked at. */
    Lines resultClasses = {};
};

/** The texts that are logged if the pairs are not available. */
struct PairTexts {
    std::string noServices;
    std::string nullService;
    std::string noPath;
};

struct Association {
    std::string prefix;
    std::string className;
    Source source;
    /** The operation that builds the instances for EnumInstances and GetInstance. */
    std::string builder;
    /** In the order in which they are set. */
    End first;
    End second;
    /** The names that go with a property filter. */
    std::string filterKeys;
    PairTexts names;
    PairTexts instances;
    OperationTexts noTarget;
    /** Whether EnumInstanceNames closes its result before it marks its exit, or after. */
    bool namesCloseBeforeExit = false;
    /** Whether instances carry power states. */
    bool hasPowerStates = false;
    /** Whether References tells the factory that it wants paths also where the client lists no properties. */
    bool referencesWantPaths = false;

    std::string operation(const std::string& name) const { return prefix + '_' + name; }
    std::string provider() const { return prefix + "Provider"; }
};

extern const Association associatedService;
extern const Association elementCapabilities;
extern const Association hostedService;

extern const std::vector<const Association*> associations;

/** Requests to the provider of one association. */
class AssociationFixture : public RequestFixture {
protected:
    explicit AssociationFixture(const Association& testedAssociation);

    /** Computer systems "system1", "system2", ... that the object manager knows, as names and as instances. */
    void haveSystems(int count);

    /** Nodes "a" and "b", or the first of them, with the power states 2 and 7. */
    void haveRecords(int count = 2);

    /** From here on the source of the request is an object of this end, or the path of the association itself. */
    void comeFrom(const End& end);
    void askFor(const std::vector<std::pair<std::string, CMPIObjectPath*>>& keys);

    CMPIStatus enumInstanceNames() { return mi->ft->enumerateInstanceNames(mi, context, result, ref); }
    CMPIStatus enumInstances(const char** list = nullptr) {
        return mi->ft->enumerateInstances(mi, context, result, ref, list);
    }
    CMPIStatus getInstance(const char** list = nullptr) { return mi->ft->getInstance(mi, context, result, ref, list); }

    CMPIStatus associatorNames(const char* associationClass, const char* resultClass = nullptr) {
        return association->ft->associatorNames(association, context, result, ref, associationClass, resultClass,
                                                nullptr, nullptr);
    }
    CMPIStatus associators(const char* associationClass, const char* resultClass = nullptr,
                           const char** list = nullptr) {
        return association->ft->associators(association, context, result, ref, associationClass, resultClass, nullptr,
                                            nullptr, list);
    }
    CMPIStatus referenceNames() {
        return association->ft->referenceNames(association, context, result, ref, nullptr, nullptr);
    }
    CMPIStatus references(const char** list = nullptr) {
        return association->ft->references(association, context, result, ref, nullptr, nullptr, list);
    }

    /** One of the four association operations by its name, asking for this association. */
    CMPIStatus traverse(const std::string& operation, const char** list = nullptr);

    const std::string& className() const { return tested.className; }
    Lines entry(const std::string& operation) const { return tested.source.entry(tested.operation(operation)); }
    Lines exit(const std::string& operation) const { return tested.source.exit(tested.operation(operation)); }
    std::string message(const std::string& operation, const std::string& text) const {
        return tested.source.message(6000, tested.operation(operation), text);
    }
    /** What the builder marks and reports. */
    Lines builderEntry() const { return tested.source.entry(tested.builder); }
    Lines builderExit() const { return tested.source.exit(tested.builder); }
    std::string builderMessage(const std::string& text) const {
        return tested.source.message(6000, tested.builder, text);
    }

    /** The calls so far, without looks at the class of the target. */
    Lines calls() const;

    /** How one of the four operations begins: the mark, the factory, the target. */
    Lines opening(const std::string& operation, const End& far, const char* resultClass = nullptr) const;

    /** A property or key that refers to an object. */
    static std::string set(const std::string& object, const std::string& call, const std::string& name,
                           const std::string& value);

    /** Sets the two ends of an association, the given far one and the source at the other end. */
    Lines endsSet(const std::string& instance, const End& far, const std::string& value) const;

    /** Sets the current power state, as CIM has it, and the requested one. */
    static Lines statesSet(const std::string& instance, int powerState);

    /**
     * The walk over the pairs of `nodes` and what they are linked with, up to its end. Names are returned at once,
     * instances are kept; `filter` is the property list as text.
     */
    Lines pairs(bool asNames, const std::string& filter = "null") const;

    const End& otherEnd(const End& end) const { return &end == &tested.first ? tested.second : tested.first; }

    const Association& tested;
    ProviderLibrary library;
    CMPIInstanceMI* mi = library.instanceMI(tested.provider(), broker);
    CMPIAssociationMI* association = library.associationMI(tested.provider(), broker);
    CMPIContext* context = broker.context("context");
    CMPIResult* result = broker.result("result");
    const RecordingBroker::Returned& returned = broker.returned(result);
    /** What `haveRecords` and `haveSystems` made. */
    Lines nodes;
    Lines systems;
    const char* properties[2] = {"ElementName", nullptr};
    NamedAddress propertiesName{properties, "properties"};
};

/** The status is OK, without message. */
void expectOk(const CMPIStatus& status);

/** The lines before the `occurrence`th that is equal to `line`. Throws std::invalid_argument if it is missing. */
Lines before(const Lines& all, const std::string& line, int occurrence = 1);

/** "path#3" and so on. */
std::string numbered(const std::string& kind, int number);

} // namespace OrvTest

#endif
