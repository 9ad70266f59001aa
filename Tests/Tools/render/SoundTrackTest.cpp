// Runs ffmpeg, which makes movies whose samples count upward.

#include "Tools/render/SoundTrack.h"

#include "Tests/Support/Files.h"
#include "Tools/zulm/SoundTempo.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <memory>

namespace Render::Test {
namespace {

using ZULMetaData::EditList;

constexpr int s_rate = 8000;
constexpr int s_samples = 2 * s_rate; // 2 s

/// A movie with two seconds of sound without loss: sample i is i on the left, and -i on the right.
class SoundTrackTest : public testing::Test {
protected:
    static void SetUpTestSuite() {
        folder_ = std::make_unique<ZULMetaData::Test::TemporaryFolder>();
        std::string bytes;
        const auto add = [&bytes](int value) {
            bytes += static_cast<char>(static_cast<unsigned>(value) & 0xffU);
            bytes += static_cast<char>((static_cast<unsigned>(value) >> 8U) & 0xffU);
        };
        for (int i = 0; i < s_samples; ++i) {
            add(i);
            add(-i);
        }
        ZULMetaData::Test::writeFile(*folder_ / "sound.raw", bytes);
        ZULMetaData::Test::outputOf("ffmpeg -v error -f s16le -ar 8000 -ac 2 -i " + *folder_ / "sound.raw" +
                                    " -c:a pcm_s16le " + movie());
    }
    static void TearDownTestSuite() { folder_.reset(); }

    static std::string movie() { return *folder_ / "sound.avi"; }

    /// Expects as many samples as there are in `seconds` of the film, of which the first is this one of the movie.
    static void expectCounting(const std::vector<float>& samples, double seconds, int first) {
        ASSERT_EQ(samples.size(), static_cast<std::size_t>(std::lround(seconds * s_rate)) * 2);
        for (std::size_t i = 0; 2 * i < samples.size(); ++i) {
            ASSERT_EQ(samples[2 * i], static_cast<float>(first + static_cast<int>(i)) / 32768) << i;
            ASSERT_EQ(samples[2 * i + 1], -samples[2 * i]) << i;
        }
    }

    static void expectSilence(const std::vector<float>& samples, double seconds) {
        EXPECT_EQ(samples, std::vector<float>(static_cast<std::size_t>(std::lround(seconds * s_rate)) * 2));
    }

    static inline std::unique_ptr<ZULMetaData::Test::TemporaryFolder> folder_;
};

TEST_F(SoundTrackTest, FollowsThePiecesToTheSample) {
    EditList edits;
    edits.keep({1, 2}, {3, 4});
    edits.hold(1, {1, 4});
    edits.keep({5, 4}, 2);
    edits.keep(0, {1, 10});
    SoundTrack track(movie(), "sound.avi", edits);
    ASSERT_TRUE(track.hasSound());
    EXPECT_EQ(track.rate(), s_rate);
    expectCounting(track.readUntil(0.25), 0.25, 4000);
    expectSilence(track.readUntil(0.5), 0.25);
    expectCounting(track.readUntil(1.25), 0.75, 10000);
    expectCounting(track.readUntil(1.35), 0.1, 0);
    expectSilence(track.readUntil(2), 0.65);
}

TEST_F(SoundTrackTest, ReadsTheSameInPartsOfAnySize) {
    EditList edits;
    edits.keep({1, 2}, {3, 2});
    edits.keep({1, 4}, {3, 4});
    std::vector<float> whole = SoundTrack(movie(), "sound.avi", edits).readUntil(1.5);
    SoundTrack track(movie(), "sound.avi", edits);
    std::vector<float> parts;
    for (int frame = 1; frame <= 44; ++frame) {
        const std::vector<float> part = track.readUntil(std::min(1.5, frame / 29.97));
        parts.insert(parts.end(), part.begin(), part.end());
    }
    const std::vector<float> last = track.readUntil(1.5);
    parts.insert(parts.end(), last.begin(), last.end());
    EXPECT_EQ(parts, whole);
}

TEST_F(SoundTrackTest, IsSilentAfterTheMovieEnds) {
    EditList edits;
    edits.keep({3, 2}, 3);
    SoundTrack track(movie(), "sound.avi", edits);
    expectCounting(track.readUntil(0.5), 0.5, 12000);
    expectSilence(track.readUntil(1.5), 1);
}

TEST_F(SoundTrackTest, IsAsLongAsThePicturesAtOtherSpeeds) {
    EditList edits;
    edits.keep(0, 1, 2);
    edits.keep(1, 2, {1, 2});
    edits.keep(0, 2, 5000); // nobody hears anything then
    edits.keep({1, 2}, 1);
    SoundTrack track(movie(), "sound.avi", edits);
    EXPECT_EQ(track.readUntil(0.5).size(), 2U * 4000);
    EXPECT_EQ(track.readUntil(2.5).size(), 2U * 16000);
    expectSilence(track.readUntil(2.5 + 2.0 / 5000), 2.0 / 5000);
    expectCounting(track.readUntil(3.0004), 0.5, 4000);
}

TEST_F(SoundTrackTest, HasNoSoundIfTheMovieHasNone) {
    const std::string silent = *folder_ / "silent.avi";
    ZULMetaData::Test::outputOf("ffmpeg -v error -f lavfi -i color=s=16x16:d=0.2 -c:v mpeg4 " + silent);
    EditList edits;
    edits.keep(0, 1);
    EXPECT_FALSE(SoundTrack(silent, "silent.avi", edits).hasSound());
}

TEST(SoundTempo, DividesASpeedIntoFactorsThatFiltersTake) {
    EXPECT_EQ(Zulm::tempoFilters(1), "anull");
    EXPECT_EQ(Zulm::tempoFilters(2), "anull,atempo=2");
    EXPECT_EQ(Zulm::tempoFilters(0.25), "anull,atempo=0.5,atempo=0.5");
    EXPECT_EQ(Zulm::tempoFilters(200), "anull,atempo=100,atempo=2");
}

TEST(SoundTempo, IsHeardUpToAThousandTimesFasterOrSlower) {
    EXPECT_TRUE(Zulm::isHeardAt(1000));
    EXPECT_TRUE(Zulm::isHeardAt(0.001));
    EXPECT_FALSE(Zulm::isHeardAt(1000.1));
    EXPECT_FALSE(Zulm::isHeardAt(0.0009));
    EXPECT_FALSE(Zulm::isHeardAt(std::nan("")));
    EXPECT_FALSE(Zulm::isHeardAt(HUGE_VAL));
}

TEST(SoundTempo, KeepsRatesThatEncodersTake) {
    EXPECT_EQ(Zulm::soundRateFor(44100), 44100);
    EXPECT_EQ(Zulm::soundRateFor(8000), 8000);
    EXPECT_EQ(Zulm::soundRateFor(96000), 48000);
    EXPECT_EQ(Zulm::soundRateFor(0), 48000);
}

} // namespace
} // namespace Render::Test
