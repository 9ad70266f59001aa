// Recordings that are written anew with less metadata.

#include "ZULMetaDataBridge/Source/RecordingCompaction.h"

#include "Tests/Support/Bytes.h"
#include "Tests/Support/FileSizeLimit.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gtest/gtest.h>

#include <optional>

namespace ZULMetaData::Test {

namespace {

using Reason = CompactionError::Reason;

class RecordingCompactionTest : public testing::Test {
protected:
    /// Writes the recording anew and returns the copy's bytes.
    std::string compacted(const std::string& name, const std::string& bytes, KeptMetaData kept = KeptMetaData::Newest) {
        writeFile(folder / name, bytes);
        RecordingFile recording(folder / name);
        RecordingCompaction compaction(recording, kept);
        const std::string copy = folder / ("Copy-" + name);
        writeFile(copy, bytes.substr(0, static_cast<std::size_t>(compaction.copiedBytes())));
        compaction.complete(copy);
        bytesCut = compaction.bytesCut();
        EXPECT_EQ(compaction.sizeAfter(), contentsOf(copy).size());
        return contentsOf(copy);
    }

    std::optional<Reason> refusal(const std::string& name, const std::string& bytes) {
        try {
            compacted(name, bytes);
        } catch (const CompactionError& error) {
            return error.reason();
        }
        return std::nullopt;
    }

    TemporaryFolder folder;
    std::uint64_t bytesCut = 0;
};

TEST_F(RecordingCompactionTest, KeepsTheNewestStreamOfEachKind) {
    const std::string other = streamHeader(s_cursorLocations, 1, 16) + pointEntry(9, 9, 9);
    EXPECT_EQ(compacted("a.mp4", media() + zulmAtom({other}) + zulmAtom({locationStream()})),
              media() + zulmAtom({locationStream()}));
    EXPECT_EQ(compacted("a.avi", riffMedia() + zulmChunk({other}) + zulmChunk({locationStream()})),
              riffMedia() + zulmChunk({locationStream()}));
}

TEST_F(RecordingCompactionTest, LeavesTheMediaAloneWithoutAnyMetaData) {
    EXPECT_EQ(compacted("a.mp4", media() + zulmAtom({locationStream()}), KeptMetaData::Nothing), media());
    EXPECT_EQ(compacted("a.avi", riffMedia() + zulmChunk({locationStream()}), KeptMetaData::Nothing), riffMedia());
}

TEST_F(RecordingCompactionTest, KeepsWhoMadeTheRecordingWithoutTheStreams) {
    const std::string creator = atom("ZULR", std::string(64, 'c'));
    EXPECT_EQ(compacted("a.mp4", media() + creator + zulmAtom({locationStream()}), KeptMetaData::Creators),
              media() + creator);
    EXPECT_EQ(compacted("b.mp4", media() + zulmAtom({locationStream()}) + creator, KeptMetaData::Creators),
              media() + creator);
    const std::string streams = zulmAtom({locationStream()});
    const std::string blank = be32(1) + "free" + be64(streams.size()) + std::string(streams.size() - 16, '\0');
    EXPECT_EQ(compacted("c.mp4", creator + streams + media(), KeptMetaData::Creators), creator + blank + media());
}

TEST_F(RecordingCompactionTest, LeavesOutAnEntryThatIsIncomplete) {
    EXPECT_EQ(compacted("a.avi", riffMedia() + zulmChunk({locationStream() + "12"})),
              riffMedia() + zulmChunk({locationStream()}));
    EXPECT_EQ(bytesCut, 2U);
}

TEST_F(RecordingCompactionTest, KeepsEntriesThatCannotBeToldApart) {
    const std::string wrongSize = streamHeader(s_appNames, 1, 12) + textEntry(1, "text");
    EXPECT_EQ(compacted("a.avi", riffMedia() + zulmChunk({wrongSize})), riffMedia() + zulmChunk({wrongSize}));
    EXPECT_EQ(bytesCut, 0U);
}

TEST_F(RecordingCompactionTest, SaysWhyItCannotWriteACopy) {
    EXPECT_EQ(refusal("a.dat", locationStream()), Reason::NoContainer);
    EXPECT_EQ(refusal("a.mp4", media() + be32(0) + "mdat1234"), Reason::Repairable);
    EXPECT_EQ(refusal("b.mp4", media() + be32(100) + "mdat1234"), Reason::Damaged);
}

TEST_F(RecordingCompactionTest, SaysThatADiskIsFull) {
    for (const auto& [name, bytes] :
         {std::pair<std::string, std::string>{"a.mp4", media() + zulmAtom({locationStream()})},
          {"a.avi", riffMedia() + zulmChunk({locationStream()})}}) {
        writeFile(folder / name, bytes);
        RecordingFile recording(folder / name);
        RecordingCompaction compaction(recording, KeptMetaData::Newest);
        const std::string copy = folder / ("Copy-" + name);
        writeFile(copy, bytes.substr(0, static_cast<std::size_t>(compaction.copiedBytes())));
        const FileSizeLimit limited(compaction.copiedBytes() + 20);
        try {
            compaction.complete(copy);
            ADD_FAILURE() << name;
        } catch (const CompactionError& error) {
            EXPECT_EQ(error.reason(), Reason::CannotWrite) << error.what();
        }
    }
}

} // namespace

} // namespace ZULMetaData::Test
