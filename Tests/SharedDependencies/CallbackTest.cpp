#include "SharedDependencies/Callback.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <stdexcept>
#include <string>

namespace ZULMetaData {
namespace {

using Count = Callback<std::size_t(const std::string&)>;

std::size_t lengthOf(const std::string& text) {
    return text.size();
}

TEST(Callback, callsWhatItHolds) {
    EXPECT_EQ(Count(lengthOf)("abc"), 3u);
    EXPECT_EQ(Count([](const std::string& text) { return text.size() + 1; })("abc"), 4u);
    EXPECT_EQ(Count([more = std::size_t{7}](const std::string& text) { return text.size() + more; })("abc"), 10u);
    EXPECT_EQ(Count(std::function<std::size_t(const std::string&)>(lengthOf))("abc"), 3u);
}

TEST(Callback, isEmptyUnlessItHoldsSomething) {
    EXPECT_FALSE(Count());
    EXPECT_FALSE(Count(nullptr));
    EXPECT_FALSE(Count(static_cast<std::size_t (*)(const std::string&)>(nullptr)));
    EXPECT_FALSE(Count(std::function<std::size_t(const std::string&)>()));
    EXPECT_TRUE(Count(lengthOf));
    EXPECT_TRUE(Count([](const std::string&) { return 0; }));
}

TEST(Callback, copiesShareWhatTheyHold) {
    auto state = std::make_shared<int>(0);
    const Callback<int()> first = [state, own = 0]() mutable { return ++own + (*state += 10); };
    const Callback<int()> second = first;
    EXPECT_EQ(first(), 11);
    EXPECT_EQ(second(), 22);
}

TEST(Callback, takesArgumentsThatCanOnlyBeMoved) {
    const Callback<int(std::unique_ptr<int>)> take = [](std::unique_ptr<int> number) { return *number; };
    EXPECT_EQ(take(std::make_unique<int>(5)), 5);
}

TEST(Callback, ignoresAResultThatIsNotWanted) {
    int calls = 0;
    const Callback<void()> count = [&calls] { return ++calls; };
    count();
    EXPECT_EQ(calls, 1);
}

TEST(Callback, letsExceptionsThrough) {
    const Callback<void()> fail = [] { throw std::runtime_error("no"); };
    EXPECT_THROW(fail(), std::runtime_error);
}

static_assert(!std::is_constructible_v<Count, int>);
static_assert(!std::is_constructible_v<Count, std::function<void(int)>>);

} // namespace
} // namespace ZULMetaData
