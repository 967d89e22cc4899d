/**
 * Expected transcripts: the lines that each step of the provider library leaves.
 */
#ifndef SRC_EXPECTED_H
#define SRC_EXPECTED_H

#include "Agent.h"
#include "Transcript.h"

#include <gmock/gmock.h>

#include <string>
#include <vector>

namespace OrvTest {

/** Joins lines and lists of lines. */
template <typename... Parts>
Lines lines(const Parts&... parts) {
    Lines result;
    const auto append = [&](const auto& part) {
        if constexpr (std::is_convertible_v<decltype(part), std::string>) {
            result.push_back(part);
        } else {
            result.insert(result.end(), part.begin(), part.end());
        }
    };
    (append(parts), ...);
    return result;
}

/** Whether both are the same; a failure shows the part that differs. */
testing::AssertionResult sameLines(const Lines& expected, const Lines& actual);

/** The calls so far are exactly these. */
#define EXPECT_CALLS(...)                                                                                              \
    EXPECT_TRUE(::OrvTest::sameLines(::OrvTest::lines(__VA_ARGS__), ::OrvTest::Transcript::instance().calls()))

/** A source file of the library and what it writes to log and trace. */
struct Source {
    std::string category;
    std::string file;

    std::string entering(const std::string& function, const std::string& parameters) const;
    std::string exiting(const std::string& function, const std::string& parameters) const;
    std::string message(int level, const std::string& function, const std::string& text) const;
    std::string variable(const std::string& function, const std::string& name, const std::string& value) const;

    /** The lines at the beginning and at the end of a provider's operation. */
    Lines entry(const std::string& operation) const;
    Lines exit(const std::string& operation) const;

private:
    std::string record(int level, const std::string& function, const std::string& text) const;
};

extern const Source factorySource;
extern const Source serviceSource;
extern const Source capabilitiesSource;

/** The walk over the stand-in's nodes, without lists of states, that the construction of an object factory makes. */
Lines discovery();

/** The same without nodes, with the factory's message. */
Lines failedDiscovery();

/** A class path's creation by the factory or a provider, and the line where its namespace is set. */
std::string newPath(int number, const std::string& className);
std::string namespaceSet(const std::string& path);
std::string hostSet(const std::string& path);

/** What the factory builds from: the path whose namespace it uses, and how many objects the broker made before. */
struct Place {
    std::string ref = "ref";
    int paths = 0;
    int instances = 0;
};

/** One of the two element classes: its names, and how its objects are built. `number` counts the broker's objects. */
struct ElementClass {
    std::string prefix;
    std::string className;
    std::string key;
    Source source;
    /** The text before a node's path in the value of the key property. */
    std::string keyPrefix;
    std::string getAllPaths;
    std::string getAllInstances;
    std::string getOneInstance;
    std::string makeInstance;
    /** The factory's message if a path cannot be made. */
    std::string noPath;
    /** The provider's message if no element has the key. */
    std::string noInstance;
    /** Whether getAllInstances and getAllPaths, in this order, write their EXITING line. */
    bool instancesExit;
    bool pathsExit;

    std::string operation(const std::string& name) const { return prefix + '_' + name; }
    std::string provider() const { return prefix + "Provider"; }
    std::string keyOf(const std::string& node) const { return keyPrefix + node; }

    std::string pathsParameters(const std::string& ref = "ref") const;
    std::string instancesParameters(const std::string& properties, const std::string& ref = "ref",
                                    bool isObjPath = false) const;

    /** A path as the factory builds it, after its creation and altogether. */
    Lines pathContent(int number, const std::string& node) const;
    Lines path(int number, const std::string& node) const;
    /** All of them, in the factory's order, between the factory's own lines. */
    Lines allPaths(const Lines& nodes, const Place& place = {}) const;

    /** An instance with all properties and no property list. */
    Lines instance(int number, const std::string& node) const { return instance(number, node, Place()); }
    /** An instance with the key properties and `ElementName` for the property list "properties" of just that. */
    Lines instanceWithElementName(int number, const std::string& node) const;
    /** All of them with all properties, in the factory's order, between the factory's own lines. */
    Lines allInstances(const Lines& nodes, const Place& place = {}) const;
    /** The same if the instances are wanted only for their paths. */
    Lines allInstancesForPaths(const Lines& nodes, const Place& place = {}) const;

private:
    std::string makeParameters(const std::string& properties, const std::string& ref, bool isObjPath) const;
    /** An instance with its keys and `content`; without `filter`, one that is wanted for its path. */
    Lines instanceFrame(int number, const std::string& node, const std::string& properties, const std::string& filter,
                        const Lines& content, const Place& place = {}) const;
    Lines instance(int number, const std::string& node, const Place& place) const;
    Lines keys(const std::string& object, const std::string& setter, const std::string& node) const;
    std::string elementName(int number, const std::string& node) const;
};

extern const ElementClass serviceClass;
extern const ElementClass capabilitiesClass;

/**
 * The factory's choice of the class at the far end of an association, for the source path "ref"; `target` is empty
 * where there is none. A null result class is not in the parameter list.
 */
Lines targetNamed(const std::string& association, const char* resultClass, const std::string& target);

/** The same with the path of that class, "path#1". */
Lines targetFound(const std::string& association, const char* resultClass, const std::string& target);

} // namespace OrvTest

#endif
