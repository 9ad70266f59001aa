#include "Tools/demo/Demo.h"

#include "Tools/demo/Session.h"
#include "ZULMetaData/Containers/RecordingInfo.h"

#include <fmt/core.h>

#include <algorithm>
#include <filesystem>
#include <iterator>

namespace ZULMetaData::Demo {

namespace {

using Print = std::function<void(std::string_view)>;

constexpr auto s_creatorVersion = "1.0";

bool equal(const EntryValue& left, const EntryValue& right) {
    using ImagePointer = std::shared_ptr<const Image>;
    const auto* leftImage = std::get_if<ImagePointer>(&left);
    const auto* rightImage = std::get_if<ImagePointer>(&right);
    if (!leftImage || !rightImage)
        return left == right;
    const auto leftPixels = (*leftImage)->rgba();
    const auto rightPixels = (*rightImage)->rgba();
    return (*leftImage)->width() == (*rightImage)->width() && (*leftImage)->height() == (*rightImage)->height() &&
           std::equal(leftPixels.begin(), leftPixels.end(), rightPixels.begin(), rightPixels.end());
}

bool equal(const EntryDictionary& entry, const ExpectedEntry& expected) {
    const auto samePair = [](const auto& pair, const auto& expectedPair) {
        return pair.first == expectedPair.first && equal(pair.second, expectedPair.second);
    };
    return std::equal(entry.begin(), entry.end(), expected.begin(), expected.end(), samePair);
}

bool equal(const EntryList& list, const std::vector<ExpectedEntry>& expected) {
    return std::equal(list.begin(), list.end(), expected.begin(), expected.end(),
                      [](const EntryDictionary& entry, const ExpectedEntry& wanted) { return equal(entry, wanted); });
}

void attach(const std::vector<Track>& tracks, const FileLocation& movie) {
    std::vector<FileLocation> files;
    files.reserve(tracks.size());
    for (const Track& track : tracks)
        files.push_back(track.file);
    ZULMAtomWriter().writeMetaDataFiles(files, movie);
    ZULRAtomWriter().writeZULRtoFile(movie, "ZULMetaData demo", s_creatorVersion);
}

std::string timeOf(const EntryDictionary& entry) {
    return fmt::format("{:.3f}", entry.get<float>("timestamp"));
}

bool check(const Track& track, const FileLocation& movie, const Print& print) {
    const std::shared_ptr<EntryList> list = track.read(movie);
    const bool same = equal(*list, track.expected);
    print(fmt::format("  {:<21} {:>7} {:>9} {:>9} {:>9}   {}\n", track.kind, list->size(),
                      list->empty() ? "-" : timeOf(list->front()), list->empty() ? "-" : timeOf(list->back()),
                      std::filesystem::file_size(track.file), same ? "as recorded" : "DIFFERENT"));
    return same;
}

bool checkStamp(const FileLocation& movie, const Print& print) {
    const auto parser = MetaDataParser::create(utf8Path(movie));
    const auto infos = parser ? readRecordingInfo(*parser) : std::vector<ZCAPHeader>();
    if (infos.size() != 1)
        return false;
    const CreatorAttributes& creator = infos.front().creator;
    print(fmt::format("  stamped by {} {}, platform version {}\n", creator.name(), creator.version(),
                      creator.platformVersion()));
    return creator.name() == CreatorAttributes::platformNameMac() && creator.version() == s_creatorVersion;
}

} // namespace

bool runDemo(const FileLocation& folder, const FileLocation& movie, const Print& print) {
    std::filesystem::create_directories(folder);
    const std::vector<Track> tracks = recordSession(folder);
    attach(tracks, movie);
    print(fmt::format("  {:<21} {:>7} {:>9} {:>9} {:>9}\n", "kind", "entries", "first s", "last s", "bytes"));
    bool allSame = true;
    for (const Track& track : tracks)
        allSame &= check(track, movie, print);
    return checkStamp(movie, print) && allSame;
}

} // namespace ZULMetaData::Demo
