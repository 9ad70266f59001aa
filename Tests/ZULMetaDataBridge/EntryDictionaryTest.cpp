#include "ZULMetaDataBridge/Source/EntryDictionary.h"
#include "Platform/Image.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdint>
#include <iterator>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <utility>
#include <variant>
#include <vector>

namespace ZULMetaData::Test {

namespace {

using testing::ElementsAre;

class EntryDictionaries : public testing::Test {
protected:
    const EntryKeys keys{"image", "id", "x", "title", "timestamp"};
    const std::shared_ptr<const Image> image =
        std::make_shared<const Image>(1, 1, std::vector<std::uint8_t>{1, 2, 3, 4});
    const EntryDictionary entry{keys, {image, std::int64_t{1} << 40, std::int32_t{-7}, std::string("Intro"), 0.25F}};

    const EntryKeys pointKeys{"x", "y"};
    const EntryDictionary point{pointKeys, {std::int32_t{1}, std::int32_t{2}}};

    const EntryKeys locationKeys{"x", "timestamp"};
    const EntryDictionary location = EntryDictionary::ofNumbers(locationKeys, {std::int32_t{-7}, 0.25F});
};

TEST_F(EntryDictionaries, GiveEveryValueByItsKey) {
    EXPECT_EQ(entry.at("image"), EntryValue(image));
    EXPECT_EQ(entry.at("id"), EntryValue(std::int64_t{1099511627776}));
    EXPECT_EQ(entry.at("x"), EntryValue(std::int32_t{-7}));
    EXPECT_EQ(entry.at("title"), EntryValue(std::string("Intro")));
    EXPECT_EQ(entry.at("timestamp"), EntryValue(0.25F));
}

TEST_F(EntryDictionaries, GiveEveryValueAsItsType) {
    EXPECT_EQ(entry.get<std::shared_ptr<const Image>>("image"), image);
    EXPECT_EQ(entry.get<std::int64_t>("id"), 1099511627776);
    EXPECT_EQ(entry.get<std::int32_t>("x"), -7);
    EXPECT_EQ(entry.get<std::string>("title"), "Intro");
    EXPECT_EQ(entry.get<float>("timestamp"), 0.25F);
}

TEST_F(EntryDictionaries, RefuseAKeyThatTheyLack) {
    for (const std::string key : {"", "y", "X", "ti", "titles", "timestamp "}) {
        EXPECT_THROW(entry.at(key), std::out_of_range) << key;
        EXPECT_THROW(entry.get<float>(key), std::out_of_range) << key;
        EXPECT_EQ(entry.find(key), entry.end()) << key;
        EXPECT_FALSE(entry.contains(key)) << key;
    }
}

TEST_F(EntryDictionaries, NameTheKeyThatTheyLack) {
    try {
        entry.at("height");
        ADD_FAILURE() << "no exception";
    } catch (const std::out_of_range& error) {
        EXPECT_THAT(error.what(), testing::HasSubstr("height"));
    }
}

TEST_F(EntryDictionaries, RefuseAnotherType) {
    EXPECT_THROW(entry.get<std::int32_t>("id"), std::bad_variant_access);
    EXPECT_THROW(entry.get<std::int64_t>("x"), std::bad_variant_access);
    EXPECT_THROW(entry.get<float>("title"), std::bad_variant_access);
    EXPECT_THROW(entry.get<std::string>("image"), std::bad_variant_access);
    EXPECT_THROW(entry.get<std::shared_ptr<const Image>>("timestamp"), std::bad_variant_access);
}

TEST_F(EntryDictionaries, FindAPairOfKeyAndValue) {
    const auto found = entry.find("x");
    ASSERT_NE(found, entry.end());
    EXPECT_EQ(found->first, "x");
    EXPECT_EQ(found->second, EntryValue(std::int32_t{-7}));
    EXPECT_EQ((*found).first, "x");
    EXPECT_EQ((*found).second, EntryValue(std::int32_t{-7}));
    EXPECT_TRUE(entry.contains("x"));
}

TEST_F(EntryDictionaries, HaveAsManyValuesAsKeys) {
    EXPECT_EQ(entry.size(), 5U);
    EXPECT_EQ(point.size(), 2U);
    EXPECT_EQ(std::distance(entry.begin(), entry.end()), 5);
    EXPECT_EQ(std::distance(point.begin(), point.end()), 2);
}

TEST_F(EntryDictionaries, AreWalkedInTheOrderOfTheirKeys) {
    std::vector<std::string> walked;
    for (const auto& [key, value] : entry) {
        walked.push_back(key);
        EXPECT_EQ(value, entry.at(key));
    }
    EXPECT_EQ(walked, keys);
}

TEST_F(EntryDictionaries, AreWalkedStepByStep) {
    static_assert(std::input_iterator<EntryDictionary::const_iterator>);
    auto at = point.begin();
    EXPECT_EQ((at++)->first, "x");
    EXPECT_EQ(at->first, "y");
    EXPECT_EQ(++at, point.end());
    EXPECT_EQ(EntryDictionary::const_iterator(), EntryDictionary::const_iterator());
    EXPECT_NE(EntryDictionary::const_iterator(), point.begin());
}

TEST_F(EntryDictionaries, OfNumbersGiveThemInEveryWay) {
    EXPECT_EQ(location.get<std::int32_t>("x"), -7);
    EXPECT_EQ(location.get<float>("timestamp"), 0.25F);
    EXPECT_THROW(location.get<float>("x"), std::bad_variant_access);
    EXPECT_THROW(location.get<std::string>("timestamp"), std::bad_variant_access);
    EXPECT_THROW(location.get<std::int32_t>("y"), std::out_of_range);
    EXPECT_EQ(location.at("x"), EntryValue(std::int32_t{-7}));
    EXPECT_EQ(location.find("timestamp")->second, EntryValue(0.25F));
    EXPECT_EQ(location.get<std::int32_t>("x"), -7) << "again, now that there are values";
    EXPECT_THROW(location.get<std::int64_t>("x"), std::bad_variant_access);
}

TEST_F(EntryDictionaries, OfNumbersGiveOneAndTheSameValueToAllWhoAsk) {
    std::vector<const EntryValue*> given(8);
    std::vector<std::thread> threads;
    for (const EntryValue*& value : given)
        threads.emplace_back([&] { value = &location.at("x"); });
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_THAT(given, testing::Each(&location.at("x")));
}

TEST_F(EntryDictionaries, OfNumbersAreCopiedAndMovedBeforeAndAfterTheyWereAskedFor) {
    for (int asked = 0; asked < 2; ++asked) {
        EntryDictionary copy = location;
        EntryDictionary moved = std::move(copy);
        EntryDictionary assigned = point;
        assigned = moved;
        moved = EntryDictionary(point);
        EXPECT_EQ(assigned.at("x"), EntryValue(std::int32_t{-7}));
        EXPECT_EQ(assigned.get<float>("timestamp"), 0.25F);
        EXPECT_EQ(moved.at("y"), EntryValue(std::int32_t{2}));
        EXPECT_EQ(location.at("timestamp"), EntryValue(0.25F));
    }
}

TEST_F(EntryDictionaries, AreCopiedWithTheirValues) {
    EntryList list{entry, point};
    list.front() = point;
    EXPECT_EQ(list.front().get<std::int32_t>("y"), 2);
    EXPECT_EQ(list.front().size(), 2U);
    EXPECT_EQ(entry.get<std::string>("title"), "Intro");
    EXPECT_NE(entry.find("x"), EntryDictionary(entry).find("x")) << "iterators belong to one entry";
}

} // namespace

} // namespace ZULMetaData::Test
