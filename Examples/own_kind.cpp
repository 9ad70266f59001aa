// Records a kind that the library does not know, and reads it back: own_kind MOVIE
// Readers that do not know the kind ignore it. `SafeMovieSave` and `zulm` copy it like any other stream.

#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <fstream>
#include <iostream>

using namespace ZULMetaData;

namespace {

/// Make it once, with any UUID generator.
constexpr uuid s_heartRateUUID{
    {0x5d, 0x1c, 0x0a, 0x6e, 0x0b, 0x7f, 0x4c, 0x35, 0x9e, 0x0d, 0x43, 0xa1, 0x6b, 0x2f, 0x88, 0x17}};
constexpr int s_version = 1;

void record(const FileLocation& file) {
    MetaDataWriter<float, int, int> writer;
    writer.init(file.string(), s_heartRateUUID, s_version);
    for (int second = 0; second < 5; ++second)
        writer.write(second, 61.5F + static_cast<float>(second), true);
    writer.close();
}

/// `StreamEntries` checks every size and works for any kind. `MetaDataParser::loadDataType` works too, but prints on
/// standard output that it does not know this kind.
void read(const FileLocation& movie) {
    const auto parser = MetaDataParser::create(movie.string());
    const auto place = parser->fileDataForUUID(s_heartRateUUID);
    StreamEntries entries(ByteSource::stream(parser->getStream()).part(place.offset, place.length));
    while (const auto entry = entries.next())
        if (const auto decoded = decodeEntry<float>(entries.bytesOf(*entry), s_version))
            std::cout << decoded->time << " s: " << decoded->value << " beats a minute\n";
}

} // namespace

int main(int count, char** arguments) {
    if (count != 2) {
        std::cerr << "usage: own_kind MOVIE\n";
        return 2;
    }
    try {
        const FileLocation movie = arguments[1];
        const FileLocation file = movie.parent_path() / "heartRate.dat";
        record(file);
        SafeMovieSave(movie).attach({StreamSource::file(file).unchecked()}); // the kind is not a registered one
        read(movie);
    } catch (const std::exception& error) {
        std::cerr << error.what() << '\n';
        return 1;
    }
}
