#include "ZULMetaDataBridge/Source/MetaDataExcerpt.h"

#include "Tests/Support/Bytes.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "ZULMetaData/Containers/MovieDuration.h"
#include "ZULMetaData/Containers/RecordingInfo.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <map>
#include <memory>
#include <sstream>
#include <stdexcept>
#include <system_error>

namespace ZULMetaData::Test {
namespace {

std::string stream(const std::string& kind) {
    return streamHeader(kind, 1, 16) + f64(1.5) + le32(3) + le32(4);
}

class Opened {
public:
    Opened(const std::string& bytes, MetaDataParser::StreamType type)
        : input_(bytes), parser_(MetaDataParser::create(input_, type)) {}

    MetaDataParser& parser() { return *parser_; }

    std::map<uuid, std::string> streams() {
        std::map<uuid, std::string> all;
        parser_->loadAllData(all);
        return all;
    }

private:
    std::istringstream input_;
    std::unique_ptr<MetaDataParser> parser_;
};

std::string excerptOf(const std::string& bytes, MetaDataParser::StreamType type) {
    return metaDataExcerpt(Opened(bytes, type).parser());
}

const std::string s_type = atom("ftyp", "isom1234");
const std::string s_metaData =
    extendedAtom("ZULM", extendedAtom("DATA", stream("2b7b6af2")) + extendedAtom("DATA", stream("2b7b6a05")));

TEST(MetaDataExcerpt, KeepsTheMetaDataOfAMovieByteForByte) {
    const std::string info = atom("ZULR", std::string(64, 'i'));
    const std::string movie = s_type + atom("mdat", std::string(5000, 'm')) + s_metaData + atom("free", "1234") + info;
    EXPECT_EQ(excerptOf(movie, MetaDataParser::QuickTime), s_type + s_metaData + info);
}

TEST(MetaDataExcerpt, IsReadLikeItsRecording) {
    const std::string movie = s_type + atom("mdat", "pictures") + s_metaData;
    Opened original(movie, MetaDataParser::QuickTime);
    Opened excerpt(metaDataExcerpt(original.parser()), MetaDataParser::QuickTime);
    EXPECT_EQ(original.streams().size(), 2U);
    EXPECT_EQ(excerpt.streams(), original.streams());
}

std::string movieHeader(std::uint32_t timescale, std::uint32_t duration) {
    return atom("moov",
                atom("mvhd", be32(0) + be32(0) + be32(0) + be32(timescale) + be32(duration) + std::string(80, '\0')) +
                    atom("udta", "about the movie"));
}

TEST(MetaDataExcerpt, TellsHowLongTheMovieIs) {
    const std::string movie = s_type + atom("mdat", "pictures") + movieHeader(600, 20020) + s_metaData;
    const std::string excerpt = excerptOf(movie, MetaDataParser::QuickTime);
    const auto duration = movieDuration(ByteSource::memory(excerpt), Container::QuickTime);
    ASSERT_TRUE(duration);
    EXPECT_NEAR(*duration, 20020.0 / 600, 1e-9);
    EXPECT_EQ(excerpt.substr(0, s_type.size()), s_type);
    EXPECT_EQ(excerpt.substr(excerpt.size() - s_metaData.size()), s_metaData);
    EXPECT_THAT(excerpt, testing::Not(testing::HasSubstr("about the movie")));
}

TEST(MetaDataExcerpt, TellsNoDurationThatTheMovieDoesNotTell) {
    const std::string movie = s_type + movieHeader(0, 20020) + s_metaData;
    EXPECT_EQ(excerptOf(movie, MetaDataParser::QuickTime), s_type + s_metaData);
}

TEST(MetaDataExcerpt, KeepsWhatTheFileHoldsOfAnAtomThatIsCutShort) {
    const std::string movie = s_type + s_metaData;
    const std::string cut = movie.substr(0, movie.size() - 5);
    EXPECT_EQ(excerptOf(cut, MetaDataParser::QuickTime), cut);
}

TEST(MetaDataExcerpt, LeavesOutAnAtomWithoutAnEnd) {
    const std::string open = be32(0) + "ZULM" + be64(0) + "rest";
    EXPECT_EQ(excerptOf(s_type + open, MetaDataParser::QuickTime), s_type);
}

TEST(MetaDataExcerpt, OfARIFFFileIsOne) {
    const std::string metaData = chunk("ZULM", chunk("DATA", stream("2b7b6af2")));
    const std::string file = chunk("RIFF", "WAVE" + chunk("data", "sound")) + metaData;
    EXPECT_EQ(excerptOf(file, MetaDataParser::Riff), chunk("RIFF", "WAVE") + metaData);
    Opened excerpt(excerptOf(file, MetaDataParser::Riff), MetaDataParser::Riff);
    EXPECT_THAT(excerpt.streams(), testing::ElementsAre(testing::Pair(testing::_, stream("2b7b6af2"))));
}

TEST(MetaDataExcerpt, OfABareStreamIsAllOfIt) {
    EXPECT_EQ(excerptOf(stream("2b7b6af2"), MetaDataParser::RawStream), stream("2b7b6af2"));
}

/// Cannot be read from some position on.
class FailingBuffer : public std::stringbuf {
public:
    FailingBuffer(const std::string& bytes, std::size_t end) : std::stringbuf(bytes), end_(end) {}
    std::size_t end_;

protected:
    std::streamsize xsgetn(char* bytes, std::streamsize count) override {
        if (static_cast<std::size_t>(gptr() - eback()) + static_cast<std::size_t>(count) > end_)
            throw std::runtime_error("the disk is broken");
        return std::stringbuf::xsgetn(bytes, count);
    }
    int_type underflow() override { return traits_type::eof(); }
};

TEST(MetaDataExcerpt, IsNoneWhereTheRecordingCannotBeRead) {
    const std::string movie = s_type + atom("mdat", std::string(5000, 'm')) + s_metaData;
    FailingBuffer buffer(movie, movie.size());
    std::istream input(&buffer);
    const auto parser = MetaDataParser::create(input, MetaDataParser::QuickTime);
    EXPECT_EQ(metaDataExcerpt(*parser), s_type + s_metaData);
    for (const std::size_t end : {std::size_t{4}, s_type.size() + 4, movie.size() - 1}) {
        buffer.end_ = end;
        EXPECT_THROW(metaDataExcerpt(*parser), std::system_error) << end;
    }
}

TEST(MetaDataExcerpt, OfAMovieWithoutMetaDataIsItsTypeAlone) {
    EXPECT_EQ(excerptOf(s_type + atom("mdat", "pictures"), MetaDataParser::QuickTime), s_type);
    EXPECT_EQ(excerptOf("", MetaDataParser::QuickTime), "");
}

} // namespace
} // namespace ZULMetaData::Test
