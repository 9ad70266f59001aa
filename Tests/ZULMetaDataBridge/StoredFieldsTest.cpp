// The fields of entries with the values that are stored.

#include "ZULMetaDataBridge/Source/StoredFields.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <concepts>
#include <sstream>
#include <string>
#include <vector>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;

/// Returns "key=value" for every field; the image of a cursor is its number of bytes.
template <class Kind>
std::vector<std::string> fieldsOf(const typename Kind::Value& value) {
    std::vector<std::string> fields;
    visitStoredFields<Kind>(value, [&fields]<class Stored>(const char* key, const Stored& stored) {
        std::ostringstream field;
        field << key << '=';
        if constexpr (std::same_as<Stored, CursorImage>)
            field << stored.imageDataSize << " bytes";
        else
            field << stored;
        fields.push_back(field.str());
    });
    return fields;
}

TEST(StoredFields, AreTheNumbersOfAPoint) {
    EXPECT_THAT(fieldsOf<CursorLocationKind>({-3, 70000}), ElementsAre("x=-3", "y=70000"));
}

TEST(StoredFields, KeepTextsAfterTheirFirstZeroByte) {
    using namespace std::string_literals;
    EXPECT_THAT(fieldsOf<TopmostAppNameKind>("a\0b"s), ElementsAre("name=a\0b"s));
}

TEST(StoredFields, NameAKeyByItsCodeAndItsFlags) {
    EXPECT_THAT(fieldsOf<KeyboardActionKind>({119, 0}),
                ElementsAre("characterCode=119", "characterString=w", "eventFlagsCode=0", "eventFlagsString=NONE"));
    EXPECT_EQ(fieldsOf<KeyboardActionKind>({119, 0x40000000})[1], "characterString=f8");
}

TEST(StoredFields, AreEmptyTextsIfAListEndsBeforeThem) {
    EXPECT_THAT(fieldsOf<SystemDataKind>({"\xe9t\xe9"}),
                ElementsAre(testing::EndsWith("=\xc3\xa9t\xc3\xa9"), testing::EndsWith("="), testing::EndsWith("="),
                            testing::EndsWith("=")));
}

TEST(StoredFields, HaveTheCursorInPlaceOfItsImage) {
    CursorImage cursor;
    cursor.uniqueId = 18446744073709551615U;
    EXPECT_THAT(fieldsOf<CursorImageKind>(cursor), testing::Contains("id=18446744073709551615"));
    EXPECT_THAT(fieldsOf<CursorImageKind>(cursor), testing::Contains("image=0 bytes"));
}

} // namespace
} // namespace ZULMetaData::Test
