// Repairing a movie by its location.

#include "ZULMetaDataBridge/Source/ZULMAtomRepair.h"

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <string>

namespace ZULMetaData::Test {

namespace {

class MovieRepair : public testing::Test {
protected:
    /// The movie after a repair that gives `result`.
    std::string repaired(const std::string& contents, bool result) {
        writeFile(movie, contents);
        EXPECT_EQ(ZULMAtomRepair::finalizeAtomsInFile(movie), result);
        return contentsOf(movie);
    }

    TemporaryFolder folder;
    const FileLocation movie = folder / "Recording.mp4";
};

TEST_F(MovieRepair, GivesAnOpenEndedAtomItsSize) {
    EXPECT_EQ(repaired(atom("ftyp", "mp42") + be32(0) + "mdat" + "0123456789", true), media());
}

TEST_F(MovieRepair, LeavesAConsistentMovieAsItIs) {
    EXPECT_EQ(repaired(media(), true), media());
}

TEST_F(MovieRepair, RefusesAMovieWhoseAtomsOverrunItsEnd) {
    const std::string overrun = media() + be32(100) + "free";
    EXPECT_EQ(repaired(overrun, false), overrun);
}

TEST_F(MovieRepair, RefusesALocationWhereNoMovieIs) {
    EXPECT_FALSE(ZULMAtomRepair::finalizeAtomsInFile(folder / "missing.mp4"));
    EXPECT_FALSE(ZULMAtomRepair::finalizeAtomsInFile(folder.path()));
    EXPECT_FALSE(ZULMAtomRepair::finalizeAtomsInFile(FileLocation()));
    EXPECT_FALSE(std::filesystem::exists(folder / "missing.mp4"));
}

TEST_F(MovieRepair, OpensAMovieByItsPathInUTF8) {
    writeFile(folder / "Caf\xC3\xA9.mp4", be32(0) + "mdat");
    EXPECT_TRUE(ZULMAtomRepair::finalizeAtomsInFile(FileLocation(folder.path()) / u8"Café.mp4"));
    EXPECT_EQ(contentsOf(folder / "Caf\xC3\xA9.mp4"), atom("mdat"));
}

} // namespace

} // namespace ZULMetaData::Test
