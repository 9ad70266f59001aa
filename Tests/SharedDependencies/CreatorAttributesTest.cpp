// The creator record: three texts in fixed fields.

#include "SharedDependencies/CreatorAttributes.h"

#include "Tests/Support/Bytes.h"

#include <gtest/gtest.h>

#include <cstddef>
#include <cstring>
#include <ostream>
#include <string>

namespace ZULMetaData::Test {

namespace {

using namespace Test;

std::string zeros(std::size_t count) {
    return std::string(count, '\0');
}

TEST(CreatorAttributes, BeginAsZeros) {
    EXPECT_EQ(raw(CreatorAttributes()), zeros(56));
}

TEST(CreatorAttributes, LieBehindEachOtherInFieldsOfFixedSize) {
    CreatorAttributes creator;
    creator.setName("Recorder");
    creator.setVersion("2021.0.4");
    creator.setPlatformVersion("11.2.3");
    EXPECT_EQ(raw(creator), "Recorder" + zeros(16) + "2021.0.4" + zeros(8) + "11.2.3" + zeros(10));
}

TEST(CreatorAttributes, AreReadBackFromTheBytesOfARecord) {
    const std::string bytes = "Recorder" + zeros(16) + "2021.0.4" + zeros(8) + "11.2.3" + zeros(10);
    CreatorAttributes creator;
    std::memcpy(&creator, bytes.data(), sizeof creator);
    EXPECT_EQ(creator.name(), "Recorder");
    EXPECT_EQ(creator.version(), "2021.0.4");
    EXPECT_EQ(creator.platformVersion(), "11.2.3");
}

TEST(CreatorAttributes, EndWithTheirFieldInARecordWithoutZeroBytes) {
    const std::string bytes = std::string(24, 'n') + std::string(16, 'v') + std::string(16, 'p');
    CreatorAttributes creator;
    std::memcpy(&creator, bytes.data(), sizeof creator);
    EXPECT_EQ(creator.name(), std::string(24, 'n'));
    EXPECT_EQ(creator.version(), std::string(16, 'v'));
    EXPECT_EQ(creator.platformVersion(), std::string(16, 'p'));
}

TEST(CreatorAttributes, NameThePlatform) {
    EXPECT_EQ(CreatorAttributes::platformNameMac(), "Mac");
}

// ---- What every field does ------------------------------------------------------------------------------------

struct TextField {
    const char* name;
    std::size_t offset;
    std::size_t size;
    void (CreatorAttributes::*set)(const std::string&);
    std::string (CreatorAttributes::*get)() const;

    friend void PrintTo(const TextField& field, std::ostream* out) { *out << field.name; }
};

class CreatorField : public testing::TestWithParam<TextField> {
protected:
    CreatorAttributes creator;

    const std::size_t longest = GetParam().size - 1; // a zero byte takes the last place

    void set(const std::string& text) { (creator.*GetParam().set)(text); }

    /// Checks the whole record: `text` in its field, zeros behind it and everywhere else.
    void expectStored(const std::string& text) const {
        std::string bytes = zeros(56);
        bytes.replace(GetParam().offset, text.size(), text);
        EXPECT_EQ(raw(creator), bytes);
        EXPECT_EQ((creator.*GetParam().get)(), text);
    }

    /// Puts `character` at every place where it ends at, in front of or behind the last byte of the field's text.
    void expectStoredWholeOrNotAtAll(const std::string& character) {
        for (std::size_t start = longest - character.size(); start <= longest; ++start) {
            const std::string before(start, 'a');
            SCOPED_TRACE(start);
            set(before + character + "and more");
            expectStored(start + character.size() == longest ? before + character : before);
        }
    }
};

TEST_P(CreatorField, IsEmptyAtFirst) {
    expectStored("");
}

TEST_P(CreatorField, HoldsAText) {
    set("1.2");
    expectStored("1.2");
}

TEST_P(CreatorField, HoldsATextThatFitsExactly) {
    const std::string text = std::string(longest - 1, 'a') + 'z';
    set(text);
    expectStored(text);
}

TEST_P(CreatorField, CutsATextThatIsOneByteTooLong) {
    set(std::string(longest, 'a') + 'z');
    expectStored(std::string(longest, 'a'));
}

TEST_P(CreatorField, CutsATextLongerThanTheWholeRecord) {
    set(std::string(1000, 'a'));
    expectStored(std::string(longest, 'a'));
}

TEST_P(CreatorField, CutsInFrontOfACharacterOfTwoBytes) {
    expectStoredWholeOrNotAtAll("\xc3\xbc");
}

TEST_P(CreatorField, CutsInFrontOfACharacterOfThreeBytes) {
    expectStoredWholeOrNotAtAll("\xe2\x82\xac");
}

TEST_P(CreatorField, CutsInFrontOfACharacterOfFourBytes) {
    expectStoredWholeOrNotAtAll("\xf0\x9f\x8e\xa5");
}

TEST_P(CreatorField, HoldsATextWhoseLastCharacterOfFourBytesFitsExactly) {
    const std::string text = std::string(longest - 4, 'a') + "\xf0\x9f\x8e\xa5";
    set(text);
    expectStored(text);
}

TEST_P(CreatorField, KeepsNothingOfALongerTextBefore) {
    set(std::string(longest, 'a'));
    set("b");
    expectStored("b");
    set("");
    expectStored("");
}

TEST_P(CreatorField, LeavesItsNeighboursAlone) {
    creator.setName(std::string(23, 'n'));
    creator.setVersion(std::string(15, 'v'));
    creator.setPlatformVersion(std::string(15, 'p'));
    set(std::string(100, 'x'));
    std::string bytes = std::string(23, 'n') + '\0' + std::string(15, 'v') + '\0' + std::string(15, 'p') + '\0';
    bytes.replace(GetParam().offset, longest, longest, 'x');
    EXPECT_EQ(raw(creator), bytes);
}

INSTANTIATE_TEST_SUITE_P(
    Every, CreatorField,
    testing::Values(TextField{"name", 0, 24, &CreatorAttributes::setName, &CreatorAttributes::name},
                    TextField{"version", 24, 16, &CreatorAttributes::setVersion, &CreatorAttributes::version},
                    TextField{"platformVersion", 40, 16, &CreatorAttributes::setPlatformVersion,
                              &CreatorAttributes::platformVersion}),
    [](const testing::TestParamInfo<TextField>& field) { return field.param.name; });

} // namespace

} // namespace ZULMetaData::Test
