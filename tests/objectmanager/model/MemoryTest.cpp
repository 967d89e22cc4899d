/* Where values lie, and what becomes of them when their memory ends. */
#include "NoOtherMemory.h"
#include "model/Model.h"

#include <gtest/gtest.h>

#include <memory_resource>
#include <optional>

namespace ObjectManager {
namespace {

/** Longer than what a text holds without memory. */
constexpr const char* longText = "a text that does not fit into a small string";

ObjectPath somePath() {
    return {longText, longText, longText, {{longText, stringValue(longText)}}};
}

/** Has every kind of content that lies in memory. */
Instance someInstance() {
    return {somePath(),
            {{longText, stringValue(longText)},
             {"Reference", referenceValue(somePath())},
             {"Embedded", instanceValue({somePath(), {{"Name", stringValue(longText)}}})},
             {"Array", arrayValue(CMPI_string, {stringValue(longText), nullValue(CMPI_string)})},
             {"Number", unsignedValue(CMPI_uint16, 5)}}};
}

class ModelMemoryTest : public testing::Test {
protected:
    const Instance original = someInstance();
    std::optional<std::pmr::monotonic_buffer_resource> memory{std::in_place, std::pmr::new_delete_resource()};
};

TEST_F(ModelMemoryTest, ACopyWithAnAllocatorLiesInItsMemoryAlone) {
    const NoOtherMemory none;
    const Instance copy(original, &*memory);
    EXPECT_EQ(original, copy);
}

TEST_F(ModelMemoryTest, ACopyWithoutAnAllocatorOutlivesTheMemory) {
    std::optional<Instance> inMemory(std::in_place, original, &*memory);
    const Instance copy = *inMemory;
    inMemory.reset();
    memory.reset();
    EXPECT_EQ(original, copy);
}

TEST_F(ModelMemoryTest, WhatIsMovedToAnotherMemoryOutlivesItsOwn) {
    std::optional<Instance> inMemory(std::in_place, original, &*memory);
    const Instance moved(std::move(*inMemory), std::pmr::new_delete_resource());
    inMemory.reset();
    memory.reset();
    EXPECT_EQ(original, moved);
}

TEST_F(ModelMemoryTest, AContainerKeepsWhatIsAddedInItsMemory) {
    const NoOtherMemory none;
    NamedValues values(&*memory);
    for (const NamedValue& property : original.properties) {
        values.push_back(property);
        values.emplace_back(longText, property.value);
        values.emplace_back(longText, Value(property.value, &*memory));
    }
    ASSERT_EQ(3 * original.properties.size(), values.size());
    EXPECT_EQ(original.properties.back(), values[values.size() - 3]);
}

TEST_F(ModelMemoryTest, AReferenceThatIsAssignedIsACopy) {
    Value first = referenceValue(somePath());
    const Value second = referenceValue({"", "root", "Other", {}});
    first = second;
    EXPECT_EQ(second, first);
    EXPECT_NE(&*std::get<Box<ObjectPath>>(first.content), &*std::get<Box<ObjectPath>>(second.content));
}

} // namespace
} // namespace ObjectManager
