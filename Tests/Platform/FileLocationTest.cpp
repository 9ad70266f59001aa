#include "Platform/FileLocation.h"

#include <gtest/gtest.h>

namespace ZULMetaData::Test {

namespace {

TEST(FileLocation, GivesItsPathAsUTF8) {
    EXPECT_EQ(utf8Path(FileLocation(u8"/films/Café/記録.mov")), "/films/Caf\xC3\xA9/\xE8\xA8\x98\xE9\x8C\xB2.mov");
}

TEST(FileLocation, GivesAPathOfPlainTextUnchanged) {
    EXPECT_EQ(utf8Path("folder with blanks/../a.dat"), "folder with blanks/../a.dat");
}

TEST(FileLocation, GivesNoTextForNoLocation) {
    EXPECT_EQ(utf8Path(FileLocation()), "");
}

TEST(FileLocation, KeepsBytesThatAreNotUTF8) {
    EXPECT_EQ(utf8Path(FileLocation("/films/\xFF\xC3.mov")), "/films/\xFF\xC3.mov");
}

} // namespace

} // namespace ZULMetaData::Test
