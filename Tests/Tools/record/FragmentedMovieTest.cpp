#include "Tools/record/FragmentedMovie.h"

#include "Tools/record/Failure.h"
#include "Tools/record/FileHandle.h"

#include <gtest/gtest.h>

#include <sys/mman.h>
#include <unistd.h>

#include <cstdint>
#include <string>

using namespace Recorder;

namespace {

std::string big(std::uint64_t number, std::size_t size) {
    std::string bytes;
    for (std::size_t i = size; i-- > 0;)
        bytes += static_cast<char>(number >> (8 * i) & 0xff);
    return bytes;
}

std::string u32(std::uint64_t number) {
    return big(number, 4);
}

std::string atom(const std::string& name, const std::string& payload) {
    return u32(8 + payload.size()) + name + payload;
}

/// A file in memory.
class Movie {
public:
    explicit Movie(const std::string& bytes) : file_(memfd_create("movie", MFD_CLOEXEC)) { write(bytes, 0); }

    int get() const { return file_.get(); }
    void write(const std::string& bytes, off_t offset) {
        EXPECT_EQ(pwrite(get(), bytes.data(), bytes.size(), offset), static_cast<ssize_t>(bytes.size()));
    }
    std::string contents() const {
        std::string bytes(static_cast<std::size_t>(lseek(get(), 0, SEEK_END)), '\0');
        EXPECT_EQ(pread(get(), bytes.data(), bytes.size(), 0), static_cast<ssize_t>(bytes.size()));
        return bytes;
    }
    FragmentedMovie read() const { return FragmentedMovie(get(), "movie.mp4"); }

private:
    FileHandle file_;
};

constexpr std::uint32_t s_sync = 0x2000000;
constexpr std::uint32_t s_noSync = 0x1010000;

/// Track 1 of pictures, whose time has 90,000 units a second, in a movie with 1,000.
std::string beginning() {
    const std::string times = u32(0) + u32(0);
    const std::string movieHeader = atom("mvhd", u32(0) + times + u32(1000) + u32(0) + std::string(80, '\0'));
    const std::string trackHeader = atom("tkhd", u32(3) + times + u32(1) + u32(0) + u32(0) + std::string(60, '\0'));
    const std::string mediaHeader = atom("mdhd", u32(0) + times + u32(90000) + u32(0) + u32(0));
    const std::string handler = atom("hdlr", u32(0) + u32(0) + "vide" + std::string(13, '\0'));
    const std::string tables = atom("stbl", atom("stsd", u32(0) + u32(0)));
    const std::string media = atom("mdia", mediaHeader + handler + atom("minf", tables));
    const std::string defaults = atom("mvex", atom("trex", u32(0) + u32(1) + u32(1) + u32(0) + u32(0) + u32(0)));
    return atom("ftyp", "isom" + u32(0)) + atom("moov", movieHeader + atom("trak", trackHeader + media) + defaults);
}

/// A run that tells duration, size and flags of each sample, and where they are.
std::string run(std::uint32_t offset, const std::string& samples, std::uint32_t count) {
    return atom("trun", u32(0x701) + u32(count) + u32(offset) + samples);
}

std::string sample(std::uint32_t duration, std::uint32_t size, std::uint32_t flags) {
    return u32(duration) + u32(size) + u32(flags);
}

std::string fragment(std::uint64_t time, const std::string& runs) {
    const std::string header = atom("tfhd", u32(0x20000) + u32(1));
    const std::string start = atom("tfdt", u32(0x1000000) + big(time, 8));
    return atom("moof", atom("mfhd", u32(0) + u32(1)) + atom("traf", header + start + runs));
}

constexpr std::uint32_t s_inMoof = 8 + 16 + 8 + 16 + 20; ///< up to the first run
constexpr std::uint32_t s_run = 20;                      ///< of a run without its samples

/// Where the media of a fragment with one run begins, from the fragment's own begin.
constexpr std::uint32_t mediaOf(std::uint32_t samples) {
    return s_inMoof + s_run + 12 * samples + 8;
}

/// Two pictures of 3 and 2 bytes.
std::string firstFragment() {
    return fragment(0, run(mediaOf(2), sample(3000, 3, s_sync) + sample(3600, 2, s_noSync), 2)) + atom("mdat", "AAABB");
}

/// One picture of 4 bytes.
std::string secondFragment() {
    return fragment(6600, run(mediaOf(1), sample(2400, 4, s_noSync), 1)) + atom("mdat", "CCCC");
}

/// What follows the name of an atom that is somewhere in the file.
std::string after(const std::string& name, const std::string& bytes, std::size_t size) {
    return bytes.substr(bytes.rfind(name) + name.size(), size);
}

TEST(FragmentedMovie, ReadsUpToTheLastWholeFragment) {
    const std::string whole = beginning() + firstFragment() + secondFragment();
    for (std::size_t cut = 1; cut <= secondFragment().size(); ++cut) {
        const FragmentedMovie movie = Movie(whole.substr(0, whole.size() - cut)).read();
        ASSERT_EQ(movie.frames(), 2U) << cut;
        ASSERT_EQ(movie.wholeBytes(), (beginning() + firstFragment()).size()) << cut;
        ASSERT_EQ(movie.duration(), 6600.0 / 90000) << cut;
    }
    EXPECT_EQ(Movie(whole).read().frames(), 3U);
    EXPECT_EQ(Movie(whole).read().wholeBytes(), whole.size());
    EXPECT_EQ(Movie(whole).read().duration(), 0.1);
}

TEST(FragmentedMovie, BecomesAnOrdinaryMovieWithoutMovingItsPictures) {
    const std::string whole = beginning() + firstFragment() + secondFragment();
    Movie movie(whole + "torn");
    movie.read().makeOrdinary(movie.get());
    const std::string bytes = movie.contents();
    EXPECT_EQ(bytes.find("moof"), std::string::npos);
    EXPECT_EQ(bytes.find("mvex"), bytes.rfind("mvex")) << "only in what has become free space";
    EXPECT_EQ(bytes.rfind("moov"), whole.size() + 4);
    EXPECT_EQ(bytes.substr(whole.size(), 4), u32(bytes.size() - whole.size()));
    const std::uint64_t first = beginning().size();
    const std::uint64_t second = first + firstFragment().size();
    EXPECT_EQ(after("stts", bytes, 32), u32(0) + u32(3) + u32(1) + u32(3000) + u32(1) + u32(3600) + u32(1) + u32(2400));
    EXPECT_EQ(after("stss", bytes, 12), u32(0) + u32(1) + u32(1));
    EXPECT_EQ(after("stsc", bytes, 32), u32(0) + u32(2) + u32(1) + u32(2) + u32(1) + u32(2) + u32(1) + u32(1));
    EXPECT_EQ(after("stsz", bytes, 24), u32(0) + u32(0) + u32(3) + u32(3) + u32(2) + u32(4));
    EXPECT_EQ(after("co64", bytes, 24), u32(0) + u32(2) + big(first + mediaOf(2), 8) + big(second + mediaOf(1), 8));
    EXPECT_EQ(bytes.substr(first + mediaOf(2), 5), "AAABB");
    EXPECT_EQ(bytes.substr(second + mediaOf(1), 4), "CCCC");
    EXPECT_EQ(after("mvhd", bytes, 20), u32(0) + u32(0) + u32(0) + u32(1000) + u32(100));
    EXPECT_EQ(after("mdhd", bytes, 20), u32(0) + u32(0) + u32(0) + u32(90000) + u32(9000));
}

TEST(FragmentedMovie, IsTheSameWhenItBecomesOrdinaryAgain) {
    Movie movie(beginning() + firstFragment() + secondFragment());
    movie.read().makeOrdinary(movie.get());
    const std::string once = movie.contents();
    EXPECT_EQ(movie.read().frames(), 3U);
    movie.read().makeOrdinary(movie.get());
    EXPECT_EQ(movie.contents(), once);
}

TEST(FragmentedMovie, IsReadAlthoughBecomingOrdinaryWasInterrupted) {
    const std::string whole = beginning() + firstFragment() + secondFragment();
    Movie movie(whole + atom("skip", "an index that is not valid yet"));
    movie.write("free", static_cast<off_t>(beginning().find("moov")));
    movie.write("free", static_cast<off_t>(beginning().size() + 4));
    EXPECT_EQ(movie.read().frames(), 3U);
    EXPECT_EQ(movie.read().wholeBytes(), whole.size());
}

TEST(FragmentedMovie, UsesWhatIsTheSameForAllSamples) {
    const std::string header = atom("tfhd", u32(0x20038) + u32(1) + u32(4500) + u32(2) + u32(s_noSync));
    const std::string start = atom("tfdt", u32(0) + u32(0));
    const std::string samples = atom("trun", u32(0x5) + u32(2) + u32(0) + u32(s_sync));
    std::string moof = atom("moof", atom("mfhd", u32(0) + u32(1)) + atom("traf", header + start + samples));
    const std::string place = u32(0x5) + u32(2) + u32(0);
    moof.replace(moof.find(place) + 8, 4, u32(moof.size() + 8));
    const Movie movie(beginning() + moof + atom("mdat", "AABB"));
    EXPECT_EQ(movie.read().frames(), 2U);
    EXPECT_EQ(movie.read().duration(), 0.1);
    movie.read().makeOrdinary(movie.get());
    EXPECT_EQ(after("stss", movie.contents(), 12), u32(0) + u32(1) + u32(1));
}

/// Expects that only the first fragment is read.
void expectEndBefore(const std::string& fragment) {
    const Movie movie(beginning() + firstFragment() + fragment + secondFragment());
    EXPECT_EQ(movie.read().frames(), 2U);
    EXPECT_EQ(movie.read().wholeBytes(), (beginning() + firstFragment()).size());
}

TEST(FragmentedMovie, EndsBeforeSamplesThatAreNotInTheirMedia) {
    const std::string media = atom("mdat", "CCCC");
    const std::string picture = sample(1, 4, s_sync);
    expectEndBefore(fragment(0, run(mediaOf(1) + 1, picture, 1)) + media);
    expectEndBefore(fragment(0, run(mediaOf(1) - 1, picture, 1)) + media);
    expectEndBefore(fragment(0, run(0x80000000, picture, 1)) + media);
    expectEndBefore(fragment(0, run(mediaOf(1), sample(1, 5, s_sync), 1)) + media);
    expectEndBefore(fragment(0, run(mediaOf(1), sample(1, 0, s_sync), 1)) + media);
    const std::string twice = run(mediaOf(1) + s_run + 12, picture, 1) + run(mediaOf(1) + s_run + 12, picture, 1);
    expectEndBefore(fragment(0, twice) + media);
}

TEST(FragmentedMovie, EndsBeforeRunsThatClaimMoreThanTheyHave) {
    const std::string media = atom("mdat", "CCCC");
    expectEndBefore(fragment(0, run(mediaOf(1), sample(1, 4, s_sync), 2)) + media);
    expectEndBefore(fragment(0, atom("trun", u32(0) + u32(0xffffffff))) + media);
    expectEndBefore(fragment(0, atom("trun", u32(0x1))) + media);
    expectEndBefore(fragment(~std::uint64_t{0}, run(mediaOf(1), sample(1, 4, s_sync), 1)) + media);
}

TEST(FragmentedMovie, EndsBeforeAFragmentOfAnUnknownTrack) {
    std::string other = secondFragment();
    const std::size_t track = other.find("tfhd") + 8;
    other.replace(track, 4, u32(2));
    expectEndBefore(other);
}

TEST(FragmentedMovie, IsRefusedWithoutABeginning) {
    const std::string movie = beginning().substr(beginning().find("moov") - 4);
    const std::string wide = u32(1) + "moov" + big(movie.size() + 8, 8) + movie.substr(8);
    for (const std::string& bytes : {std::string(), std::string("AAAA"), firstFragment(), atom("moov", ""),
                                     atom("moov", atom("trak", "")), wide, beginning().substr(0, 40), u32(0) + "moov"})
        EXPECT_THROW(Movie(bytes).read(), Failure) << bytes.size();
}

TEST(FragmentedMovie, IsNotMadeOrdinaryWithoutAFrame) {
    const Movie movie(beginning());
    EXPECT_THROW(movie.read().makeOrdinary(movie.get()), Failure);
    EXPECT_EQ(movie.contents(), beginning());
}

} // namespace
