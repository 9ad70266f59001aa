#include "Bindings/JavaScript/zulmetadata_c.h"

#include "Tests/Support/InvalidCorpus.h"
#include "Tests/Tools/OddFiles.h"
#include "Tests/Tools/RecordedSession.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <memory>

namespace ZULMetaData::Test {
namespace {

using nlohmann::json;
using testing::HasSubstr;

/// What a caller has: bytes, and whether they can be read.
struct Source {
    std::string bytes;
    bool fails = false;

    static std::int64_t readAt(void* context, std::uint64_t position, void* bytes, std::size_t size) {
        const auto& source = *static_cast<const Source*>(context);
        if (source.fails)
            return -1;
        if (position >= source.bytes.size())
            return 0;
        return static_cast<std::int64_t>(source.bytes.copy(static_cast<char*>(bytes), size, position));
    }
};

struct Close {
    void operator()(ZulmRecording* recording) const { zulm_close(recording); }
    void operator()(ZulmEntries* entries) const { zulm_free_entries(entries); }
    void operator()(ZulmText* text) const { zulm_free_text(text); }
};

using OpenRecording = std::unique_ptr<ZulmRecording, Close>;
using ReadEntries = std::unique_ptr<ZulmEntries, Close>;

OpenRecording opened(Source& source, const std::string& name) {
    return OpenRecording(zulm_open(Source::readAt, &source, source.bytes.size(), name.c_str()));
}

std::string taken(ZulmText* text) {
    const std::unique_ptr<ZulmText, Close> owner(text);
    return text ? std::string(zulm_text_bytes(text), zulm_text_size(text)) : zulm_last_error();
}

template <class Value>
std::vector<Value> valuesOf(const ZulmEntries* entries, std::size_t column) {
    const auto* values = static_cast<const Value*>(zulm_column(entries, column)->values);
    return {values, values + zulm_entry_count(entries)};
}

/// The bytes that entry `entry` has in a column of texts or bytes.
std::string textOf(const ZulmEntries* entries, std::size_t column, std::size_t entry) {
    const ZulmColumn& shown = *zulm_column(entries, column);
    const std::uint32_t number = static_cast<const std::uint32_t*>(shown.values)[entry];
    if (number == ZulmNothing)
        return "(nothing)";
    const std::uint64_t start = number == 0 ? 0 : shown.ends[number - 1];
    return {shown.pool + start, shown.pool + shown.ends[number]};
}

class CInterface : public RecordedSession {
protected:
    void SetUp() override { source_.bytes = contentsOf(movie()); }

    OpenRecording open() { return opened(source_, "Recording.mp4"); }

    Source source_;
};

TEST_F(CInterface, TellsWhatARecordingHolds) {
    const OpenRecording recording = open();
    ASSERT_TRUE(recording) << zulm_last_error();
    EXPECT_STREQ(zulm_container(recording.get()), "movie");
    EXPECT_EQ(zulm_duration(recording.get()), 20.0);
    ASSERT_EQ(zulm_stream_count(recording.get()), 17U);
    std::size_t cursors = 0;
    while (std::string(zulm_stream(recording.get(), cursors)->kind) != "cursorLocation")
        ++cursors;
    const ZulmStream& stream = *zulm_stream(recording.get(), cursors);
    EXPECT_STREQ(stream.uuid, "2b7b6af2-7a1f-11e2-83d0-0017f200be7f");
    EXPECT_EQ(stream.version, 1);
    EXPECT_EQ(stream.entries, 1200U);
    EXPECT_EQ(stream.bytes, 24U + 1200 * 16);
    EXPECT_EQ(source_.bytes.substr(stream.offset, 4), "\x2b\x7b\x6a\xf2");
    EXPECT_EQ(stream.first, 0);
    EXPECT_NEAR(stream.last, 19.983, 0.001);
    EXPECT_EQ(stream.isKnown, 1);
}

TEST_F(CInterface, GivesEntriesAsColumns) {
    source_.bytes = locations();
    const OpenRecording recording = opened(source_, "a.dat");
    const ReadEntries entries(zulm_read_entries(recording.get(), "cursorLocation"));
    ASSERT_TRUE(entries) << zulm_last_error();
    ASSERT_EQ(zulm_entry_count(entries.get()), 3U);
    EXPECT_THAT(std::vector(zulm_entry_times(entries.get()), zulm_entry_times(entries.get()) + 3),
                testing::ElementsAre(0.5, 0.1, 2));
    ASSERT_EQ(zulm_column_count(entries.get()), 2U);
    EXPECT_STREQ(zulm_column(entries.get(), 0)->name, "x");
    EXPECT_EQ(zulm_column(entries.get(), 1)->type, ZulmInt32);
    EXPECT_THAT(valuesOf<std::int32_t>(entries.get(), 0), testing::ElementsAre(10, 0, 3));
    EXPECT_THAT(valuesOf<std::int32_t>(entries.get(), 1), testing::ElementsAre(-20, 7, 4));
}

TEST_F(CInterface, KeepsTextsThatRepeatOnce) {
    source_.bytes = streamHeader("2b7b6a06", 1, 0) + textEntry(1, "Editor") + textEntry(2, "Te\xffxt") +
                    textEntry(3, "Editor") + textEntry(4, "");
    const OpenRecording recording = opened(source_, "a.dat");
    const ReadEntries entries(zulm_read_entries(recording.get(), "topmostAppName"));
    ASSERT_TRUE(entries) << zulm_last_error();
    EXPECT_EQ(zulm_column(entries.get(), 0)->type, ZulmTexts);
    EXPECT_EQ(zulm_column(entries.get(), 0)->distinct, 3U);
    EXPECT_THAT(valuesOf<std::uint32_t>(entries.get(), 0), testing::ElementsAre(0, 1, 0, 2));
    EXPECT_EQ(textOf(entries.get(), 0, 1), "Te\xef\xbf\xbdxt");
    EXPECT_EQ(textOf(entries.get(), 0, 2), "Editor");
    EXPECT_EQ(textOf(entries.get(), 0, 3), "");
}

TEST_F(CInterface, GivesCursorImagesAsTheyAreStored) {
    const OpenRecording recording = open();
    const ReadEntries entries(zulm_read_entries(recording.get(), "cursorImage"));
    ASSERT_TRUE(entries) << zulm_last_error();
    EXPECT_EQ(zulm_column(entries.get(), 0)->type, ZulmBytes);
    EXPECT_THAT(textOf(entries.get(), 0, 0), testing::StartsWith("\x89PNG"));
    EXPECT_THAT(source_.bytes, HasSubstr(textOf(entries.get(), 0, 0)));
    EXPECT_EQ(textOf(entries.get(), 0, zulm_entry_count(entries.get()) - 1), "(nothing)");
    EXPECT_EQ(zulm_column(entries.get(), 1)->type, ZulmUInt64);
    EXPECT_EQ(valuesOf<std::uint64_t>(entries.get(), 1).front(), 11);
}

TEST_F(CInterface, GivesRealNumbersWithTheDigitsThatTellThem) {
    source_.bytes = streamHeader("2b7b6a08", 1, 12) + f64(1) + raw(39.00953F);
    const OpenRecording recording = opened(source_, "a.dat");
    const ReadEntries entries(zulm_read_entries(recording.get(), "cpuUsage"));
    ASSERT_TRUE(entries) << zulm_last_error();
    EXPECT_THAT(valuesOf<double>(entries.get(), 0), testing::ElementsAre(39.00953));
}

TEST_F(CInterface, ReturnsKeysAsCaptionsShowThem) {
    const std::string keys = f64(1.25) + le32('i') + le32(0) + f64(1) + le32('h') + le32(0) + f64(1.5) + le32('S') +
                             le32(0x100000) + f64(5) + le32(13) + le32(0);
    source_.bytes = streamHeader("2b7b6af5", 1, 16) + keys;
    const OpenRecording recording = opened(source_, "a.dat");
    const ReadEntries shown(zulm_insight(recording.get(), "captions", "shows_keys=1"));
    ASSERT_TRUE(shown) << zulm_last_error();
    ASSERT_EQ(zulm_entry_count(shown.get()), 4U);
    EXPECT_THAT(std::vector(zulm_entry_times(shown.get()), zulm_entry_times(shown.get()) + 4),
                testing::ElementsAre(1, 1.25, 1.5, 5));
    ASSERT_EQ(zulm_column_count(shown.get()), 4U);
    EXPECT_STREQ(zulm_column(shown.get(), 0)->name, "label");
    EXPECT_EQ(textOf(shown.get(), 0, 0), "h");
    EXPECT_EQ(textOf(shown.get(), 0, 2), "\xe2\x8c\x98S");
    EXPECT_EQ(textOf(shown.get(), 0, 3), "[returnKey]");
    EXPECT_STREQ(zulm_column(shown.get(), 1)->name, "is_typed");
    EXPECT_THAT(valuesOf<std::int32_t>(shown.get(), 1), testing::ElementsAre(1, 1, 0, 0));
    EXPECT_STREQ(zulm_column(shown.get(), 2)->name, "first");
    EXPECT_THAT(valuesOf<std::int32_t>(shown.get(), 2), testing::ElementsAre(0, 0, 0, 3));
    EXPECT_STREQ(zulm_column(shown.get(), 3)->name, "end");
    EXPECT_THAT(valuesOf<double>(shown.get(), 3), testing::ElementsAre(3, 3, 3, 6.5));
    const ReadEntries shortcuts(zulm_insight(recording.get(), "captions", "shows_shortcuts=1"));
    EXPECT_EQ(textOf(shortcuts.get(), 0, 0), "\xe2\x80\xa2");
    EXPECT_EQ(textOf(shortcuts.get(), 0, 2), "\xe2\x8c\x98S");
    const ReadEntries masked(zulm_insight(recording.get(), "captions", nullptr));
    EXPECT_EQ(textOf(masked.get(), 0, 2), "\xe2\x8c\x98\xe2\x80\xa2");
    EXPECT_EQ(textOf(masked.get(), 0, 0), "\xe2\x80\xa2");
    EXPECT_EQ(textOf(masked.get(), 0, 3), "[returnKey]");
}

TEST_F(CInterface, GivesWhatALaterStreamOfTheKindHides) {
    const std::string later = streamHeader("2b7b6af2", 1, 16) + pointEntry(1, 8, 9);
    source_.bytes = movieWith(extendedAtom("DATA", locations()) + extendedAtom("DATA", later));
    const OpenRecording recording = opened(source_, "Two.mp4");
    ASSERT_TRUE(recording) << zulm_last_error();
    const ReadEntries found(zulm_read_entries(recording.get(), "cursorLocation"));
    EXPECT_THAT(valuesOf<std::int32_t>(found.get(), 0), testing::ElementsAre(8));
    ASSERT_EQ(zulm_stream_count(recording.get()), 1U);
    ASSERT_EQ(zulm_hidden_count(recording.get()), 1U);
    EXPECT_STREQ(zulm_hidden(recording.get(), 0)->kind, "cursorLocation");
    EXPECT_EQ(zulm_hidden(recording.get(), 0)->entries, 3U);
    EXPECT_LT(zulm_hidden(recording.get(), 0)->offset, zulm_stream(recording.get(), 0)->offset);
    const ReadEntries hidden(zulm_read_hidden(recording.get(), 0));
    ASSERT_TRUE(hidden) << zulm_last_error();
    EXPECT_THAT(valuesOf<std::int32_t>(hidden.get(), 0), testing::ElementsAre(10, 0, 3));
}

TEST_F(CInterface, GivesStreamsBehindDamage) {
    const std::string torn = be32(1) + "DATA" + be64(16 + locations().size() + 9) + locations();
    source_.bytes = movieWith(torn + extendedAtom("DATA", streamHeader("2b7b6a06", 1, 0) + textEntry(1, "Editor")));
    const OpenRecording recording = opened(source_, "Torn.mp4");
    ASSERT_TRUE(recording) << zulm_last_error();
    ASSERT_EQ(zulm_hidden_count(recording.get()), 1U);
    EXPECT_STREQ(zulm_hidden(recording.get(), 0)->kind, "topmostAppName");
    const ReadEntries hidden(zulm_read_hidden(recording.get(), 0));
    ASSERT_TRUE(hidden) << zulm_last_error();
    EXPECT_EQ(textOf(hidden.get(), 0, 0), "Editor");
}

TEST_F(CInterface, HidesNothingWhereEveryStreamIsFound) {
    EXPECT_EQ(zulm_hidden_count(open().get()), 0U);
    source_.bytes = locations();
    EXPECT_EQ(zulm_hidden_count(opened(source_, "a.dat").get()), 0U);
    source_.bytes = oddMovie();
    EXPECT_EQ(zulm_hidden_count(opened(source_, "Odd.mp4").get()), 0U);
}

TEST_F(CInterface, PrintsWhatTheToolPrints) {
    const OpenRecording recording = open();
    const json info = json::parse(taken(zulm_info(recording.get())));
    EXPECT_EQ(info.at("path"), "Recording.mp4");
    EXPECT_EQ(info.at("streams").size(), 17U);
    EXPECT_EQ(json::parse(taken(zulm_verify(recording.get()))).at("damaged"), false);
    const json all = json::parse(taken(zulm_dump(recording.get(), nullptr)));
    EXPECT_EQ(all.at("files").at(0).at("streams").size(), 17U);
    const json some = json::parse(taken(zulm_dump(recording.get(), "slideText,cpuUsage,slideText")));
    EXPECT_EQ(some.at("files").at(0).at("streams").size(), 2U);
    EXPECT_EQ(some.at("files").at(0).at("streams").at(0).at("kind"), "slideText");
}

TEST_F(CInterface, SaysWhatItCannotDo) {
    source_.bytes = std::string(100, '\0');
    EXPECT_FALSE(opened(source_, "notes.txt"));
    EXPECT_STREQ(zulm_last_error(), "notes.txt: begins neither like a movie, nor a RIFF file, nor a stream");
    source_.bytes = oddMovie();
    const OpenRecording recording = opened(source_, "Odd.mp4");
    ASSERT_TRUE(recording);
    EXPECT_FALSE(zulm_read_entries(recording.get(), "slideText"));
    EXPECT_STREQ(zulm_last_error(), "Odd.mp4: holds no stream slideText");
    EXPECT_FALSE(zulm_insight(recording.get(), "moods", nullptr));
    EXPECT_STREQ(zulm_last_error(), "there are no insights moods");
    EXPECT_FALSE(zulm_insight(recording.get(), "idle", "least"));
    EXPECT_STREQ(zulm_last_error(), "the parameters are not a list such as least=3,flicker=1");
    EXPECT_FALSE(zulm_retime(recording.get(), R"({"schema": 1})", nullptr, nullptr));
    EXPECT_STREQ(zulm_last_error(), "edits: \"schema\" is not \"zulm.edits\"");
    EXPECT_FALSE(zulm_read_entries(recording.get(), zulm_stream(recording.get(), 0)->uuid));
    EXPECT_THAT(zulm_last_error(), HasSubstr("cannot be decoded"));
    EXPECT_TRUE(std::isnan(zulm_stream(recording.get(), 0)->first) || zulm_stream(recording.get(), 0)->isKnown == 0);
}

TEST_F(CInterface, WarnsOfWhatIsMissing) {
    const std::string times = streamHeader("2b7b6af2", 1, 16) + pointEntry(NAN, 1, 2) + pointEntry(1, 3, 4);
    const std::string apps = streamHeader("2b7b6a06", 1, 8) + textEntry(1, "Editor");
    source_.bytes = movieWith(extendedAtom("DATA", times) + extendedAtom("DATA", apps));
    const OpenRecording recording = opened(source_, "Odd.mp4");
    ASSERT_TRUE(recording) << zulm_last_error();
    const ReadEntries retimed(zulm_retime(
        recording.get(), R"({"schema": "zulm.edits", "schema_version": 1, "pieces": []})", nullptr, nullptr));
    ASSERT_TRUE(retimed) << zulm_last_error();
    ASSERT_EQ(zulm_warning_count(retimed.get()), 2U);
    EXPECT_THAT(zulm_warning(retimed.get(), 0), HasSubstr("topmostAppName"));
    EXPECT_THAT(zulm_warning(retimed.get(), 1), HasSubstr("cursorLocation"));
    constexpr double time = 2;
    const ReadEntries states(zulm_states(recording.get(), &time, 1, 1));
    ASSERT_TRUE(states) << zulm_last_error();
    ASSERT_EQ(zulm_warning_count(states.get()), 1U);
    EXPECT_STREQ(zulm_warning(states.get(), 0),
                 "the stream topmostAppName states entries of 8 bytes instead of varying size; its header is damaged");
}

TEST_F(CInterface, ReadsEditListsOfOtherPrograms) {
    const OpenRecording recording = open();
    const auto movedPositions = [&](const char* edits, const char* name, const char* frameRate) {
        const ReadEntries retimed(zulm_retime(recording.get(), edits, name, frameRate));
        if (!retimed)
            return std::string(zulm_last_error());
        for (std::size_t row = 0; row < zulm_entry_count(retimed.get()); ++row)
            if (textOf(retimed.get(), 0, row) == "cursorLocation")
                return std::to_string(valuesOf<double>(retimed.get(), 3).at(row));
        return std::string("no positions");
    };
    EXPECT_EQ(movedPositions("19,\n", "cuts.csv", nullptr), "60.000000"); // until the end of the recording
    const char* decisions = "001  AX V C 00:00:01:00 00:00:02:00 00:00:00:00 00:00:01:00\n";
    EXPECT_EQ(movedPositions(decisions, "a.edl", "25"), "60.000000");
    EXPECT_EQ(movedPositions(decisions, "a.edl", nullptr),
              "a.edl: an edit decision list counts frames; name its frame rate");
    EXPECT_EQ(movedPositions(decisions, "a.edl", "fast"), "fast is no frame rate such as 25, 29.97 or 30000/1001");
}

TEST_F(CInterface, HasAllColumnsOfWhatHasNoRows) {
    source_.bytes = streamHeader("2b7b6a06", 1, 0) + textEntry(1, "Editor");
    const OpenRecording recording = opened(source_, "a.dat");
    ASSERT_TRUE(recording) << zulm_last_error();
    const ReadEntries path(zulm_insight(recording.get(), "cursor_path", nullptr));
    ASSERT_TRUE(path) << zulm_last_error();
    EXPECT_EQ(zulm_entry_count(path.get()), 0U);
    EXPECT_EQ(zulm_column_count(path.get()), 2U);
}

TEST_F(CInterface, SaysThatBytesCannotBeRead) {
    const OpenRecording recording = open();
    source_.fails = true;
    EXPECT_FALSE(opened(source_, "Gone.mp4"));
    EXPECT_THAT(zulm_last_error(), HasSubstr("Gone.mp4: cannot be read"));
    EXPECT_FALSE(opened(source_, "Gone"));
    EXPECT_THAT(zulm_last_error(), HasSubstr("cannot be read"));
}

TEST_F(CInterface, LivesThroughEveryDamagedFile) {
    for (const InvalidFile& file : invalidCorpus()) {
        source_.bytes = contentsOf(file.path);
        const OpenRecording recording = opened(source_, file.path);
        ASSERT_TRUE(recording) << file.name << ": " << zulm_last_error();
        EXPECT_TRUE(json::parse(taken(zulm_verify(recording.get()))).at("damage_count").is_number()) << file.name;
        EXPECT_TRUE(json::accept(taken(zulm_info(recording.get())))) << file.name;
        EXPECT_TRUE(json::accept(taken(zulm_dump(recording.get(), nullptr)))) << file.name;
        for (std::size_t i = 0; i < zulm_stream_count(recording.get()); ++i) {
            const ZulmStream& stream = *zulm_stream(recording.get(), i);
            const ReadEntries entries(zulm_read_entries(recording.get(), stream.uuid));
            EXPECT_EQ(entries != nullptr, stream.isKnown == 1) << file.name;
            EXPECT_LE(entries ? zulm_entry_count(entries.get()) : 0, stream.entries) << file.name;
        }
        for (const char* name : {"clicks", "captions", "idle", "chapters", "zooms", "cursor_speed"})
            EXPECT_TRUE(ReadEntries(zulm_insight(recording.get(), name, nullptr))) << file.name << zulm_last_error();
        constexpr double time = 0.5;
        const ReadEntries states(zulm_states(recording.get(), &time, 1, 1));
        EXPECT_EQ(states ? zulm_entry_count(states.get()) : 0, 1U) << file.name << zulm_last_error();
        for (std::size_t i = 0; i < zulm_hidden_count(recording.get()); ++i) {
            const ReadEntries entries(zulm_read_hidden(recording.get(), i));
            EXPECT_EQ(entries != nullptr, zulm_hidden(recording.get(), i)->isKnown == 1) << file.name;
        }
    }
}

} // namespace
} // namespace ZULMetaData::Test
