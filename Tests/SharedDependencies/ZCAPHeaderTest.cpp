// The recording info as it lies in memory and on disk.

#include "SharedDependencies/ZCAPHeader.h"

#include "Tests/Support/Bytes.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>

namespace ZULMetaData::Test {

namespace {

std::string zeros(std::size_t count) {
    return std::string(count, '\0');
}

TEST(ZCAPHeader, BeginsAsZeros) {
    EXPECT_EQ(raw(ZCAPHeader()), zeros(64));
}

TEST(ZCAPHeader, HoldsItsVersionAndThenTheCreator) {
    ZCAPHeader header;
    header.headerVersion = 0x0102;
    header.creator.setName("Recorder");
    header.creator.setVersion("2021.0.4");
    header.creator.setPlatformVersion("11.2.3");
    EXPECT_EQ(raw(header),
              hex("0201000000000000") + "Recorder" + zeros(16) + "2021.0.4" + zeros(8) + "11.2.3" + zeros(10));
}

TEST(ZCAPHeader, HoldsAVersionOf64Bits) {
    ZCAPHeader header;
    header.headerVersion = -2;
    EXPECT_EQ(raw(header), hex("feffffffffffffff") + zeros(56));
    header.headerVersion = 0x0123456789abcdef;
    EXPECT_EQ(raw(header), hex("efcdab8967452301") + zeros(56));
}

TEST(ZCAPHeader, IsReadAsItLiesOnDisk) {
    const std::string bytes =
        hex("0300000000000000") + "Recorder" + zeros(16) + "2021.0.4" + zeros(8) + "11.2.3" + zeros(10);
    ZCAPHeader header;
    std::memcpy(&header, bytes.data(), sizeof header);
    EXPECT_EQ(header.headerVersion, 3);
    EXPECT_EQ(header.creator.name(), "Recorder");
    EXPECT_EQ(header.creator.version(), "2021.0.4");
    EXPECT_EQ(header.creator.platformVersion(), "11.2.3");
}

} // namespace

} // namespace ZULMetaData::Test
