#include "Tests/Tools/RecordedSession.h"

#include "Tests/Support/Bytes.h"
#include "Tools/demo/Session.h"

namespace ZULMetaData::Test {

std::string tinyMovie(std::uint32_t duration, std::uint32_t timescale) {
    const std::string times = be32(0) + be32(0) + be32(timescale) + be32(duration); // created, changed: 1904
    const std::string rateAndVolume = hex("00010000 0100 0000") + std::string(8, '\0');
    const std::string matrix = hex("00010000 00000000 00000000 00000000 00010000 00000000 00000000 00000000 40000000");
    const std::string header = be32(0) + times + rateAndVolume + matrix + std::string(24, '\0') + be32(2);
    return atom("ftyp", "isom" + be32(0x200) + "isom" + "mp42") + atom("mdat", "pictures and sound") +
           atom("moov", atom("mvhd", header));
}

std::string recordingInfo(const std::string& name, const std::string& version, const std::string& platformVersion) {
    const auto field = [](const std::string& text, std::size_t size) {
        return std::string(size, '\0').replace(0, text.size(), text);
    };
    return extendedAtom("ZULR", le64(1) + field(name, 24) + field(version, 16) + field(platformVersion, 16));
}

namespace {

/// One entry: four texts at time 0.
std::string systemData() {
    std::string texts;
    for (const std::string text : {"ProcessorCount:8", "ActiveProcessorCount:8", "OSVersion:1.2.3", "RAM:16384MB"})
        texts += le32(static_cast<std::uint32_t>(8 + text.size())) + f64(0) + text;
    return streamHeader("2b7b6afc", 1, 0) + le32(static_cast<std::uint32_t>(4 + texts.size())) + le32(4) + texts;
}

} // namespace

std::unique_ptr<RecordedSession::Files> RecordedSession::files_;

void RecordedSession::SetUpTestSuite() {
    files_ = std::make_unique<Files>();
    std::vector<FileLocation> streams;
    for (const Demo::Track& track : Demo::recordSession(files_->folder.path())) {
        streams.push_back(track.file);
        files_->streams.push_back(track.file.string());
    }
    writeFile(streamFile("systemData"), systemData());
    files_->movie = files_->folder / "Recording.mp4";
    writeFile(files_->movie, tinyMovie());
    ZULMAtomWriter().writeMetaDataFiles(streams, files_->movie);
    writeFile(files_->movie, contentsOf(files_->movie) + recordingInfo("Mac", "4.2", "1.2.3"));
}

void RecordedSession::TearDownTestSuite() {
    files_.reset();
}

std::string RecordedSession::copyOf(const std::string& file, const std::string& as) const {
    const std::string name = as.empty() ? std::filesystem::path(file).filename().string() : as;
    std::filesystem::copy_file(file, folder / name);
    return folder / name;
}

} // namespace ZULMetaData::Test
