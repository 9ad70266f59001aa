// Reading the recording info atoms of a movie.

#include "ZULMetaData/Containers/RecordingInfo.h"

#include "Tests/Support/Bytes.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gtest/gtest.h>

#include <sstream>

namespace ZULMetaData::Test {
namespace {

/// The info of a header version, as it is stored.
std::string info(std::uint64_t version) {
    return le64(version) + std::string(56, '\0');
}

/// The header versions of the infos that are found.
std::vector<std::int64_t> versionsIn(const std::string& bytes,
                                     MetaDataParser::StreamType type = MetaDataParser::QuickTime) {
    std::istringstream stream(bytes);
    const auto parser = MetaDataParser::create(stream, type);
    std::vector<std::int64_t> versions;
    for (const ZCAPHeader& header : readRecordingInfo(*parser))
        versions.push_back(header.headerVersion);
    return versions;
}

using Versions = std::vector<std::int64_t>;

TEST(RecordingInfo, IsReadFromEveryAtomInTheirOrder) {
    EXPECT_EQ(versionsIn(media() + extendedAtom("ZULR", info(1)) + atom("free") + atom("ZULR", info(2))),
              (Versions{1, 2}));
    EXPECT_EQ(versionsIn(media()), Versions());
}

TEST(RecordingInfo, MayHaveBytesBehindIt) {
    EXPECT_EQ(versionsIn(extendedAtom("ZULR", info(3) + "more")), Versions{3});
}

TEST(RecordingInfo, IsNotReadFromAnAtomThatIsTooSmall) {
    EXPECT_EQ(versionsIn(extendedAtom("ZULR", info(1).substr(1)) + extendedAtom("ZULR", info(2))), Versions{2});
}

TEST(RecordingInfo, IsNotReadFromAnAtomThatIsCutShort) {
    EXPECT_EQ(versionsIn(extendedAtom("ZULR", info(1)) + extendedAtom("ZULR", info(2)).substr(0, 79)), Versions{1});
}

TEST(RecordingInfo, IsOnlyInMovies) {
    EXPECT_EQ(versionsIn(chunk("ZULR", info(1)), MetaDataParser::RawStream), Versions());
}

} // namespace
} // namespace ZULMetaData::Test
