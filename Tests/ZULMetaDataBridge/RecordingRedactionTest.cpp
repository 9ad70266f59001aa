#include "ZULMetaDataBridge/Source/RecordingRedaction.h"

#include "Tests/Support/Files.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <functional>
#include <system_error>

namespace ZULMetaData::Test {
namespace {

using Reason = RedactionError::Reason;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;

const std::string s_secret = "Salary list";
const std::string s_ellipsis = s_hiddenText;

std::string names(const std::string& text) {
    return streamHeader(s_appNames, 1, 0) + textEntry(1, text);
}

std::string be16(std::size_t value) {
    return be32(static_cast<std::uint32_t>(value)).substr(2);
}

std::string utf16(const std::string& ascii, bool isBigEndian) {
    std::string bytes;
    for (const char c : ascii)
        bytes += isBigEndian ? std::string{'\0', c} : std::string{c, '\0'};
    return bytes;
}

std::string fullAtom(const std::string& type, const std::string& payload) {
    return atom(type, be32(0) + payload);
}

/// Chapters as one atom: a title of s_secret at 0 s.
std::string chapterList(const std::string& title) {
    return atom("chpl", hex("01000000 00000000 01") + be64(0) + static_cast<char>(title.size()) + title);
}

std::string handler(const std::string& type, const std::string& name) {
    return fullAtom("hdlr", be32(0) + type + std::string(12, '\0') + name + '\0');
}

/// A track of samples that follow each other from `offset` on.
std::string track(std::uint32_t id, const std::string& type, std::uint32_t offset,
                  const std::vector<std::string>& samples, const std::string& further = {}) {
    std::string sizes;
    for (const std::string& sample : samples)
        sizes += be32(static_cast<std::uint32_t>(sample.size()));
    const auto count = static_cast<std::uint32_t>(samples.size());
    const std::string tables = fullAtom("stsc", be32(1) + be32(1) + be32(count) + be32(1)) +
                               fullAtom("stsz", be32(0) + be32(count) + sizes) +
                               fullAtom("stco", be32(1) + be32(offset));
    return atom("trak", fullAtom("tkhd", be32(0) + be32(0) + be32(id)) + further +
                            atom("mdia", handler(type, "") + atom("minf", atom("stbl", tables))));
}

std::string textSample(const std::string& text) {
    return be16(text.size()) + text;
}

std::string chapterReference(std::uint32_t id) {
    return atom("tref", atom("chap", be32(id)));
}

class RecordingRedactionTest : public testing::Test {
protected:
    RecordingRedaction hiding(const std::string& word) const {
        RecordingRedaction redaction;
        redaction.streams.hidesText = [word](const std::string& text) { return text.find(word) != std::string::npos; };
        return redaction;
    }

    RecordingRedaction hidingWithChapters(const std::string& word) const {
        RecordingRedaction redaction = hiding(word);
        redaction.removesChapters = true;
        return redaction;
    }

    std::string redacted(const std::string& recording, const RecordingRedaction& redaction,
                         MetaDataParser::StreamType type = MetaDataParser::QuickTime) {
        result = RecordingRedactor(ByteSource::memory(recording), type, redaction).write(folder / "copy");
        return contentsOf(folder / "copy");
    }

    RedactionError errorOf(const std::string& recording, const RecordingRedaction& redaction,
                           MetaDataParser::StreamType type = MetaDataParser::QuickTime) {
        try {
            redacted(recording, redaction, type);
        } catch (const RedactionError& error) {
            return error;
        }
        ADD_FAILURE() << "nothing is thrown";
        return {Reason::CannotWrite, ""};
    }

    std::vector<std::string> paths() const {
        std::vector<std::string> all;
        for (const RedactedPlace& place : result.places)
            all.push_back(place.path);
        return all;
    }

    TemporaryFolder folder;
    RedactedRecording result;
};

TEST_F(RecordingRedactionTest, RefusesATextThatStaysInTheMovieAndRemovesItIfAsked) {
    const std::string xmp = hex("be7acfcb 97a9 42e8 9c71 999491e3afac");
    const std::string data = atom("data", be32(1) + be32(0) + s_secret);
    const std::string wide = atom("data", be32(2) + be32(0) + utf16(s_secret, true));
    const std::vector<std::pair<std::string, std::string>> movies{
        {"moov/udta/chpl", atom("moov", atom("udta", chapterList(s_secret)))},
        {"moov/udta/\xc2\xa9nam",
         atom("moov", atom("udta", atom("\xa9nam", be16(s_secret.size()) + be16(0) + s_secret)))},
        {"moov/udta/titl", atom("moov", atom("udta", fullAtom("titl", be16(0) + s_secret + '\0')))},
        {"moov/trak/udta/name", atom("moov", atom("trak", atom("udta", atom("name", s_secret))))},
        {"moov/udta/meta/ilst/\xc2\xa9nam/data",
         atom("moov", atom("udta", fullAtom("meta", handler("mdir", "") + atom("ilst", atom("\xa9nam", data)))))},
        {"moov/udta/meta/ilst/desc/data",
         atom("moov", atom("udta", fullAtom("meta", handler("mdir", "") + atom("ilst", atom("desc", wide)))))},
        {"moov/meta/ilst/#1/data", atom("moov", atom("meta", handler("mdta", "") + atom("ilst", atom(be32(1), data))))},
        {"meta/xml ", fullAtom("meta", handler("mp7t", "") + fullAtom("xml ", "<t>" + s_secret + "</t>"))},
        {"uuid", atom("uuid", xmp + "<dc:title>" + s_secret + "</dc:title>")},
        {"moov/udta/abcd", atom("moov", atom("udta", atom("abcd", hex("0001") + s_secret + hex("02"))))},
    };
    for (const auto& [path, texts] : movies) {
        const std::string movie = media() + texts + zulmAtom({names(s_secret)});
        const RedactionError error = errorOf(movie, hiding("ala"));
        EXPECT_EQ(error.reason(), Reason::TextStays) << path;
        EXPECT_THAT(error.what(), HasSubstr(path + " at offset "));
        const std::string copy = redacted(movie, hidingWithChapters("ala"));
        EXPECT_THAT(copy, Not(HasSubstr(s_secret))) << path;
        EXPECT_THAT(copy, Not(HasSubstr(utf16(s_secret, true)))) << path;
        EXPECT_EQ(copy.substr(0, media().size()), media());
        EXPECT_EQ(copy.size(), movie.size() - s_secret.size() + s_ellipsis.size()) << path;
        EXPECT_EQ(paths().size(), 1U);
    }
}

TEST_F(RecordingRedactionTest, RemovesChaptersThoughNoTextIsHidden) {
    const std::string moov = atom("moov", atom("mvhd", "head") + atom("udta", chapterList("One")));
    RecordingRedaction redaction;
    redaction.removesChapters = true;
    EXPECT_EQ(redacted(media() + moov + zulmAtom({names("a")}), redaction),
              media() +
                  atom("moov", atom("mvhd", "head") + atom("free", std::string(chapterList("One").size(), '\0'))) +
                  zulmAtom({names("a")}));
    EXPECT_THAT(paths(), ElementsAre("moov/udta"));
    EXPECT_EQ(redacted(media() + moov, redaction).size(), (media() + moov).size()) << "without any stream";
}

TEST_F(RecordingRedactionTest, RemovesATrackOfChaptersWithItsSamples) {
    const std::vector<std::string> titles{textSample("One"), textSample(s_secret)};
    const std::string samples = titles[0] + titles[1];
    const auto movie = [&](const std::string& mediaData, const std::string& reference, const std::string& chapters) {
        return atom("mdat", mediaData) + atom("moov", track(1, "vide", 8, {"pictures"}, reference) + chapters) +
               zulmAtom({names("a")});
    };
    const std::string chapters = track(2, "text", 8 + 8, titles);
    const std::string original = movie("pictures" + samples + "sound", chapterReference(2), chapters);
    EXPECT_THAT(errorOf(original, hiding("ala")).what(), HasSubstr("moov/trak at offset "));
    EXPECT_EQ(redacted(original, hidingWithChapters("x")),
              movie("pictures" + std::string(samples.size(), '\0') + "sound",
                    atom("free", std::string(chapterReference(2).size() - 8, '\0')),
                    atom("free", std::string(chapters.size() - 8, '\0'))));
    EXPECT_THAT(paths(), ElementsAre("moov/trak/tref", "moov/trak"));
}

TEST_F(RecordingRedactionTest, RefusesACaptionThatItCannotRemove) {
    const std::string captions = atom("moov", track(1, "sbtl", 8, {textSample("see " + s_secret)}));
    const std::string movie = atom("mdat", textSample("see " + s_secret)) + captions + zulmAtom({names(s_secret)});
    EXPECT_EQ(errorOf(movie, hidingWithChapters("ala")).reason(), Reason::TextCannotGo);
    const std::string other = atom("mdat", textSample("see " + s_secret)) + captions + zulmAtom({names("a")});
    EXPECT_EQ(redacted(other, hidingWithChapters("ala")), other) << "a pattern for titles is not for captions";
}

TEST_F(RecordingRedactionTest, RefusesTextsThatItCannotReachAndNamesThePlace) {
    const std::string sample = textSample("One");
    const auto movie = [&](const std::string& moov) {
        return atom("mdat", "pictures" + sample) + atom("moov", moov) + zulmAtom({names("a")});
    };
    const std::string video = track(1, "vide", 8, {"pictures"}, chapterReference(2));
    const std::vector<std::pair<std::string, std::string>> movies{
        {"moov/cmov at offset 29 is compressed", movie(atom("cmov", "zipped"))},
        {"outside of the media data", movie(video + track(2, "text", 4, {sample}))},
        {"outside of the media data", movie(video + track(2, "text", 0xfffffff0, {sample}))},
        {"shares its texts with another track", movie(video + track(2, "text", 12, {sample}))},
        {"does not say where its texts are",
         movie(video + atom("trak", fullAtom("tkhd", be64(0) + be32(2)) + atom("mdia", handler("text", ""))))},
        {"has its texts in fragments", movie(video + track(2, "text", 16, {sample})) + atom("moof", "")},
    };
    for (const auto& [sentence, bytes] : movies) {
        EXPECT_EQ(errorOf(bytes, hidingWithChapters("x")).reason(), Reason::TextCannotGo) << sentence;
        EXPECT_THAT(errorOf(bytes, hidingWithChapters("x")).what(), HasSubstr(sentence));
        RecordingRedaction keys;
        keys.streams.clearsKeys = true;
        EXPECT_FALSE(redacted(bytes, keys).empty()) << "no text is to go";
    }
}

TEST_F(RecordingRedactionTest, FindsALongTextAnywhereInTheCopyInEveryEncoding) {
    const std::string stored = "Gro\xc3\x9f"
                               "es Geheimnis";
    const std::string latin = "Gro\xdf"
                              "es Geheimnis";
    const auto wide = [&](bool isBigEndian) { return utf16(latin, isBigEndian); };
    for (const std::string& leak : {stored, latin, wide(true), wide(false)}) {
        const std::string movie = atom("mdat", "xxx" + leak + "xxx") + zulmAtom({names(stored)});
        const RedactionError error = errorOf(movie, hidingWithChapters("Geheim"));
        EXPECT_EQ(error.reason(), Reason::FoundInCopy);
        EXPECT_THAT(error.what(), HasSubstr("mdat at offset 11"));
        EXPECT_EQ(errorOf(chunk("RIFF", "AVI " + chunk("data", leak)) + zulmChunk({names(stored)}), hiding("Geheim"),
                          MetaDataParser::Riff)
                      .reason(),
                  Reason::FoundInCopy);
    }
}

TEST_F(RecordingRedactionTest, FindsOtherSpellingsOfAText) {
    const std::string joined = "Caf\xc3\xa9 Budget";
    const std::string apart = "Cafe\xcc\x81 Budget";
    RecordingRedaction redaction = hiding("Budget");
    redaction.spellings = [&](const std::string&) { return std::vector{joined, apart}; };
    EXPECT_EQ(errorOf(atom("mdat", apart) + zulmAtom({names(joined)}), redaction).reason(), Reason::FoundInCopy);
    RecordingRedaction removing;
    removing.streams.removedKinds = {kind(s_appNames)};
    removing.spellings = redaction.spellings;
    const std::string chapters = atom("moov", atom("udta", chapterList(apart)));
    EXPECT_EQ(errorOf(media() + chapters + zulmAtom({names(joined)}), removing).reason(), Reason::TextStays);
}

TEST_F(RecordingRedactionTest, DoesNotTakeChanceForALeak) {
    for (const std::string text : {"Mail", "mdat", "0123456", "aaaaaaaaaaaa", "        ", "a"}) {
        const std::string movie = atom("mdat", "0123456789 Mail " + std::string(20, 'a') + std::string(20, ' ')) +
                                  atom("moov", atom("trak", atom("mdia", handler("vide", "Mail Handler")))) +
                                  zulmAtom({names(text)});
        RecordingRedaction redaction;
        redaction.streams.removedTimes = {{0, 9}};
        EXPECT_EQ(redacted(movie, redaction).size(), movie.size() - names(text).size() + 24) << text;
    }
}

TEST_F(RecordingRedactionTest, ComparesShortTextsWithTheTextsOfTheMovie) {
    const auto stays = [&](const std::string& stored, const std::string& chapter) {
        RecordingRedaction redaction;
        redaction.streams.removedKinds = {kind(s_appNames)};
        const std::string movie =
            media() + atom("moov", atom("udta", chapterList(chapter))) + zulmAtom({names(stored)});
        try {
            RecordingRedactor(ByteSource::memory(movie), MetaDataParser::QuickTime, redaction).preview();
        } catch (const RedactionError&) {
            return true;
        }
        return false;
    };
    EXPECT_TRUE(stays("Mail", "Mail"));
    EXPECT_TRUE(stays("Mail", "Inbox - Mail"));
    EXPECT_FALSE(stays("Mail", "Mailbox"));
    EXPECT_TRUE(stays("a", "a"));
    EXPECT_FALSE(stays("a", "a chapter"));
    EXPECT_TRUE(stays("Salary list of March", "Salary list")) << "a long part";
    EXPECT_FALSE(stays("Salary list of March", "March"));
}

TEST_F(RecordingRedactionTest, HidesALongTextInsideOfOthers) {
    const std::string titles = streamHeader("2b7b6a07", 1, 0);
    const auto movie = [&](const std::string& app, const std::string& title) {
        return media() + zulmAtom({streamHeader(s_appNames, 1, 0) + textEntry(0, app), titles + textEntry(0, title)});
    };
    EXPECT_EQ(redacted(movie(s_secret, "2024 Salary list.ods"), hiding("ary list")), movie(s_ellipsis, s_ellipsis));
    RecordingRedaction range;
    range.streams.removedTimes = {{5, 6}};
    EXPECT_EQ(redacted(media() + zulmAtom({streamHeader(s_appNames, 1, 0) + textEntry(0, s_secret),
                                           titles + textEntry(0, "2024 Salary list.ods") + textEntry(1, "")}),
                       range),
              media() + zulmAtom({streamHeader(s_appNames, 1, 0) + textEntry(0, s_ellipsis),
                                  titles + textEntry(0, s_ellipsis) + textEntry(1, "")}));
}

TEST_F(RecordingRedactionTest, LeavesKindsAloneThatMayStay) {
    const std::string titles = streamHeader("2b7b6a07", 1, 0) + textEntry(0, "Report - Notebook Deluxe");
    RecordingRedaction redaction;
    redaction.streams.removedKinds = {kind(s_appNames)};
    EXPECT_EQ(redacted(media() + zulmAtom({names("Notebook Deluxe"), titles}), redaction),
              media() + zulmAtom({titles}));
}

TEST_F(RecordingRedactionTest, RemovesTheTextsOfARIFFFile) {
    const auto file = [](const std::string& list) {
        return chunk("RIFF", "WAVE" + list + chunk("data", "sound")) + zulmChunk({names("a")});
    };
    const std::vector<std::pair<std::string, std::string>> lists{
        {"RIFF/LIST INFO", chunk("LIST", "INFO" + chunk("INAM", s_secret + '\0'))},
        {"RIFF/LIST adtl", chunk("LIST", "adtl" + chunk("labl", le32(1) + s_secret))},
        {"RIFF/bext", chunk("bext", s_secret + std::string(300, '\0'))},
        {"RIFF/iXML", chunk("iXML", "<NOTE>" + s_secret + "</NOTE>")},
        {"RIFF/LIST hdrl/LIST strl/strn", chunk("LIST", "hdrl" + chunk("LIST", "strl" + chunk("strn", s_secret)))},
    };
    for (const auto& [path, list] : lists) {
        EXPECT_EQ(errorOf(file(list), hiding("ala"), MetaDataParser::Riff).reason(), Reason::TextStays) << path;
        const std::string copy = redacted(file(list), hidingWithChapters("ala"), MetaDataParser::Riff);
        EXPECT_THAT(copy, Not(HasSubstr(s_secret)));
        EXPECT_THAT(copy, HasSubstr("JUNK"));
        EXPECT_EQ(copy.size(), file(list).size());
        EXPECT_THAT(paths(), ElementsAre(path));
    }
}

std::string info(const std::string& name, const std::string& version, const std::string& system) {
    std::string fields = name + std::string(24 - name.size(), '\0') + version + std::string(16 - version.size(), '\0');
    fields += system + std::string(16 - system.size(), '\0');
    return le64(1) + fields;
}

TEST_F(RecordingRedactionTest, MakesTheCreatorNeutral) {
    RecordingRedaction redaction;
    redaction.removesCreator = true;
    const auto movie = [](const std::string& payload) {
        return media() + extendedAtom("ZULR", payload) + zulmAtom({names("a")});
    };
    EXPECT_EQ(redacted(movie(info("Bob", "4.2", "10.15.7")), redaction), movie(info("Mac", "", "")));
    EXPECT_THAT(paths(), ElementsAre("ZULR"));
    EXPECT_EQ(redacted(movie(info("Mac", "4.2", "10.15.7") + "more"), redaction),
              movie(info("Mac", "", "") + std::string(4, '\0')));
    EXPECT_EQ(redacted(movie("too short"), redaction), movie(std::string(9, '\0')));
    EXPECT_EQ(redacted(movie(info("Mac", "", "")), redaction), movie(info("Mac", "", "")));
    EXPECT_TRUE(paths().empty()) << "nothing has to change";
    const std::string tagged = atom("moov", atom("udta", chapterList("made by Recorder 4.2.17")));
    EXPECT_EQ(errorOf(media() + tagged + extendedAtom("ZULR", info("Mac", "Recorder 4.2.17", "")), redaction).reason(),
              Reason::TextStays);
}

TEST_F(RecordingRedactionTest, BlanksWhatIsUnknown) {
    RecordingRedaction redaction;
    redaction.blanksUnknown = true;
    const auto movie = [](const std::string& type, const std::string& body) {
        return atom("ftyp", "mp42") + atom("free", body) +
               atom("skip", body).replace(4, 4, type == "free" ? "free" : "skip") + atom("mdat", "media") +
               atom("moov", atom("mvhd", "head") + atom("free", body)) + atom(type, body) + zulmAtom({names("a")});
    };
    EXPECT_EQ(redacted(movie("abcd", "old"), redaction), movie("free", std::string(3, '\0')));
    EXPECT_THAT(paths(), ElementsAre("free", "skip", "moov/free", "abcd"));
    EXPECT_EQ(redacted(movie("free", std::string(3, '\0')), redaction), movie("free", std::string(3, '\0')));
    EXPECT_TRUE(paths().empty()) << "nothing has to change";
    const auto file = [](const std::string& body, const std::string& type) {
        return chunk("RIFF", "AVI " + chunk("JUNK", body) + chunk("idx1", "index")) + chunk(type, body) +
               zulmChunk({names("a")});
    };
    EXPECT_EQ(redacted(file("old", "abcd"), redaction, MetaDataParser::Riff), file(std::string(3, '\0'), "JUNK"));
}

TEST_F(RecordingRedactionTest, BlanksStreamsInFreeSpace) {
    const std::string movie = media() + atom("free", names(s_secret)) + zulmAtom({names("a")});
    RecordingRedaction redaction;
    redaction.streams.clearsKeys = true;
    EXPECT_EQ(errorOf(movie, redaction).reason(), Reason::MisplacedStream);
    redaction.blanksUnknown = true;
    EXPECT_THAT(redacted(movie, redaction), Not(HasSubstr(s_secret)));
}

TEST_F(RecordingRedactionTest, PreviewsWhatItWouldDo) {
    const std::string movie =
        media() + atom("moov", atom("udta", chapterList("x"))) + zulmAtom({names(s_secret), locationStream()});
    std::vector<double> times;
    RecordingRedaction redaction = hidingWithChapters("ala");
    redaction.streams.onEntry = [&times](const RedactedEntry& entry) { times.push_back(entry.time); };
    RecordingRedactor redactor(ByteSource::memory(movie), MetaDataParser::QuickTime, redaction);
    const RedactedRecording preview = redactor.preview();
    EXPECT_THAT(times, ElementsAre(1));
    ASSERT_EQ(preview.streams.size(), 2U);
    EXPECT_EQ(preview.streams[0].entriesChanged, 1U);
    EXPECT_EQ(preview.places.size(), 1U);
    const RedactedRecording written = redactor.write(folder / "copy");
    EXPECT_EQ(written.places.size(), 1U);
    EXPECT_EQ(written.streams[0].entriesChanged, 1U);
}

TEST_F(RecordingRedactionTest, SurvivesEveryDamageOfAMovieWithChapters) {
    const std::vector<std::string> titles{textSample("One"), textSample(s_secret)};
    const std::string data = "pictures" + titles[0] + titles[1];
    const std::string tags = atom(
        "udta", chapterList("x") +
                    fullAtom("meta", handler("mdir", "") + atom("ilst", atom("\xa9nam", atom("data", be64(1) + "a")))));
    const std::string movie =
        atom("mdat", data) +
        atom("moov", track(1, "vide", 8, {"pictures"}, chapterReference(2)) + track(2, "text", 16, titles) + tags) +
        zulmAtom({names(s_secret)});
    int copies = 0;
    for (std::size_t at = 0; at < movie.size(); ++at) {
        for (const char value : {'\0', '\1', '\x7f', '\xff'}) {
            std::string damaged = movie;
            damaged[at] = value;
            try {
                RecordingRedactor(ByteSource::memory(damaged), MetaDataParser::QuickTime, hidingWithChapters("ala"))
                    .write(folder / "copy");
                ++copies;
                EXPECT_THAT(contentsOf(folder / "copy"), Not(HasSubstr(s_secret))) << at;
            } catch (const RedactionError&) {
            }
        }
    }
    EXPECT_GT(copies, 100);
}

} // namespace
} // namespace ZULMetaData::Test
