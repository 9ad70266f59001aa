#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaDataBridge/EntriesAsText.h"
#include "Tests/ZULMetaDataBridge/KindSamples.h"
#include "Tests/ZULMetaDataBridge/StreamFixture.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <limits>
#include <list>
#include <memory>
#include <stdexcept>
#include <string>
#include <tuple>
#include <vector>

namespace ZULMetaData::Test {

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

std::string cursorLocation(double time, std::int32_t x, std::int32_t y) {
    return f64(time) + raw(x) + raw(y);
}

std::string textEntry(double time, const std::string& text) {
    return le32(static_cast<std::uint32_t>(text.size() + 8)) + f64(time) + text;
}

class ParserFamily : public StreamFixture {
protected:
    const std::string locationHeader = streamHeader("2b7b6af2", 1, 16);
    const std::string titleHeader = streamHeader("2b7b6af8", 1, 0);

    std::vector<std::string> locations(const std::string& entries) const {
        return read<CursorLocationMetaDataParser>(locationHeader + entries);
    }

    std::vector<std::string> titles(const std::string& entries) const {
        return read<SlideInfoTitleMetaDataParser>(titleHeader + entries);
    }

    float timestampOf(double time) const {
        writeFile(file, locationHeader + cursorLocation(time, 1, 2));
        return CursorLocationMetaDataParser(file).read()->at(0).get<float>("timestamp");
    }

    float opacityOf(double opacity) const {
        writeFile(file, streamHeader("2b7b6af3", 1, 16) + f64(0) + f64(opacity));
        return CursorOpacityMetaDataParser(file).read()->at(0).get<float>("opacity");
    }
};

// ---- Numbers and times ----------------------------------------------------------------------------------------

TEST_F(ParserFamily, NarrowsTimesTo32Bits) {
    EXPECT_EQ(timestampOf(1234.56789), 1234.56787109375F);
    EXPECT_EQ(timestampOf(1.0 / 3.0), 0.3333333432674407958984375F);
    EXPECT_EQ(timestampOf(16777217.0), 16777216.0F);
    EXPECT_EQ(timestampOf(-0.25), -0.25F);
}

TEST_F(ParserFamily, KeepsTimesThatAreInfiniteOrNoNumbers) {
    EXPECT_EQ(timestampOf(std::numeric_limits<double>::infinity()), std::numeric_limits<float>::infinity());
    EXPECT_EQ(timestampOf(-std::numeric_limits<double>::infinity()), -std::numeric_limits<float>::infinity());
    EXPECT_TRUE(std::isnan(timestampOf(std::numeric_limits<double>::quiet_NaN())));
}

TEST_F(ParserFamily, NarrowsOpacityTo32Bits) {
    EXPECT_EQ(opacityOf(0.1), 0.100000001490116F);
    EXPECT_EQ(opacityOf(0.25), 0.25F);
}

TEST_F(ParserFamily, KeepsTheTimeOfAnEntryThatIsUsuallyWrittenAtZero) {
    EXPECT_THAT(read<ScaleFactorMetaDataParser>(streamHeader("2b7b6afb", 1, 12) + f64(2.5) + le32(3)),
                ElementsAre("scaleFactor = int32 3, timestamp = float 2.5"));
}

// ---- Many entries ---------------------------------------------------------------------------------------------

TEST_F(ParserFamily, KeepsTenThousandEntriesInTheirOrderWithAllDuplicates) {
    std::string stream = streamHeader("2b7b6a09", 1, 24);
    for (std::int32_t number = 0; number < 10000; ++number)
        stream += f64(number / 10 * 0.5) + raw(number / 10 % 7) + raw(-number / 10) + le32(1) + le32(2);
    writeFile(file, stream);
    const auto entries = HoverRectMetaDataParser(file).read();
    ASSERT_EQ(entries->size(), 10000U);
    for (std::int32_t number = 0; number < 10000; ++number) {
        const EntryDictionary& entry = entries->at(static_cast<std::size_t>(number));
        ASSERT_EQ(entry.get<std::int32_t>("x"), number / 10 % 7);
        ASSERT_EQ(entry.get<std::int32_t>("y"), -number / 10);
        ASSERT_EQ(entry.get<std::int32_t>("height"), 2);
        ASSERT_EQ(entry.get<float>("timestamp"), static_cast<float>(number / 10) * 0.5F);
    }
}

TEST_F(ParserFamily, DoesNotSortEntriesByTime) {
    EXPECT_THAT(locations(cursorLocation(2, 1, 1) + cursorLocation(1, 2, 2) + cursorLocation(2, 1, 1)),
                ElementsAre("x = int32 1, y = int32 1, timestamp = float 2",
                            "x = int32 2, y = int32 2, timestamp = float 1",
                            "x = int32 1, y = int32 1, timestamp = float 2"));
}

// ---- Texts ----------------------------------------------------------------------------------------------------

template <class S>
class TextParser : public StreamFixture {
protected:
    typename S::Parser parser{file};

    std::string textOf(const std::string& stored) const {
        writeFile(file, S::header() + textEntry(0.25, stored));
        return typename S::Parser(file).read()->at(0).template get<std::string>(std::get<0>(S::Kind::fields).key);
    }
};

using TextKinds = testing::Types<SlideInfoTitleSamples, SlideInfoTextSamples, SlideInfoCommentSamples,
                                 TopmostWindowTitleSamples, TopmostAppNameSamples>;
TYPED_TEST_SUITE(TextParser, TextKinds, KindName);

TYPED_TEST(TextParser, GivesUTF8AsItIs) {
    EXPECT_EQ(this->textOf("\xc3\xa9\xe6\x98\xa0\xf0\x9f\x8e\xac"), "\xc3\xa9\xe6\x98\xa0\xf0\x9f\x8e\xac");
}

TYPED_TEST(TextParser, EndsATextAtItsFirstZeroByte) {
    EXPECT_EQ(this->textOf(std::string("ab\0cd", 5)), "ab");
    EXPECT_EQ(this->textOf(std::string("ab\0\xff", 4)), "ab");
    EXPECT_EQ(this->textOf(std::string("\0cd", 3)), "");
}

TYPED_TEST(TextParser, RefusesATextThatIsNoUTF8AndKeepsTheEntriesInFrontOfIt) {
    writeFile(this->file, TypeParam::header() + TypeParam::samples().at(0).bytes + textEntry(1, "caf\xe9") +
                              TypeParam::samples().at(1).bytes);
    EXPECT_THROW(this->parser.read(), std::invalid_argument);
    EXPECT_THAT(asTexts(*std::invoke(TypeParam::list, this->parser)), ElementsAre(TypeParam::samples().at(0).entry));
}

TYPED_TEST(TextParser, DropsTheListOfAnEarlierReadWhenItRefusesAText) {
    writeFile(this->file, goldenStream<TypeParam>());
    const auto earlier = this->parser.read();
    writeFile(this->file, TypeParam::header() + textEntry(1, "\xff"));
    EXPECT_THROW(this->parser.read(), std::invalid_argument);
    EXPECT_THAT(*std::invoke(TypeParam::list, this->parser), IsEmpty());
    EXPECT_EQ(asTexts(*earlier), goldenEntries<TypeParam>());
}

TYPED_TEST(TextParser, ReadsOnAfterTheFileWasPutRight) {
    writeFile(this->file, TypeParam::header() + textEntry(1, "\xff"));
    EXPECT_THROW(this->parser.read(), std::invalid_argument);
    writeFile(this->file, goldenStream<TypeParam>());
    EXPECT_EQ(asTexts(*this->parser.read()), goldenEntries<TypeParam>());
}

// ---- Damage ---------------------------------------------------------------------------------------------------

TEST_F(ParserFamily, KeepsWhatCameBeforeAnEntryThatIsCutWithinItsTime) {
    const std::string entries = cursorLocation(0.25, 1, 2) + cursorLocation(0.5, 3, 4);
    for (std::size_t size = 0; size < 8; ++size)
        EXPECT_THAT(locations(entries + f64(0.75).substr(0, size)),
                    ElementsAre("x = int32 1, y = int32 2, timestamp = float 0.25",
                                "x = int32 3, y = int32 4, timestamp = float 0.5"));
}

TEST_F(ParserFamily, FillsAValueThatIsCutWithZeros) {
    const std::string entry = cursorLocation(0.25, 0x04030201, 0x08070605);
    EXPECT_THAT(locations(entry.substr(0, 8)), ElementsAre("x = int32 0, y = int32 0, timestamp = float 0.25"));
    EXPECT_THAT(locations(entry.substr(0, 10)), ElementsAre("x = int32 513, y = int32 0, timestamp = float 0.25"));
    EXPECT_THAT(locations(entry.substr(0, 13)), ElementsAre("x = int32 67305985, y = int32 5, timestamp = float 0.25"));
    EXPECT_THAT(locations(entry.substr(0, 15)),
                ElementsAre("x = int32 67305985, y = int32 460293, timestamp = float 0.25"));
}

TEST_F(ParserFamily, RepeatsTheLastCharacterOfATextThatIsCut) {
    const std::string entry = textEntry(0.25, "Intro");
    EXPECT_THAT(titles(entry.substr(0, 13)), ElementsAre("title = text 'IIIII', timestamp = float 0.25"));
    EXPECT_THAT(titles(entry.substr(0, 15)), ElementsAre("title = text 'Inttt', timestamp = float 0.25"));
    EXPECT_THAT(titles(entry.substr(0, 16)), ElementsAre("title = text 'Intrr', timestamp = float 0.25"));
}

TEST_F(ParserFamily, GivesAnEmptyTextWhereAllOfItsCharactersAreMissing) {
    const std::string entry = textEntry(0.25, "Intro");
    EXPECT_THAT(titles(entry.substr(0, 4)), ElementsAre("title = text '', timestamp = float 0"));
    EXPECT_THAT(titles(entry.substr(0, 12)), ElementsAre("title = text '', timestamp = float 0.25"));
}

TEST_F(ParserFamily, DropsATextWhoseSizeIsCut) {
    const std::string entries = textEntry(0.25, "a") + textEntry(0.5, "b");
    for (std::size_t size = 0; size < 4; ++size)
        EXPECT_THAT(titles(entries + le32(9).substr(0, size)),
                    ElementsAre("title = text 'a', timestamp = float 0.25", "title = text 'b', timestamp = float 0.5"));
}

/// A name of more than one byte is no longer UTF-8 where it ends within a character.
TEST_F(ParserFamily, RefusesATextThatIsCutWithinACharacter) {
    writeFile(file, titleHeader + textEntry(0.25, "a") + textEntry(0.5, "\xc3\xa9").substr(0, 13));
    SlideInfoTitleMetaDataParser parser(file);
    EXPECT_THROW(parser.read(), std::invalid_argument);
    EXPECT_THAT(asTexts(*parser.slideTitleData()), ElementsAre("title = text 'a', timestamp = float 0.25"));
}

// ---- Versions -------------------------------------------------------------------------------------------------

constexpr const char* s_refusal = "MetaDataReader<T>::parseFile - Version is larger than what we can handle\n";

TEST_F(ParserFamily, RefusesOtherVersionsWithALineOnStandardOutput) {
    for (const std::int32_t version : {2, 99, 2147483647, 0, -1, -2147483647}) {
        testing::internal::CaptureStdout();
        EXPECT_THAT(read<CursorLocationMetaDataParser>(streamHeader("2b7b6af2", version, 16) + cursorLocation(1, 2, 3)),
                    IsEmpty())
            << version;
        EXPECT_EQ(testing::internal::GetCapturedStdout(), s_refusal) << version;
    }
}

TEST_F(ParserFamily, RefusesCursorImagesOfLaterVersions) {
    testing::internal::CaptureStdout();
    EXPECT_THAT(read<CursorImageMetaDataParser>(streamHeader("2b7b6af1", 3, 0) +
                                                hex("1c000000 000000000000f83f 0700000000000000 08000000 00000000"
                                                    "03000000")),
                IsEmpty());
    EXPECT_EQ(testing::internal::GetCapturedStdout(), s_refusal);
}

TEST_F(ParserFamily, PrintsNothingAboutAStreamThatItReads) {
    testing::internal::CaptureStdout();
    testing::internal::CaptureStderr();
    locations(cursorLocation(0.25, 1, 2) + "torn");
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
}

// ---- Files ----------------------------------------------------------------------------------------------------

class ParsersAndFiles : public ParserFamily {
protected:
    const std::string stream = locationHeader + cursorLocation(0.25, 1, 2);

    std::string errorsOfReading(const FileLocation& location) const {
        testing::internal::CaptureStderr();
        CursorLocationMetaDataParser parser(location);
        const auto entries = parser.read();
        EXPECT_THAT(*entries, IsEmpty()) << location;
        EXPECT_EQ(parser.cursorLocationData(), entries);
        return testing::internal::GetCapturedStderr();
    }
};

TEST_F(ParsersAndFiles, GiveAnEmptyListForAFileThatIsMissing) {
    const FileLocation missing = folder / "missing.mp4";
    EXPECT_EQ(errorsOfReading(missing), "Can't parse metadata. Unable to open file: " + missing.string() + '\n');
    EXPECT_EQ(errorsOfReading(""), "Can't parse metadata. Unable to open file: \n");
}

TEST_F(ParsersAndFiles, GiveAnEmptyListForAFileOfAnotherKind) {
    for (const std::string name : {"Notes.txt", "Stream", "Stream.data", "Movie.mp4.bak"}) {
        writeFile(folder / name, stream);
        EXPECT_EQ(errorsOfReading(folder / name), "") << name;
    }
}

TEST_F(ParsersAndFiles, GiveAnEmptyListForAFolder) {
    create_directory(FileLocation(folder / "Folder.dat"));
    errorsOfReading(folder / "Folder.dat");
}

TEST_F(ParsersAndFiles, TakeExtensionsInAnyCase) {
    for (const std::string name : {"A.DAT", "a.Dat", "Recording.1.dAt"}) {
        writeFile(folder / name, stream);
        EXPECT_EQ(CursorLocationMetaDataParser(folder / name).read()->size(), 1U) << name;
    }
    for (const std::string name : {"M.MP4", "M.mov", "M.Zcap"}) {
        writeFile(folder / name, extendedAtom("ZULM", extendedAtom("DATA", stream)));
        EXPECT_EQ(CursorLocationMetaDataParser(folder / name).read()->size(), 1U) << name;
    }
    for (const std::string name : {"R.AVI", "R.wav"}) {
        writeFile(folder / name, chunk("ZULM", chunk("DATA", stream)));
        EXPECT_EQ(CursorLocationMetaDataParser(folder / name).read()->size(), 1U) << name;
    }
}

TEST_F(ParsersAndFiles, MeetOnlyInReading) {
    testing::internal::CaptureStderr();
    CursorLocationMetaDataParser parser(folder / "Later.dat");
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
    writeFile(folder / "Later.dat", stream);
    EXPECT_EQ(parser.read()->size(), 1U);
    remove(FileLocation(folder / "Later.dat"));
    testing::internal::CaptureStderr();
    EXPECT_THAT(*parser.read(), IsEmpty());
    testing::internal::GetCapturedStderr();
}

TEST_F(ParsersAndFiles, ReadTheFileAsItIsAtThatMoment) {
    writeFile(file, stream);
    CursorLocationMetaDataParser parser(file);
    const auto earlier = parser.read();
    writeFile(file, locationHeader + cursorLocation(0.5, 3, 4) + cursorLocation(0.75, 5, 6));
    EXPECT_EQ(parser.read()->size(), 2U);
    EXPECT_THAT(asTexts(*earlier), ElementsAre("x = int32 1, y = int32 2, timestamp = float 0.25"));
}

TEST_F(ParsersAndFiles, MoveToTheLocationThatIsStored) {
    writeFile(file, stream);
    CursorLocationMetaDataParser parser(folder / "missing.dat");
    parser.setMetaDataFile(file);
    EXPECT_EQ(parser.metaDataFile(), file);
    EXPECT_EQ(parser.read()->size(), 1U);
}

TEST_F(ParsersAndFiles, LeaveEntriesThatOutliveThem) {
    writeFile(file, stream);
    auto parser = std::make_unique<CursorLocationMetaDataParser>(file);
    const auto entries = parser->read();
    parser.reset();
    remove(file);
    EXPECT_THAT(asTexts(*entries), ElementsAre("x = int32 1, y = int32 2, timestamp = float 0.25"));
}

TEST_F(ParsersAndFiles, ReadWhatAWriterHasFlushedSoFar) {
    CursorLocationMetaDataWriter writer(file);
    writer.write({1, 2}, {1, 4});
    writer.write({3, 4}, {1, 2});
    CursorLocationMetaDataParser parser(file);
    EXPECT_EQ(parser.read()->size(), 1U);
    writer.finish();
    EXPECT_EQ(parser.read()->size(), 2U);
}

// ---- Copies of streams ----------------------------------------------------------------------------------------

class StreamCopies : public ParsersAndFiles {
protected:
    static std::string copyOf(const BaseMetaDataParser& parser, const uuid& type) {
        const auto copy = parser.getMetaDataStream(type);
        EXPECT_TRUE(copy && copy->good());
        return copy->str();
    }
};

TEST_F(StreamCopies, HoldTheBytesOfTheStreamHeaderIncluded) {
    writeFile(file, stream + "torn");
    EXPECT_EQ(copyOf(CursorLocationMetaDataParser(file), s_cursorLocationUUID), stream + "torn");
}

TEST_F(StreamCopies, ComeFromTheStreamOfTheirTypeWhateverTheParserIsFor) {
    const std::string titles = titleHeader + textEntry(0.5, "Intro");
    writeFile(folder / "Movie.mp4",
              atom("mdat", "x") + extendedAtom("ZULM", extendedAtom("DATA", titles) + extendedAtom("DATA", stream)));
    const CPUUsageMetaDataParser parser(folder / "Movie.mp4");
    EXPECT_EQ(copyOf(parser, s_cursorLocationUUID), stream);
    EXPECT_EQ(copyOf(parser, s_slideTitlesUUID), titles);
    EXPECT_EQ(copyOf(parser, s_cpuUsageUUID), "");
}

TEST_F(StreamCopies, AreEmptyWhereThereIsNothingToRead) {
    writeFile(folder / "Stream.txt", stream);
    testing::internal::CaptureStderr();
    EXPECT_EQ(copyOf(CursorLocationMetaDataParser(folder / "missing.dat"), s_cursorLocationUUID), "");
    EXPECT_EQ(copyOf(CursorLocationMetaDataParser(folder / "Stream.txt"), s_cursorLocationUUID), "");
    EXPECT_EQ(copyOf(CursorLocationMetaDataParser(), s_cursorLocationUUID), "");
    testing::internal::GetCapturedStderr();
}

TEST_F(StreamCopies, CanBeReadAndWrittenAndLeaveTheFileAlone) {
    writeFile(file, stream);
    const auto copy = CursorLocationMetaDataParser(file).getMetaDataStream(s_cursorLocationUUID);
    std::string first(4, '\0');
    copy->read(first.data(), 4);
    EXPECT_EQ(first, hex("2b7b6af2"));
    copy->seekp(0);
    *copy << "changed";
    EXPECT_EQ(copy->str().substr(0, 7), "changed");
    EXPECT_EQ(contentsOf(file), stream);
}

TEST_F(StreamCopies, AreNewEveryTime) {
    writeFile(file, stream);
    const CursorLocationMetaDataParser parser(file);
    EXPECT_NE(parser.getMetaDataStream(s_cursorLocationUUID), parser.getMetaDataStream(s_cursorLocationUUID));
}

// ---- The observer ---------------------------------------------------------------------------------------------

template <class T>
class Observer : public testing::Test {};

using ObservedTypes =
    testing::Types<Point, Rect, KeyStroke, CursorImage, int, float, double, std::string, std::list<std::string>>;
TYPED_TEST_SUITE(Observer, ObservedTypes);

TYPED_TEST(Observer, StartsEmptyAndKeepsEveryValueWithItsTime) {
    MetaDataObserver<TypeParam> observer;
    EXPECT_TRUE(observer.values.empty());
    EXPECT_TRUE(observer.times.empty());
    DataStreamObserver<TypeParam>& reader = observer;
    EXPECT_TRUE(reader.dataRead(2.5, TypeParam{}));
    EXPECT_TRUE(reader.dataRead(0.25, TypeParam{}));
    EXPECT_TRUE(reader.dataRead(2.5, TypeParam{}));
    EXPECT_EQ(observer.values, std::vector<TypeParam>(3));
    EXPECT_THAT(observer.times, ElementsAre(2.5, 0.25, 2.5));
}

TEST(ObserverOfPoints, KeepsTheOrderInWhichValuesCome) {
    MetaDataObserver<Point> observer;
    observer.dataRead(1, Point(1, 2));
    observer.dataRead(2, Point(3, 4));
    EXPECT_THAT(observer.values, ElementsAre(Point(1, 2), Point(3, 4)));
}

TEST(ObserverOfCursorImages, KeepsCopiesOfTheImages) {
    unsigned char bytes[] = {1, 2, 3};
    CursorImage cursor(7, 0, 0, bytes, 3, CursorTypeUnknown, CursorImage::DefaultFlags);
    MetaDataObserver<CursorImage> observer;
    observer.dataRead(1, cursor);
    EXPECT_NE(observer.values.at(0).imageData, bytes);
    EXPECT_EQ(observer.values.at(0), cursor);
    cursor.freeImageData(false);
}

} // namespace

} // namespace ZULMetaData::Test
