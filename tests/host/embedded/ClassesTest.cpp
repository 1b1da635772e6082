#include <optional>

#include "hosts/embedded/Classes.hpp"
#include "tests/host/embedded/OwnClassFixture.hpp"

// Instances and their native objects.
namespace tessel::embedded {

namespace {

class ClassesTest : public OwnClassTest {};

}  // namespace

TEST_F(ClassesTest, NativeObjectGoesWithTheLastValue) {
    define();
    std::optional<Value> first = host_.construct(counterName);
    std::optional<Value> second = *first;
    Value cell = Value::cell({1, 1});
    cell.setElement(0, *second);
    first.reset();
    second.reset();
    EXPECT_EQ(behaviour_.destroyed, 0);
    cell = Value();
    EXPECT_EQ(behaviour_.destroyed, 1);
    EXPECT_EQ(behaviour_.made, 1);
}

TEST_F(ClassesTest, DestroyedInstanceIsDestroyedOnce) {
    define();
    {
        const Value instance = host_.construct(counterName);
        host_.destroy(instance);
        EXPECT_EQ(behaviour_.destroyed, 1);
    }
    EXPECT_EQ(behaviour_.destroyed, 1);
}

}  // namespace tessel::embedded
