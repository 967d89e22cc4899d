#include "computersystem/ComputerSystem.h"

#include "RecordingBroker.h"
#include "Transcript.h"

#include "cmpimacs.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace Norv::ComputerSystemProvider {
namespace {

using OrvTest::Transcript;
using testing::ElementsAre;

class SystemInstance : public testing::Test {
protected:
    SystemInstance() { Transcript::instance().clear(); }

    /** The text of a property; "not found" if there is none. */
    std::string textOf(const CMPIInstance* instance, const char* property) {
        const CMPIData data = CMGetProperty(instance, property, nullptr);
        return (data.state & CMPI_notFound) != 0 ? "not found" : CMGetCharPtr(data.value.string);
    }

    /** The texts of a property that is an array of strings. */
    std::vector<std::string> textsOf(const CMPIInstance* instance, const char* property) {
        const CMPIData data = CMGetProperty(instance, property, nullptr);
        EXPECT_EQ(data.type, CMPI_stringA) << property;
        std::vector<std::string> texts;
        for (CMPICount i = 0; i < CMGetArrayCount(data.value.array, nullptr); ++i) {
            texts.emplace_back(CMGetCharPtr(CMGetArrayElementAt(data.value.array, i, nullptr).value.string));
        }
        return texts;
    }

    OrvTest::RecordingBroker broker;
    CMPIObjectPath* reference = broker.path("reference", "root/cimv2", "TALVO_ComputerSystem");
};

TEST_F(SystemInstance, HasItsFactsAsParallelArrays) {
    const CMPIInstance* instance = newSystemInstance(&broker, reference, "box.example.org",
                                                     {{"System vendor", "Maker"}, {"Product name", "Box"}}, nullptr);
    EXPECT_THAT(textsOf(instance, "OtherIdentifyingInfo"), ElementsAre("Maker", "Box"));
    EXPECT_THAT(textsOf(instance, "IdentifyingDescriptions"), ElementsAre("System vendor", "Product name"));
}

TEST_F(SystemInstance, LacksBothArraysWithoutFacts) {
    const CMPIInstance* instance = newSystemInstance(&broker, reference, "box.example.org", {}, nullptr);
    for (const char* property : {"OtherIdentifyingInfo", "IdentifyingDescriptions"}) {
        EXPECT_EQ(CMGetProperty(instance, property, nullptr).state & CMPI_notFound, CMPI_notFound) << property;
    }
}

/** A system's name, and the name format that the instance must have for it. */
struct NamedFormat {
    std::string name;
    std::string format;
};

class NameFormat : public SystemInstance, public testing::WithParamInterface<NamedFormat> {};

TEST_P(NameFormat, TellsHostNamesFromOthers) {
    const CMPIInstance* instance = newSystemInstance(&broker, reference, GetParam().name, {}, nullptr);
    EXPECT_EQ(textOf(instance, "NameFormat"), GetParam().format) << GetParam().name;
    EXPECT_EQ(textOf(instance, "Name"), GetParam().name);
}

INSTANTIATE_TEST_SUITE_P(All, NameFormat,
                         testing::Values(NamedFormat{"box.example.org", "IP"}, NamedFormat{"BOX-7", "IP"},
                                         NamedFormat{"192.0.2.1", "IP"}, NamedFormat{"Rack 4, left", "Other"},
                                         NamedFormat{"büro", "Other"}));

} // namespace
} // namespace Norv::ComputerSystemProvider
