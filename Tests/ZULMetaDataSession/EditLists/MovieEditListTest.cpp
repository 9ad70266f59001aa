#include "Tests/Support/Bytes.h"
#include "Tests/ZULMetaDataSession/EditListTexts.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

std::string header(const std::string& type, std::uint32_t timescale) {
    return atom(type, be32(0) + be32(1) + be32(2) + be32(timescale) + be32(100));
}

std::string longHeader(const std::string& type, std::uint32_t timescale) {
    return atom(type, be32(0x01000000) + be64(1) + be64(2) + be32(timescale) + be64(100));
}

std::string media(const std::string& handler, const std::string& mdhd) {
    return atom("mdia", mdhd + atom("hdlr", be32(0) + be32(0) + handler + std::string(13, '\0')));
}

/// Returns one edit of version 0, with a rate of 16 bits before and after the point.
std::string edit(std::uint32_t length, std::uint32_t time, std::uint32_t rate = 0x10000) {
    return be32(length) + be32(time) + be32(rate);
}

std::string editList(std::uint32_t count, const std::string& edits, std::uint32_t version = 0) {
    return atom("edts", atom("elst", be32(version << 24) + be32(count) + edits));
}

/// Returns a movie that counts 600 units for each second, with media that counts 90,000.
std::string movie(const std::string& edts, const std::string& end = {}) {
    const std::string sound = atom("trak", media("soun", header("mdhd", 48000)));
    return atom("ftyp", "qt  ") +
           atom("moov", header("mvhd", 600) + sound + atom("trak", edts + media("vide", header("mdhd", 90000))) + end);
}

std::string fragmentedMovie(const std::string& edts) {
    return movie(edts, atom("mvex"));
}

TEST(MovieEditList, PlaysItsEdits) {
    EXPECT_THAT(piecesOf(movie(editList(2, edit(1200, 900000) + edit(300, 0))), "a.mov"),
                ElementsAre("10-12@1=2", "0-1/2@1=1/2"));
    EXPECT_THAT(piecesOf(movie(editList(0, "")), "a.mov"), IsEmpty());
}

TEST(MovieEditList, ReadsLongTimes) {
    const std::string edits = be64(6'000'000'000) + be64(900'000'000'000) + be32(0x20000);
    const std::string moov =
        atom("moov",
             longHeader("mvhd", 600) + atom("trak", editList(1, edits, 1) + media("vide", longHeader("mdhd", 90000))));
    EXPECT_THAT(piecesOf(atom("ftyp", "isom") + moov, "a.mp4"), ElementsAre("10000000-30000000@2=10000000"));
}

TEST(MovieEditList, ReadsTheRate) {
    EXPECT_THAT(piecesOf(movie(editList(2, edit(600, 90000, 0x8000) + edit(600, 90000, 0))), "a.mov"),
                ElementsAre("1-3/2@1/2=1", "1+1"));
    EXPECT_THAT(piecesOf(movie(editList(1, edit(600, 90000, 0xffff0000))), "a.mov"),
                ElementsAre("a.mov: edit 1: it runs backwards, which an edit list cannot say"));
}

TEST(MovieEditList, RefusesEmptyEdits) {
    EXPECT_THAT(piecesOf(movie(editList(2, edit(600, 0) + edit(600, 0xffffffff))), "a.mov"),
                ElementsAre("a.mov: edit 2: it is empty, which an edit list cannot say"));
}

TEST(MovieEditList, LastsUntilTheEndIfTheLastEditOfAFragmentedMovieHasNoLength) {
    const std::string edits = editList(2, edit(600, 0) + edit(0, 90000));
    EXPECT_THAT(piecesOf(fragmentedMovie(edits), "a.mov", ofDuration(10)), ElementsAre("0-1@1=1", "1-10@1=9"));
    EXPECT_THAT(piecesOf(fragmentedMovie(edits), "a.mov"),
                ElementsAre("a.mov: edit 2: it lasts until the end, and the duration of the recording is not known"));
}

TEST(MovieEditList, RefusesOtherEditsWithoutALength) {
    EXPECT_THAT(piecesOf(movie(editList(1, edit(0, 90000))), "a.mov", ofDuration(10)),
                ElementsAre("a.mov: edit 1: it has no length"));
    EXPECT_THAT(piecesOf(fragmentedMovie(editList(2, edit(0, 90000) + edit(600, 0))), "a.mov", ofDuration(10)),
                ElementsAre("a.mov: edit 1: it has no length"));
}

TEST(MovieEditList, RefusesMoviesWithoutOne) {
    EXPECT_THAT(piecesOf(movie(""), "a.mov"), ElementsAre("a.mov: the track of pictures has no edit list"));
    EXPECT_THAT(piecesOf(movie(atom("edts")), "a.mov"), ElementsAre("a.mov: the track of pictures has no edit list"));
    EXPECT_THAT(piecesOf(atom("ftyp", "qt  "), "a.mov"), ElementsAre("a.mov: the movie has no header"));
    EXPECT_THAT(piecesOf(atom("ftyp", "qt  ") + atom("moov", header("mvhd", 600)), "a.mov"),
                ElementsAre("a.mov: the movie has no track of pictures"));
    EXPECT_THAT(piecesOf(atom("ftyp", "qt  ") + atom("moov", ""), "a.mov"),
                ElementsAre("a.mov: the movie's header has no timescale"));
    EXPECT_THAT(piecesOf(atom("ftyp", "qt  ") + atom("moov", header("mvhd", 0)), "a.mov"),
                ElementsAre("a.mov: the atom 'mvhd' has a timescale of 0"));
}

TEST(MovieEditList, RefusesDamagedMovies) {
    EXPECT_THAT(piecesOf(movie(editList(3, edit(600, 0) + edit(600, 0))), "a.mov"),
                ElementsAre("a.mov: the atom 'elst' is cut short"));
    EXPECT_THAT(piecesOf(movie(editList(1, edit(600, 0), 2)), "a.mov"),
                ElementsAre("a.mov: the atom 'elst' is of version 2; versions 0 and 1 can be read"));
    const std::string whole = movie(editList(2, edit(1200, 900000) + edit(300, 0)));
    for (std::size_t size = 8; size < whole.size(); ++size)
        EXPECT_THAT(piecesOf(whole.substr(0, size), "a.mov"), ElementsAre("a.mov: the movie has no header")) << size;
}

} // namespace
} // namespace ZULMetaData::Test
