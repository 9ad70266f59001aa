// A recorder that ended in the middle of an entry, in every stream at once: its movie was never given its size, its
// stream files end somewhere. The safe save, then the parsers.

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaDataBridge/EntriesAsText.h"
#include "Tests/ZULMetaDataBridge/KindSamples.h"
#include "ZULMetaDataBridge/Source/SafeMovieSave.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <string>
#include <tuple>
#include <vector>

namespace ZULMetaData::Test {

namespace {

class CrashedRecording : public testing::Test {
protected:
    CrashedRecording() { leaveMovie(); }

    void leaveMovie() const { writeFile(movie, atom("ftyp", "mp42") + be32(0) + "mdat" + "0123456789"); }

    template <class Visit>
    static void forEachKind(Visit visit) {
        [&]<class... Samples>(std::tuple<Samples...>*) {
            (visit.template operator()<Samples>(), ...);
        }(static_cast<EveryKind*>(nullptr));
    }

    /// Every stream, `bytesLost` short of its end, or down to its header.
    std::vector<std::string> streamsCutBy(std::size_t bytesLost) const {
        std::vector<std::string> files;
        forEachKind([&]<class Samples>() {
            const std::string whole = goldenStream<Samples>();
            files.push_back(folder / std::string(Samples::name));
            writeFile(files.back(), whole.substr(0, std::max(Samples::header().size(), whole.size() - bytesLost)));
        });
        return files;
    }

    void attachSafely(const std::vector<std::string>& files) const {
        std::vector<StreamSource> sources;
        for (const std::string& file : files)
            sources.push_back(StreamSource::file(file).unchecked());
        SafeMovieSave(movie).attach(sources);
    }

    /// The entries whose bytes are all there.
    template <class Samples>
    static std::vector<std::string> entriesBefore(std::size_t bytesLost) {
        const std::size_t end = goldenStream<Samples>().size() - bytesLost;
        std::vector<std::string> entries;
        std::size_t position = Samples::header().size();
        for (const auto& sample : Samples::samples()) {
            position += sample.bytes.size();
            if (position <= end)
                entries.push_back(sample.entry);
        }
        return entries;
    }

    TemporaryFolder folder;
    FileLocation movie = FileLocation(folder / "Recording.mp4");
};

TEST_F(CrashedRecording, GivesEveryStreamBackUpToItsLastWholeEntry) {
    for (const std::size_t bytesLost : {std::size_t{1}, std::size_t{3}, std::size_t{9}, std::size_t{11}}) {
        leaveMovie();
        attachSafely(streamsCutBy(bytesLost));
        forEachKind([&]<class Samples>() {
            EXPECT_EQ(asTexts(*typename Samples::Parser(movie).read()), entriesBefore<Samples>(bytesLost))
                << Samples::name << " without its last " << bytesLost << " bytes";
        });
    }
}

TEST_F(CrashedRecording, LosesStreamsWhereTheTornFilesAreAppendedAsTheyAre) {
    std::vector<FileLocation> files;
    for (const std::string& file : streamsCutBy(1))
        files.emplace_back(file);
    ZULMAtomRepair::finalizeAtomsInFile(movie);
    ZULMAtomWriter().writeMetaDataFiles(files, movie);
    EXPECT_LT(MetaDataParser::create(movie.string())->getAvailableMetaDataUUIDs().size(), files.size());
}

TEST_F(CrashedRecording, HoldsNothingDamagedAfterTheSafeSave) {
    attachSafely(streamsCutBy(1));
    EXPECT_EQ(validateRecording(movie).damageCount, 0U);
}

} // namespace

} // namespace ZULMetaData::Test
