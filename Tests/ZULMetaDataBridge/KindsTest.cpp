// What every recorded kind has in common, checked against bytes and entries written down by hand.

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaDataBridge/EntriesAsText.h"
#include "Tests/ZULMetaDataBridge/KindSamples.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <functional>
#include <memory>
#include <set>
#include <stdexcept>
#include <string>
#include <string_view>
#include <tuple>
#include <type_traits>
#include <vector>

namespace ZULMetaData::Test {

namespace {

using testing::IsEmpty;

// ---- The list of kinds ----------------------------------------------------------------------------------------

template <class... Samples>
constexpr bool haveSamplesFor(const uuid& type, std::tuple<Samples...>*) {
    return ((Samples::Kind::type == type) || ...);
}

constexpr bool hasSamples(const uuid& type) {
    return haveSamplesFor(type, static_cast<EveryKind*>(nullptr));
}

constexpr bool everyRecordedKindHasSamples() {
    bool all = true;
    RecordedKinds::forEach([&]<class Kind>() { all = all && hasSamples(Kind::type); });
    return all;
}

static_assert(RecordedKinds::size == 17);
static_assert(std::tuple_size_v<EveryKind> == 17);
static_assert(everyRecordedKindHasSamples());

const std::set<std::string_view> s_kindsWithoutClasses{"caretPosition",          "miscellany",
                                                       "recordingCutTimes",      "deviceFrameCoordinates",
                                                       "deviceFrameAspectRatio", "deviceFrameDisplayNames"};

TEST(Registry, HasTwentyThreeKindsWithNameIdentifierAndVersionOfTheirOwn) {
    std::set<std::string_view> names;
    std::set<uuid> types;
    for (const MetaDataKind& kind : s_metaDataKinds) {
        EXPECT_FALSE(kind.name.empty());
        EXPECT_NE(kind.type, uuid{}) << kind.name;
        EXPECT_EQ(kind.currentVersion, kind.name == "cursorImage" ? 2 : 1) << kind.name;
        names.insert(kind.name);
        types.insert(kind.type);
    }
    EXPECT_EQ(names.size(), 23U);
    EXPECT_EQ(types.size(), 23U);
}

TEST(Registry, HasAWriterAndAParserForEveryKindButSix) {
    for (const MetaDataKind& kind : s_metaDataKinds)
        EXPECT_EQ(hasSamples(kind.type), !s_kindsWithoutClasses.contains(kind.name)) << kind.name;
}

TEST(RecordedKindsList, FindsEveryKindByItsIdentifier) {
    RecordedKinds::forEach([]<class Kind>() {
        int visits = 0;
        const auto visitor = [&]<class Found>() { visits += std::is_same_v<Found, Kind> ? 1 : 100; };
        EXPECT_TRUE(RecordedKinds::visit(Kind::type, visitor));
        EXPECT_EQ(visits, 1);
    });
}

TEST(RecordedKindsList, DoesNotVisitAKindThatIsNotRecorded) {
    const auto visitor = []<class Kind>() { ADD_FAILURE(); };
    EXPECT_FALSE(RecordedKinds::visit(s_caretPositionUUID, visitor));
    EXPECT_FALSE(RecordedKinds::visit(uuid{}, visitor));
}

// ---- Every kind -----------------------------------------------------------------------------------------------

/// A stream of a kind that nobody here reads, to stand beside the others in a container.
std::string neighbour() {
    return streamHeader("2b7b6aef", 1, 16) + hex("000000000000f03f 01000000 02000000");
}

std::string movieAround(const std::string& stream) {
    return atom("ftyp", "isom") + atom("mdat", "pictures") +
           extendedAtom("ZULM", extendedAtom("DATA", neighbour()) + extendedAtom("DATA", stream));
}

std::string riffFileAround(const std::string& stream) {
    return chunk("RIFF", "AVI pictures") + chunk("ZULM", chunk("DATA", neighbour()) + chunk("DATA", stream));
}

template <class S>
class RecordedKind : public testing::Test {
protected:
    using Writer = typename S::Writer;
    using Parser = typename S::Parser;

    TemporaryFolder folder;
    const FileLocation file = FileLocation(folder / "Stream.dat");

    FileLocation fileOf(const std::string& name, const std::string& contents) const {
        writeFile(folder / name, contents);
        return folder / name;
    }

    FileLocation goldenFile() const { return fileOf("Golden.dat", goldenStream<S>()); }

    static std::shared_ptr<EntryList> keptList(const Parser& parser) { return std::invoke(S::list, parser); }

    static std::vector<std::string> entriesOf(const FileLocation& location) {
        return asTexts(*Parser(location).read());
    }

    /// What is left of the golden stream's entries where it is cut to `size` bytes.
    struct Remains {
        std::vector<std::string> wholeEntries;
        std::size_t bytesOfACutEntry = 0;
    };

    static Remains remainsOf(std::size_t size) {
        Remains remains;
        std::size_t left = size - std::min(size, S::header().size());
        for (const auto& sample : S::samples()) {
            remains.bytesOfACutEntry = left;
            if (left < sample.bytes.size())
                break;
            remains.wholeEntries.push_back(sample.entry);
            left -= sample.bytes.size();
            remains.bytesOfACutEntry = 0;
        }
        return remains;
    }

    static bool isCutToAListOfNoTexts(const Remains& remains) {
        if constexpr (requires { S::listOfNoTexts; })
            return remains.bytesOfACutEntry == S::listOfNoTexts;
        return false;
    }

    static void expectRemains(const FileLocation& location, std::size_t size) {
        const Remains remains = remainsOf(size);
        Parser parser(location);
        if (isCutToAListOfNoTexts(remains))
            EXPECT_THROW(parser.read(), std::out_of_range);
        else
            EXPECT_NO_THROW(parser.read());
        std::vector<std::string> entries = asTexts(*keptList(parser));
        const bool readsTheCutEntry = remains.bytesOfACutEntry >= S::readFrom;
        ASSERT_EQ(entries.size(), remains.wholeEntries.size() + (readsTheCutEntry ? 1 : 0));
        entries.resize(remains.wholeEntries.size());
        EXPECT_EQ(entries, remains.wholeEntries);
    }
};

template <class Tuple>
struct AsTypes;
template <class... Samples>
struct AsTypes<std::tuple<Samples...>> {
    using Types = testing::Types<Samples...>;
};

TYPED_TEST_SUITE(RecordedKind, AsTypes<EveryKind>::Types, KindName);

TYPED_TEST(RecordedKind, HasTheNameThatItIsRegisteredUnder) {
    const MetaDataKind* kind = findMetaDataKind(TypeParam::Kind::type);
    ASSERT_TRUE(kind);
    EXPECT_EQ(kind->name, TypeParam::name);
}

TYPED_TEST(RecordedKind, HasClassesThatStayWhereTheyAreAndTakeALocationExplicitly) {
    using W = typename TypeParam::Writer;
    using P = typename TypeParam::Parser;
    static_assert(std::is_base_of_v<BaseMetaDataWriter, W> && std::is_base_of_v<BaseMetaDataParser, P>);
    static_assert(std::is_default_constructible_v<W> && std::is_default_constructible_v<P>);
    static_assert(!std::is_copy_constructible_v<W> && !std::is_copy_constructible_v<P>);
    static_assert(!std::is_move_constructible_v<W> && !std::is_move_constructible_v<P>);
    static_assert(!std::is_copy_assignable_v<W> && !std::is_copy_assignable_v<P>);
    static_assert(!std::is_convertible_v<FileLocation, W> && !std::is_convertible_v<FileLocation, P>);
    using StreamWriter = MetaDataWriter<typename TypeParam::Kind::Value, int, int>;
    static_assert(std::is_same_v<decltype(std::declval<W>().metaDataWriter()), StreamWriter*>);
    EXPECT_EQ(W().metaDataWriter(), nullptr);
    EXPECT_EQ(TestFixture::keptList(P()), nullptr);
}

TYPED_TEST(RecordedKind, IsRecordedAsExactlyItsBytes) {
    typename TestFixture::Writer writer(this->file);
    recordSamples<TypeParam>(writer);
    finish(writer);
    EXPECT_EQ(contentsOf(this->file), recordedStream<TypeParam>());
}

TYPED_TEST(RecordedKind, IsReadFromAStreamFile) {
    EXPECT_EQ(this->entriesOf(this->goldenFile()), goldenEntries<TypeParam>());
}

TYPED_TEST(RecordedKind, IsReadFromAMovie) {
    const FileLocation movie = this->fileOf("Movie.mp4", movieAround(goldenStream<TypeParam>()));
    EXPECT_EQ(this->entriesOf(movie), goldenEntries<TypeParam>());
}

TYPED_TEST(RecordedKind, IsReadFromARiffFile) {
    const FileLocation movie = this->fileOf("Movie.avi", riffFileAround(goldenStream<TypeParam>()));
    EXPECT_EQ(this->entriesOf(movie), goldenEntries<TypeParam>());
}

TYPED_TEST(RecordedKind, GivesAnEmptyListThatTheParserKeepsWhereTheFileHasNoSuchStream) {
    testing::internal::CaptureStdout();
    testing::internal::CaptureStderr();
    for (const FileLocation& location :
         {this->fileOf("Movie.mp4", atom("ftyp", "isom")), this->fileOf("Other.dat", neighbour()),
          this->fileOf("Other.avi", chunk("ZULM", chunk("DATA", neighbour()))),
          this->fileOf("Header.dat", TypeParam::header()), this->fileOf("Empty.dat", "")}) {
        typename TestFixture::Parser parser(location);
        const auto entries = parser.read();
        EXPECT_TRUE(entries && entries->empty()) << location;
        EXPECT_EQ(this->keptList(parser), entries) << location;
    }
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
}

TYPED_TEST(RecordedKind, GivesANewEqualListAtEveryRead) {
    typename TestFixture::Parser parser(this->goldenFile());
    const auto first = parser.read();
    const auto second = parser.read();
    EXPECT_NE(first, second);
    EXPECT_EQ(asTexts(*first), asTexts(*second));
    EXPECT_EQ(this->keptList(parser), second);
}

TYPED_TEST(RecordedKind, LetsTheApplicationReplaceTheKeptList) {
    typename TestFixture::Parser parser(this->goldenFile());
    const auto list = std::make_shared<EntryList>();
    std::invoke(TypeParam::setList, parser, list);
    EXPECT_EQ(this->keptList(parser), list);
    EXPECT_NE(parser.read(), list);
    EXPECT_THAT(*list, IsEmpty());
}

TYPED_TEST(RecordedKind, GivesTheEntriesInFrontOfACutAnywhereInAStreamFile) {
    const FileLocation stream = this->goldenFile();
    testing::internal::CaptureStdout(); // a cut header is refused with a message
    for (std::size_t size = goldenStream<TypeParam>().size() + 1; size-- > 0;) {
        SCOPED_TRACE("cut to " + std::to_string(size) + " bytes");
        resize_file(stream, size);
        this->expectRemains(stream, size);
    }
    testing::internal::GetCapturedStdout();
}

TYPED_TEST(RecordedKind, GivesTheEntriesInFrontOfACutAnywhereInAMovie) {
    const FileLocation movie = this->fileOf("Movie.mp4", movieAround(goldenStream<TypeParam>()));
    const std::size_t streamAt = movieAround("").size();
    for (std::size_t size = streamAt + goldenStream<TypeParam>().size() + 1; size-- > 0;) {
        SCOPED_TRACE("cut to " + std::to_string(size) + " bytes");
        resize_file(movie, size);
        this->expectRemains(movie, size - std::min(size, streamAt));
    }
}

TYPED_TEST(RecordedKind, IsTheSameWhetherItsClassesGetTheLocationAtOnceOrLater) {
    typename TestFixture::Writer atOnce(this->file);
    typename TestFixture::Writer later;
    EXPECT_EQ(later.initWithMetaDataFile(this->folder / "Later.dat"), &later);
    recordSamples<TypeParam>(atOnce);
    recordSamples<TypeParam>(later);
    EXPECT_EQ(later.metaDataFile(), FileLocation(this->folder / "Later.dat"));
    EXPECT_EQ(contentsOf(this->file).substr(0, 24), TypeParam::header());
    finish(atOnce);
    finish(later);
    EXPECT_EQ(contentsOf(this->folder / "Later.dat"), contentsOf(this->file));

    typename TestFixture::Parser parser;
    EXPECT_EQ(parser.initWithMetaDataFile(this->goldenFile()), &parser);
    EXPECT_EQ(parser.metaDataFile(), this->goldenFile());
    EXPECT_EQ(asTexts(*parser.read()), this->entriesOf(this->goldenFile()));
}

TYPED_TEST(RecordedKind, HasAFileOfJustItsHeaderBeforeAnythingIsRecorded) {
    const typename TestFixture::Writer writer(this->file);
    EXPECT_EQ(contentsOf(this->file), TypeParam::header());
}

TYPED_TEST(RecordedKind, ReplacesAFileThatIsThere) {
    writeFile(this->file, std::string(1000, 'x'));
    const typename TestFixture::Writer writer(this->file);
    EXPECT_EQ(contentsOf(this->file), TypeParam::header());
}

TYPED_TEST(RecordedKind, IsLostSilentlyWhereItsFileCannotBeCreated) {
    testing::internal::CaptureStdout();
    testing::internal::CaptureStderr();
    for (const FileLocation& location : {this->folder.path() / "missing" / "Stream.dat", this->folder.path()}) {
        typename TestFixture::Writer writer(location);
        recordSamples<TypeParam>(writer);
        finish(writer);
        EXPECT_FALSE(writer.metaDataWriter()->getStream().good());
    }
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
    EXPECT_FALSE(exists(this->folder.path() / "missing"));
}

TYPED_TEST(RecordedKind, IsDroppedByAWriterWithoutAFile) {
    typename TestFixture::Writer writer;
    recordSamples<TypeParam>(writer);
    finish(writer);
    EXPECT_EQ(writer.metaDataWriter(), nullptr);
}

TYPED_TEST(RecordedKind, ReportsNothingOfWhatIsWrittenAfterTheEnd) {
    typename TestFixture::Writer writer(this->file);
    recordSamples<TypeParam>(writer);
    finish(writer);
    recordSamples<TypeParam>(writer);
    finish(writer);
    EXPECT_EQ(contentsOf(this->file), recordedStream<TypeParam>());
}

TYPED_TEST(RecordedKind, IsCompleteInItsFileOnceTheWriterIsGone) {
    {
        typename TestFixture::Writer writer(this->file);
        if constexpr (requires { writer.setFlushEveryWrite(false); })
            writer.setFlushEveryWrite(false);
        recordSamples<TypeParam>(writer);
    }
    EXPECT_EQ(contentsOf(this->file), recordedStream<TypeParam>());
}

/// A byte that is not flushed shows whether the file was closed.
TYPED_TEST(RecordedKind, ClosesAnUnfinishedFileWithItsWriterUnlessItsStreamWriterStays) {
    auto writer = std::make_unique<typename TestFixture::Writer>(this->file);
    auto* streamWriter = writer->metaDataWriter();
    streamWriter->getStream() << 'x';
    EXPECT_EQ(contentsOf(this->file), TypeParam::header());
    writer.reset();
    if constexpr (!TypeParam::releasesStreamWriter) {
        EXPECT_EQ(contentsOf(this->file), TypeParam::header());
        EXPECT_TRUE(streamWriter->getStream().is_open());
        streamWriter->close();
    }
    EXPECT_EQ(contentsOf(this->file), TypeParam::header() + 'x');
}

TYPED_TEST(RecordedKind, IsRecordedAndReadUnderANameThatIsNotASCII) {
    const FileLocation location = this->folder / "Aufn\xc3\xa4hme \xe6\x98\xa0\xe7\x94\xbb.dat";
    {
        typename TestFixture::Writer writer(location);
        recordSamples<TypeParam>(writer);
    }
    EXPECT_EQ(contentsOf(location), recordedStream<TypeParam>());
    EXPECT_EQ(this->entriesOf(location).size(), TypeParam::samples().size());
}

} // namespace

} // namespace ZULMetaData::Test
