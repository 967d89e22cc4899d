#include "PowerStateManagement.h"

#include <gmock/gmock.h>

#include <memory>

namespace OrvTest {
namespace {

using Norv::ProviderException;
using Norv::PowerStateManagementServiceProvider::PowerStateManagement;
using testing::ElementsAre;
using testing::IsEmpty;

struct TextField {
    const char* name;
    bool (PowerStateManagement::*set)(std::string);
    std::string (PowerStateManagement::*get)();
};

void PrintTo(const TextField& field, std::ostream* out) {
    *out << field.name;
}

const TextField textFields[] = {
    {"Name", &PowerStateManagement::setName, &PowerStateManagement::getName},
    {"ElementName", &PowerStateManagement::setElementName, &PowerStateManagement::getElementName},
    {"InstanceID", &PowerStateManagement::setInstanceID, &PowerStateManagement::getInstanceID},
    {"CapabilitiesElementName", &PowerStateManagement::setCapabilitiesElementName,
     &PowerStateManagement::getCapabilitiesElementName},
};

class RecordTexts : public testing::TestWithParam<TextField> {
protected:
    bool set(const std::string& text) { return (record.*GetParam().set)(text); }
    std::string get() { return (record.*GetParam().get)(); }

    PowerStateManagement record;
};

TEST_P(RecordTexts, AreEmptyAtFirst) {
    EXPECT_EQ(get(), "");
}

TEST_P(RecordTexts, AreStored) {
    EXPECT_TRUE(set("rack/one"));
    EXPECT_EQ(get(), "rack/one");
}

TEST_P(RecordTexts, AnEmptyTextIsStoredAndReported) {
    EXPECT_TRUE(set("rack/one"));
    EXPECT_FALSE(set(""));
    EXPECT_EQ(get(), "");
}

TEST_P(RecordTexts, DoNotShareAField) {
    EXPECT_TRUE(set("mine"));
    for (const TextField& other : textFields) {
        if (other.set != GetParam().set) {
            EXPECT_EQ((record.*other.get)(), "") << other.name;
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Record, RecordTexts, testing::ValuesIn(textFields));

struct StateCode {
    unsigned int read;
    unsigned short stored;
};

void PrintTo(const StateCode& code, std::ostream* out) {
    *out << code.read << " as " << code.stored;
}

class RecordPowerState : public testing::TestWithParam<StateCode> {};

TEST_P(RecordPowerState, IsStoredAsTheModelCountsIt) {
    PowerStateManagement record;
    EXPECT_TRUE(record.setPowerState(GetParam().read));
    EXPECT_EQ(record.getPowerState(), GetParam().stored);
}

INSTANTIATE_TEST_SUITE_P(Record, RecordPowerState,
                         testing::Values(StateCode{1, 2}, StateCode{8, 7}, StateCode{10, 12}, StateCode{0, 1},
                                         StateCode{2, 1}, StateCode{7, 1}, StateCode{9, 1}, StateCode{11, 1},
                                         StateCode{12, 1}, StateCode{65537, 1}, StateCode{4294967295U, 1}));

TEST(Record, APowerStateThatWasNeverSetIsZero) {
    EXPECT_EQ(PowerStateManagement().getPowerState(), 0);
}

TEST(Record, ALaterPowerStateReplacesAnEarlierOne) {
    PowerStateManagement record;
    record.setPowerState(1);
    record.setPowerState(99);
    EXPECT_EQ(record.getPowerState(), 1);
}

TEST(Record, TheRequestedPowerStateIsAlways12) {
    PowerStateManagement record;
    record.setPowerState(1);
    EXPECT_EQ(record.getRequestedPowerState(), 12);
    EXPECT_EQ(record.getRequestedPowerState(), 12);
    EXPECT_EQ(record.getPowerState(), 2);
}

TEST(Record, TheSupportedStatesGrowWithEveryCall) {
    PowerStateManagement record;
    EXPECT_THAT(record.getPowerStatesSupported(), ElementsAre(2, 5, 8));
    EXPECT_THAT(record.getPowerStatesSupported(), ElementsAre(2, 5, 8, 2, 5, 8));
    EXPECT_THAT(record.getPowerChangeCapabilities(), ElementsAre(3, 4, 8));
}

TEST(Record, TheChangeCapabilitiesGrowWithEveryCall) {
    PowerStateManagement record;
    EXPECT_THAT(record.getPowerChangeCapabilities(), ElementsAre(3, 4, 8));
    EXPECT_THAT(record.getPowerChangeCapabilities(), ElementsAre(3, 4, 8, 3, 4, 8));
    EXPECT_THAT(record.getPowerStatesSupported(), ElementsAre(2, 5, 8));
}

TEST(Record, AListThatIsSetIsIgnored) {
    PowerStateManagement record;
    EXPECT_TRUE(record.setPowerStatesSupported({1, 2, 3, 4}));
    EXPECT_TRUE(record.setPowerChangeCapabilities({}));
    EXPECT_TRUE(record.setPowerChangeCapabilities({99}));
    EXPECT_THAT(record.getPowerStatesSupported(), ElementsAre(2, 5, 8));
    EXPECT_THAT(record.getPowerChangeCapabilities(), ElementsAre(3, 4, 8));
}

TEST(Record, ACopyHasEverythingAndSharesNothing) {
    PowerStateManagement record;
    record.setName("name");
    record.setElementName("element");
    record.setInstanceID("id");
    record.setCapabilitiesElementName("capabilities");
    record.setPowerState(10);
    PowerStateManagement before(record);
    record.getPowerStatesSupported();
    record.getPowerChangeCapabilities();
    PowerStateManagement after;
    after = record;
    record.setName("");

    for (PowerStateManagement* copy : {&before, &after}) {
        EXPECT_EQ(copy->getName(), "name");
        EXPECT_EQ(copy->getElementName(), "element");
        EXPECT_EQ(copy->getInstanceID(), "id");
        EXPECT_EQ(copy->getCapabilitiesElementName(), "capabilities");
        EXPECT_EQ(copy->getPowerState(), 12);
    }
    EXPECT_THAT(before.getPowerStatesSupported(), ElementsAre(2, 5, 8));
    EXPECT_THAT(before.getPowerChangeCapabilities(), ElementsAre(3, 4, 8));
    EXPECT_THAT(after.getPowerStatesSupported(), ElementsAre(2, 5, 8, 2, 5, 8));
    EXPECT_THAT(after.getPowerChangeCapabilities(), ElementsAre(3, 4, 8, 3, 4, 8));
}

TEST(Record, IsAPlainValue) {
    EXPECT_FALSE(std::is_polymorphic_v<PowerStateManagement>);
    EXPECT_TRUE(std::is_copy_constructible_v<PowerStateManagement>);
    EXPECT_TRUE(std::is_copy_assignable_v<PowerStateManagement>);
}

TEST(ProviderExceptionTest, OwnsItsText) {
    std::string text = "Failed while setting Name.";
    const ProviderException exception(text.c_str());
    text.assign(text.size(), 'x');
    EXPECT_STREQ(exception.what(), "Failed while setting Name.");
}

TEST(ProviderExceptionTest, ACopyOutlivesTheOriginal) {
    auto original = std::make_unique<ProviderException>("Failed while setting InstanceID.");
    const ProviderException copy(*original);
    original.reset();
    EXPECT_STREQ(copy.what(), "Failed while setting InstanceID.");
}

TEST(ProviderExceptionTest, IsCaughtAsStandardException) {
    try {
        throw ProviderException("the text");
    } catch (const std::exception& exception) {
        EXPECT_STREQ(exception.what(), "the text");
    }
}

} // namespace
} // namespace OrvTest
