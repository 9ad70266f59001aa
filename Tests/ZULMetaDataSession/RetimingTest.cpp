// The streams of an edited movie: every rule by hand, and random edits against the oracle.

#include "ZULMetaDataSession/Retiming.h"

#include "Tests/ZULMetaDataSession/RandomEdits.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cerrno>
#include <limits>
#include <map>
#include <span>
#include <string>
#include <string_view>
#include <system_error>
#include <utility>
#include <vector>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

const std::string s_actions = "2b7b6af0";
const std::string s_cursors = "2b7b6af1";
const std::string s_regions = "2b7b6af6";
const std::string s_scrolls = "2b7b6a05";
const std::string s_keys = "2b7b6af5";

/// Entries as a test writes them: a time and an x, a text, or an action.
using Points = std::vector<std::pair<double, std::int32_t>>;
using Texts = std::vector<std::pair<double, std::string>>;

std::string points(const Points& entries, const std::string& group = s_cursorLocations) {
    std::string stream = streamHeader(group, 1, 16);
    for (const auto& [time, x] : entries)
        stream += pointEntry(time, x, 7);
    return stream;
}

std::string texts(const Texts& entries) {
    std::string stream = streamHeader(s_appNames, 1, 0);
    for (const auto& [time, text] : entries)
        stream += textEntry(time, text);
    return stream;
}

std::string actions(const Points& entries) {
    std::string stream = streamHeader(s_actions, 1, 12);
    for (const auto& [time, action] : entries)
        stream += f64(time) + raw(action);
    return stream;
}

/// An entry of version 2 with a picture at the hot spot (1, 2), or without one if `image` is empty.
OracleEntry cursor(double time, std::uint64_t id, const std::string& image = {}, std::uint32_t flags = 3) {
    OracleEntry entry{time, {}, id, flags, {}};
    if (!image.empty())
        entry.picture = OraclePicture{image, 1, 2, 5};
    return entry;
}

std::string cursors(const std::vector<OracleEntry>& entries, int version = 2) {
    std::string stream = streamHeader(s_cursors, version, 0);
    for (const OracleEntry& entry : entries)
        stream += cursorEntry(entry, version);
    return stream;
}

std::string bytesIn(const EditedStream& stream) {
    std::string bytes(static_cast<std::size_t>(stream.bytes.size()), '\0');
    EXPECT_EQ(stream.bytes.read(0, bytes), bytes.size());
    return bytes;
}

struct Result {
    EditedRecording edited;
    std::vector<std::string> streams;

    const RetimedCounts& counts() const { return edited.streams.at(0).counts; }
};

Result retimedMovie(const std::string& movie, const EditList& edits) {
    Result result{retimed(Recording(ByteSource::memory(movie), "Movie.mp4"), edits), {}};
    for (const EditedStream& stream : result.edited.streams)
        result.streams.push_back(bytesIn(stream));
    return result;
}

/// Retimes a recording with one stream.
Result retimedStream(const std::string& stream, const EditList& edits) {
    return retimedMovie(media() + zulmAtom({stream}), edits);
}

std::string retimedBytes(const std::string& stream, const EditList& edits) {
    return retimedStream(stream, edits).streams.at(0);
}

/// "10-20@2" is a piece, "h12.5-2" the frame at 12.5 s, held for two seconds.
EditList editsOf(const std::vector<std::string>& pieces) {
    EditList edits;
    for (const std::string& piece : pieces) {
        if (!piece.starts_with('h')) {
            edits.keep(piece);
            continue;
        }
        const std::size_t mark = piece.find('-');
        edits.hold(Rational::parse(piece.substr(1, mark - 1)).value(), Rational::parse(piece.substr(mark + 1)).value());
    }
    return edits;
}

// States ----------------------------------------------------------------------------------------------------------

TEST(Retiming, MovesStatesOfAPiece) {
    const std::string moved = retimedBytes(points({{1, 1}, {2, 2}, {2.5, 2}, {4, 3}}), editsOf({"1-4@2"}));
    EXPECT_EQ(moved, points({{0, 1}, {0.5, 2}, {0.75, 2}})); // a repeated value stays, the end does not belong to it
}

TEST(Retiming, CarriesWhatHeldAtTheStartOfAPiece) {
    const Result result = retimedStream(points({{1, 1}, {2, 2}, {4, 3}}), editsOf({"3-5"}));
    EXPECT_EQ(result.streams.at(0), points({{0, 2}, {1, 3}}));
    EXPECT_EQ(result.counts().carried, 1U);
    EXPECT_EQ(result.counts().moved, 1U);
    EXPECT_EQ(result.counts().written(), 2U);
}

TEST(Retiming, CarriesNothingWhereAnEntryIsExactlyAtTheStart) {
    EXPECT_EQ(retimedBytes(points({{1, 1}, {2, 2}}), editsOf({"2-3"})), points({{0, 2}}));
    EXPECT_EQ(retimedBytes(points({{1, 1}, {61.0 / 3, 2}}), editsOf({"61/3-30"})), points({{0, 2}}));
}

TEST(Retiming, DoesNotCarryWhatTheStreamSaysAlready) {
    const std::string stream = points({{0, 1}, {2, 2}, {4, 1}});
    EXPECT_EQ(retimedBytes(stream, editsOf({"0-1", "5-6"})), points({{0, 1}}));
    EXPECT_EQ(retimedBytes(stream, editsOf({"0-1", "3-4", "0-2"})), points({{0, 1}, {1, 2}, {2, 1}}));
    EXPECT_EQ(retimedBytes(texts({{0, "A"}, {2, "B"}, {4, "A"}}), editsOf({"0-1", "5-6", "3-4"})),
              texts({{0, "A"}, {2, "B"}}));
}

TEST(Retiming, WritesNothingBeforeTheFirstState) {
    EXPECT_EQ(retimedBytes(points({{5, 1}}), editsOf({"1-2"})), points({}));
    EXPECT_EQ(retimedBytes(points({{5, 1}}), editsOf({"5-6", "1-2"})), points({{0, 1}})); // 1 stays in force
}

TEST(Retiming, WritesTheStateOfAHeldFrame) {
    const Result result = retimedStream(points({{1, 1}, {2, 2}}), editsOf({"h2-3", "h1.5-1", "h1.75-1", "h0.5-1"}));
    EXPECT_EQ(result.streams.at(0), points({{0, 2}, {3, 1}}));
    EXPECT_EQ(result.counts().carried, 2U);
    EXPECT_EQ(result.counts().moved, 0U);
}

TEST(Retiming, RepeatsPieces) {
    const Result result = retimedStream(points({{1, 1}, {2, 2}}), editsOf({"1-3", "1-3@2"}));
    EXPECT_EQ(result.streams.at(0), points({{0, 1}, {1, 2}, {2, 1}, {2.5, 2}}));
    EXPECT_EQ(result.counts().moved, 4U);
}

TEST(Retiming, TakesPiecesInAnyOrderAndBeyondTheEnd) {
    EXPECT_EQ(retimedBytes(points({{1, 1}, {2, 2}}), editsOf({"2-3", "1-2", "100-200", "1-2"})),
              points({{0, 2}, {1, 1}, {2, 2}, {102, 1}}));
}

TEST(Retiming, CarriesEntriesWithNegativeTimesAndMovesNone) {
    EXPECT_EQ(retimedBytes(points({{-1, 1}, {2, 2}}), editsOf({"0-3"})), points({{0, 1}, {2, 2}}));
}

TEST(Retiming, OrdersEntriesByTimeAndEqualTimesByTheStream) {
    EXPECT_EQ(retimedBytes(points({{2, 2}, {1, 1}, {2, 3}}), editsOf({"1-3"})), points({{0, 1}, {1, 2}, {1, 3}}));
    EXPECT_EQ(retimedBytes(points({{2, 2}, {1, 1}, {2, 3}}), editsOf({"h2-1"})), points({{0, 3}}));
}

TEST(Retiming, LeavesEntriesWithoutAFiniteTimeOut) {
    const double infinity = std::numeric_limits<double>::infinity();
    const Result result =
        retimedStream(points({{-infinity, 1}, {1, 2}, {std::nan(""), 3}, {2, 4}, {infinity, 5}}), editsOf({"0.5-9"}));
    EXPECT_EQ(result.streams.at(0), points({{0.5, 2}, {1.5, 4}}));
    EXPECT_EQ(result.counts().leftOut, 3U);
    EXPECT_THAT(result.edited.losses,
                ElementsAre("cursorLocation has 3 entries without a finite time, which were left out"));
}

TEST(Retiming, RoundsEachTimeOnce) {
    // 1/3 + (t - 1/10) * 2/3; doubles make 2.4000000000000004 and 1.5999999999999999 of it
    EXPECT_EQ(retimedBytes(points({{2, 1}, {3.2, 2}}, s_scrolls), editsOf({"5-16/3", "1/10-10@3/2"})),
              points({{1.6, 1}, {2.4, 2}}, s_scrolls));
}

TEST(Retiming, NeverGoesBackInTime) {
    // the entry at the edge is a little before it, and the piece before it ends with one at the base
    EXPECT_EQ(retimedBytes(points({{1, 1}, {61.0 / 3, 2}}, s_scrolls), editsOf({"0-10", "61/3-30"})),
              points({{1, 1}, {10, 2}}, s_scrolls));
}

TEST(Retiming, LeavesAHeaderIfNothingIsLeft) {
    EXPECT_EQ(retimedBytes(points({{1, 1}}), EditList()), points({}));
    EXPECT_EQ(retimedBytes(actions({{1, 1}}), EditList()), actions({}));
    EXPECT_EQ(retimedBytes(points({}), editsOf({"0-10"})), points({}));
}

// Cursors ---------------------------------------------------------------------------------------------------------

TEST(Retiming, BringsThePictureOfACursorWithItsFirstUse) {
    const std::string stream = cursors({cursor(0, 7, "arrow"), cursor(1, 8, "hand"), cursor(2, 7), cursor(3, 8)});
    EXPECT_EQ(retimedBytes(stream, editsOf({"2-4"})), cursors({cursor(0, 7, "arrow"), cursor(1, 8, "hand")}));
    EXPECT_EQ(retimedBytes(stream, editsOf({"2.5-4", "0-1.5"})),
              cursors({cursor(0, 7, "arrow"), cursor(0.5, 8, "hand"), cursor(1.5, 7), cursor(2.5, 8)}));
}

TEST(Retiming, StoresAPictureAgainOnlyIfItIsAnotherOne) {
    const std::string stream = cursors({cursor(0, 7, "arrow"), cursor(1, 7, "hand"), cursor(2, 7, "hand")});
    EXPECT_EQ(retimedBytes(stream, editsOf({"0-3", "0-1"})),
              cursors({cursor(0, 7, "arrow"), cursor(1, 7, "hand"), cursor(2, 7), cursor(3, 7, "arrow")}));
}

TEST(Retiming, TakesThePictureOfALaterEntryIfNoEarlierOneHasOne) {
    const std::string stream = cursors({cursor(0, 7), cursor(1, 7, "arrow"), cursor(2, 7, "hand"), cursor(3, 8)});
    EXPECT_EQ(retimedBytes(stream, editsOf({"0-1", "3-4"})), cursors({cursor(0, 7, "arrow"), cursor(1, 8)}));
}

TEST(Retiming, TellsPicturesApartByTheirHotSpotAndSystemCursor) {
    OracleEntry moved = cursor(1, 7, "arrow");
    moved.picture->x = 9;
    OracleEntry other = cursor(2, 7, "arrow");
    other.picture->systemCursor = 6;
    const std::string stream = cursors({cursor(0, 7, "arrow"), moved, other});
    EXPECT_EQ(retimedBytes(stream, editsOf({"0-3"})), stream);
}

TEST(Retiming, TellsManyHotSpotsOfOnePictureApart) {
    constexpr int count = 50'000; // comparing each with each would take minutes
    std::vector<OracleEntry> entries;
    for (int i = 0; i < count; ++i) {
        entries.push_back(cursor(i, 7, "arrow"));
        entries.back().picture->x = i;
    }
    const std::string stream = cursors(entries);
    EXPECT_EQ(retimedBytes(stream, editsOf({"0-50000"})), stream);
}

TEST(Retiming, CarriesACursorUnlessItsIdentifierAndPictureAreWrittenLast) {
    const std::string stream = cursors({cursor(0, 7, "arrow", 1), cursor(1, 8, "arrow", 1), cursor(2, 7, "", 2)});
    EXPECT_EQ(retimedBytes(stream, editsOf({"0-1", "2.5-3", "1.5-2"})), // other flags are no other cursor
              cursors({cursor(0, 7, "arrow", 1), cursor(1.5, 8, "arrow", 1)}));
    EXPECT_EQ(retimedBytes(stream, editsOf({"2.5-3"})), cursors({cursor(0, 7, "arrow", 2)})); // with its own flags
}

TEST(Retiming, KeepsTheVersionOfCursors) {
    OracleEntry arrow = cursor(0, 7, "arrow");
    arrow.picture->systemCursor = -1;
    OracleEntry carried = arrow;
    const std::string stream = cursors({arrow, cursor(2, 7), cursor(3, 7)}, 1);
    EXPECT_EQ(retimedBytes(stream, editsOf({"1-3"})), cursors({carried, cursor(1, 7)}, 1));
}

// Events ----------------------------------------------------------------------------------------------------------

TEST(Retiming, MovesEventsAndRepeatsNone) {
    const std::string stream = points({{1, 1}, {2, 2}, {4, 3}}, s_scrolls);
    EXPECT_EQ(retimedBytes(stream, editsOf({"1.5-4", "h2-1", "3-5@2"})), points({{0.5, 2}, {4, 3}}, s_scrolls));
    const std::string key = streamHeader(s_keys, 1, 16) + pointEntry(3, 65, 0);
    EXPECT_EQ(retimedBytes(key, editsOf({"2-4"})), streamHeader(s_keys, 1, 16) + pointEntry(1, 65, 0));
}

TEST(Retiming, ReleasesAndPressesAButtonThatIsDownAtAnEdge) {
    const Result result = retimedStream(actions({{0, 256}, {1, 17}, {5, 18}}), editsOf({"0.5-2", "4-6"}));
    EXPECT_EQ(result.streams.at(0), actions({{0.5, 17}, {1.5, 2}, {1.5, 17}, {2.5, 18}}));
    EXPECT_EQ(result.counts().added, 2U);
    EXPECT_EQ(result.counts().moved, 2U);
    EXPECT_EQ(result.counts().carried, 0U);
}

TEST(Retiming, ReleasesAtTheEndOfTheLastPiece) {
    EXPECT_EQ(retimedBytes(actions({{1, 4}}), editsOf({"0-2", "h1-5"})), actions({{1, 4}, {2, 8}}));
    EXPECT_EQ(retimedBytes(actions({{1, 1}, {2, 2}}), editsOf({"0-2"})), actions({{1, 1}, {2, 2}}));
    EXPECT_EQ(retimedBytes(actions({{1, 1}, {1.5, 2}}), editsOf({"0-2"})), actions({{1, 1}, {1.5, 2}}));
}

TEST(Retiming, PressesNoButtonThatIsReleasedExactlyAtTheStart) {
    EXPECT_EQ(retimedBytes(actions({{1, 1}, {3, 18}}), editsOf({"3-4"})), actions({{0, 18}}));
    EXPECT_EQ(retimedBytes(actions({{1, 1}, {3, 4}, {3, 2}}), editsOf({"3-4"})),
              actions({{0, 4}, {0, 2}, {1, 8}})); // the right button is another one
    EXPECT_EQ(retimedBytes(actions({{1, 1}, {3, 17}, {3, 2}}), editsOf({"3-4"})),
              actions({{0, 1}, {0, 17}, {0, 2}})); // its first entry there is a press
    EXPECT_EQ(retimedBytes(actions({{1, 1}, {2, 17}, {4, 2}}), editsOf({"3-5"})),
              actions({{0, 17}, {1, 2}})); // with the value of its last press
}

TEST(Retiming, WritesNothingWhereTheSourceGoesOn) {
    const std::string stream = actions({{1, 1}, {5, 2}});
    EXPECT_EQ(retimedBytes(stream, editsOf({"0-2", "2-6@2"})), actions({{1, 1}, {3.5, 2}}));
    EXPECT_EQ(retimedBytes(stream, editsOf({"0-2", "h2-3", "h1-1", "2-6"})), actions({{1, 1}, {9, 2}}));
    EXPECT_EQ(retimedBytes(stream, editsOf({"0-2", "3-4", "2-6"})),
              actions({{1, 1}, {2, 2}, {2, 1}, {3, 2}, {3, 1}, {6, 2}}));
    EXPECT_EQ(retimedBytes(stream, editsOf({"2-3", "2-3"})), actions({{0, 1}, {1, 2}, {1, 1}, {2, 2}}));
}

TEST(Retiming, OrdersSeveralButtonsAtAnEdge) {
    EXPECT_EQ(retimedBytes(actions({{1, 16}, {1.5, 4}, {2, 1}, {3.5, 3}}), editsOf({"3-4"})),
              actions({{0, 1}, {0, 4}, {0, 16}, {0.5, 3}, {1, 2}, {1, 8}, {1, 32}})); // 3 is a press of the left one
    EXPECT_EQ(retimedBytes(actions({{1, 1}, {3, 32}}), editsOf({"3-4"})), actions({{0, 1}, {0, 32}, {1, 2}}));
}

TEST(Retiming, ReadsActionsAsTheirTextsDo) {
    // 256 is no button; 257 presses the left one, 24 releases the right one with Shift, 48 presses the middle one
    EXPECT_EQ(retimedBytes(actions({{0, 256}, {1, 257}, {2, 4}, {3, 24}, {4, 48}}), editsOf({"10-11"})),
              actions({{0, 257}, {0, 48}, {1, 2}, {1, 32}}));
    EXPECT_EQ(retimedBytes(actions({{0, 256}, {1, 64}}), editsOf({"10-11"})), actions({}));
}

TEST(Retiming, MovesAReleaseWithoutAPress) {
    EXPECT_EQ(retimedBytes(actions({{1, 2}}), editsOf({"0-2"})), actions({{1, 2}}));
}

// Everything else -------------------------------------------------------------------------------------------------

TEST(Retiming, CopiesWhatIsValidAtAllTimes) {
    const std::string region = streamHeader(s_regions, 1, 24) + f64(std::nan("")) + std::string(16, 'r') + f64(-5) +
                               std::string(16, 's') + "torn";
    const Result result = retimedMovie(media() + zulmAtom({points({{1, 1}}), region}), editsOf({"3-4"}));
    EXPECT_THAT(result.streams, ElementsAre(points({{0, 1}}), region));
    EXPECT_FALSE(result.edited.streams.at(0).isCopied);
    EXPECT_TRUE(result.edited.streams.at(1).isCopied);
    EXPECT_THAT(result.edited.warnings, IsEmpty());
}

TEST(Retiming, CopiesStreamsThatNobodyKnowsAndWarns) {
    const std::map<std::string, std::string> unknown{
        {streamHeader("2b7b6a00", 1, 12) + "odd", "miscellany was copied with its old times: the entries of its kind "
                                                  "are not known here"},
        {streamHeader(s_cursorLocations, 2, 16) + "odd", "its version 2 is not known here"},
        {streamHeader(s_cursorLocations, 0, 16) + "odd", "its version 0 is not known here"},
        {streamHeader(s_cursorLocations, 1, 20) + "odd", "its header states entries of 20 bytes instead of 16"},
        {streamHeader("12345678", 1, 0) + "odd",
         "12345678-7a1f-11e2-83d0-0017f200be7f was copied with its old times: the entries of its kind are not known"}};
    for (const auto& [stream, warning] : unknown) {
        SCOPED_TRACE(warning);
        const Result result = retimedStream(stream, editsOf({"3-4"}));
        EXPECT_EQ(result.streams.at(0), stream);
        EXPECT_TRUE(result.edited.streams.at(0).isCopied);
        EXPECT_THAT(result.edited.warnings, ElementsAre(HasSubstr(warning)));
        EXPECT_THAT(result.edited.losses, IsEmpty());
    }
}

TEST(Retiming, TakesTheStreamThatReadersFind) {
    const Result result =
        retimedMovie(media() + zulmAtom({points({{1, 1}})}) + zulmAtom({points({{1, 2}})}), editsOf({"0-2"}));
    EXPECT_THAT(result.streams, ElementsAre(points({{1, 2}})));
    EXPECT_THAT(result.edited.warnings,
                ElementsAre("readers take a later stream instead of cursorLocation at offset 62; it was left out"));
}

TEST(Retiming, TakesWhatStandsBeforeDamage) {
    const Result torn = retimedStream(points({{1, 1}, {2, 2}}) + "torn!", editsOf({"0-9"}));
    EXPECT_EQ(torn.streams.at(0), points({{1, 1}, {2, 2}}));
    EXPECT_THAT(torn.edited.losses, ElementsAre("cursorLocation is damaged at offset 56 of the stream; the 5 bytes "
                                                "from there on were left out"));
    const Result empty = retimedStream(texts({{1, "A"}}) + le32(0) + textEntry(2, "B"), editsOf({"0-9"}));
    EXPECT_EQ(empty.streams.at(0), texts({{1, "A"}}));
    EXPECT_THAT(empty.edited.losses, ElementsAre(HasSubstr("topmostAppName is damaged at offset 37")));
    const Result small = retimedStream(texts({{1, "A"}}) + le32(3) + "xyz" + textEntry(2, "B"), editsOf({"0-9"}));
    EXPECT_EQ(small.streams.at(0), texts({{1, "A"}}));
    const std::string hand = cursorEntry(cursor(1, 8, "hand"), 2);
    const std::string cut = hand.substr(0, 24) + le32(100) + hand.substr(28); // an image of 100 bytes
    const Result image = retimedStream(cursors({cursor(0, 7, "arrow")}) + cut, editsOf({"0-9"}));
    EXPECT_EQ(image.streams.at(0), cursors({cursor(0, 7, "arrow")}));
    EXPECT_THAT(image.edited.losses, ElementsAre(HasSubstr("cursorImage is damaged at offset")));
}

TEST(Retiming, NamesWhatTheFileLacks) {
    const std::string movie = media() + zulmAtom({points({{1, 1}, {2, 2}})});
    const Result result = retimedMovie(movie.substr(0, movie.size() - 16), editsOf({"0-9"}));
    EXPECT_EQ(result.streams.at(0), points({{1, 1}}));
    EXPECT_THAT(result.edited.losses,
                ElementsAre("cursorLocation declares 56 bytes, and the file has only 40 of them"));
    const Result none = retimedStream("short", editsOf({"0-9"}));
    EXPECT_THAT(none.streams, IsEmpty());
}

TEST(Retiming, NamesStreamsThatDamageHides) {
    const std::string damaged = media() + extendedAtom("ZULM", extendedAtom("DATA", points({{1, 1}})) + "tail");
    const Result result = retimedMovie(damaged, editsOf({"0-9"}));
    EXPECT_THAT(result.streams, ElementsAre(points({{1, 1}})));
    EXPECT_THAT(result.edited.losses, ElementsAre("the metadata is damaged, so that streams may be missing"));
}

TEST(Retiming, HandsTheBytesToAFunction) {
    const std::string region = streamHeader(s_regions, 1, 24);
    const std::string movie = media() + zulmAtom({points({{1, 1}}), region, points({{2, 2}}, s_scrolls)});
    std::string sunk;
    const EditedRecording edited = retimed(Recording(ByteSource::memory(movie), "Movie.mp4"), editsOf({"1-4"}),
                                           [&sunk](std::string_view bytes) { sunk += bytes; });
    std::map<std::string, std::string> streams;
    for (const EditedStream& stream : edited.streams)
        streams[stream.source.name()] = stream.isCopied ? bytesIn(stream)
                                                        : sunk.substr(static_cast<std::size_t>(stream.offset),
                                                                      static_cast<std::size_t>(stream.size));
    EXPECT_EQ(streams["cursorLocation"], points({{0, 1}}));
    EXPECT_EQ(streams["scrollAction"], points({{1, 2}}, s_scrolls));
    EXPECT_EQ(streams["recordingRegion"], region);
    EXPECT_EQ(sunk.size(), 24U + 16 + 24 + 16);
}

TEST(Retiming, PassesOnWhatTheFunctionThrows) {
    const std::string movie = media() + zulmAtom({points({{1, 1}})});
    const Recording recording(ByteSource::memory(movie), "Movie.mp4");
    const auto isFull = [](std::string_view) { throw std::system_error(ENOSPC, std::generic_category()); };
    EXPECT_THROW(retimed(recording, editsOf({"1-4"}), isFull), std::system_error);
}

TEST(Retiming, NamesAFileThatChangesWhileItIsRead) {
    const std::string movie =
        media() + zulmAtom({points({{2, 2}, {1, 1}}), texts({{1, "A"}, {2, "B"}}), actions({{1, 1}}),
                            cursors({cursor(0, 7, "arrow"), cursor(1, 7, "hand")})});
    int reads = 0;
    int readsUntilTheChange = std::numeric_limits<int>::max();
    const ByteSource changing(movie.size(), [&](std::uint64_t position, std::span<char> bytes) {
        return reads++ < readsUntilTheChange ? ByteSource::memory(movie).read(position, bytes) : 0;
    });
    const Recording recording(changing, "Movie.mp4");
    recording.hiddenStreams(); // is remembered
    const EditList edits = editsOf({"0-9", "h1-1", "0-1"});
    const auto retimedAfter = [&](int readsBefore) {
        reads = 0;
        readsUntilTheChange = readsBefore;
        return retimed(recording, edits);
    };
    EXPECT_EQ(retimedAfter(readsUntilTheChange).streams.size(), 4U);
    int refusals = 0;
    for (int before = reads - 1; before >= 0; --before)
        try {
            const EditedRecording edited = retimedAfter(before);
            EXPECT_FALSE(edited.losses.empty());
        } catch (const Error& error) {
            ++refusals;
            EXPECT_STREQ(error.what(), "Movie.mp4: has changed while it was read; try again");
        }
    EXPECT_GT(refusals, 0);
}

TEST(Retiming, RetimesManyEntries) {
    Points entries;
    for (int i = 0; i < 100'000; ++i)
        entries.emplace_back(i * 0.25, i);
    Points expected;
    for (int i = 4; i < 100'000; ++i)
        expected.emplace_back(i * 0.25 - 1, i);
    EXPECT_EQ(retimedBytes(points(entries), editsOf({"1-100000"})), points(expected));
}

TEST(Retiming, DoesWhatTheOracleDoesForRandomEdits) {
    for (std::uint64_t seed = 1; seed <= 20'000; ++seed) {
        const RandomEdits random(seed);
        ASSERT_EQ(random.difference(), "") << "seed " << seed << '\n' << random.edits().json();
    }
}

} // namespace
} // namespace ZULMetaData::Test
