// Movies of nothing but the smallest atoms, some of which end inside their own header: every walk reads each part of
// the file about once.

#include "ZULMetaData/PositionedInput.h"
#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "ZULMetaData/Containers/ContainerLayout.h"
#include "ZULMetaData/Containers/RepairPlan.h"
#include "ZULMetaData/ZULMMetaDataParser.h"

#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <fstream>
#include <istream>
#include <string>

namespace ZULMetaData::Test {

namespace {

constexpr std::size_t s_size = 1 << 20;

/// Counts how often the file is read.
class CountedFile final : public std::filebuf {
public:
    std::size_t reads() const { return reads_; }

protected:
    int_type underflow() override {
        ++reads_;
        return std::filebuf::underflow();
    }

private:
    std::size_t reads_ = 0;
};

class SmallAtoms : public testing::Test {
protected:
    std::istream& movieOf(const std::string& repeated) {
        std::string bytes;
        while (bytes.size() < s_size)
            bytes += repeated;
        writeFile(folder / "movie.mp4", bytes);
        file.open(folder / "movie.mp4", std::ios_base::in | std::ios_base::binary);
        stream.rdbuf(&file);
        return stream;
    }

    /// Twice 4 KiB at most are read for 4 KiB of the file, and some more at its ends.
    ~SmallAtoms() override { EXPECT_LT(file.reads(), 2 * s_size / 4096 + 100); }

    TemporaryFolder folder;
    CountedFile file;
    std::istream stream{nullptr};
    const std::string empty = be32(8) + "free";
    const std::string overlapping = be64(8); // the extended size of one is the header of the next
};

TEST_F(SmallAtoms, AreScannedInOnePass) {
    EXPECT_NE(MetaDataParser::create(movieOf(overlapping), MetaDataParser::QuickTime), nullptr);
}

TEST_F(SmallAtoms, AreListedInOnePass) {
    EXPECT_EQ(topLevelItems(ByteSource::stream(movieOf(overlapping)), Container::QuickTime).size(), s_size / 8);
}

TEST_F(SmallAtoms, AreConsideredForARepairInOnePass) {
    EXPECT_EQ(planRepair(ByteSource::stream(movieOf(empty))).state, RepairPlan::Whole);
}

TEST_F(SmallAtoms, MayEndInsideTheirOwnHeaders) {
    detail::PositionedInput input(movieOf(be32(4)), 0, s_size);
    std::uint32_t size = 0;
    std::uint32_t type = 0;
    while (input.enoughBytesLeft(8)) {
        const std::uint64_t start = input.position();
        ASSERT_TRUE(input.readBigEndian(size) && input.readBigEndian(type));
        ASSERT_EQ(size, 4U);
        ASSERT_TRUE(input.moveTo(start + size));
    }
    EXPECT_EQ(input.position(), s_size - 4);
}

} // namespace

} // namespace ZULMetaData::Test
