// Records a session of four seconds, attaches it to a movie and stamps the movie: record_a_session MOVIE
// The stream files stay beside the movie.

#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <iostream>
#include <vector>

using namespace ZULMetaData;

namespace {

constexpr int s_leftDown = 1; // the bits that HumanReadableActions turns into texts
constexpr int s_leftUp = 2;

MediaTime milliseconds(int value) {
    return {value, 1000};
}

std::vector<FileLocation> recordInto(const FileLocation& folder) {
    RecordingRegionMetaDataWriter region(folder / "recordingRegion.dat");
    region.writeAndFinalize(ScreenRect(0, 0, 1920, 1080));

    TopmostAppNameMetaDataWriter application(folder / "topmostAppName.dat");
    application.write("Editor", milliseconds(0));
    application.write("Browser", milliseconds(3000));

    CursorLocationMetaDataWriter location(folder / "cursorLocation.dat");
    CursorActionMetaDataWriter action(folder / "cursorAction.dat");
    for (int time = 0; time <= 4000; time += 100) {
        location.write(ScreenPoint(200 + time * 0.4, 150 + time * 0.2), milliseconds(time));
        if (time == 1000 || time == 1500 || time == 3500) { // three clicks
            action.write(s_leftDown, milliseconds(time));
            action.write(s_leftUp, milliseconds(time + 80));
        }
    }

    for (BaseMetaDataWriter* writer :
         {static_cast<BaseMetaDataWriter*>(&application), static_cast<BaseMetaDataWriter*>(&location),
          static_cast<BaseMetaDataWriter*>(&action)})
        if (!writer->isHealthy())
            std::cerr << writer->metaDataFile() << ": not everything could be recorded\n";
    return {region.metaDataFile(), application.metaDataFile(), location.metaDataFile(), action.metaDataFile()};
} // here the destructors of the writers close the files

void saveInto(const FileLocation& movie, const std::vector<FileLocation>& files) {
    std::vector<StreamSource> streams;
    for (const FileLocation& file : files)
        streams.push_back(StreamSource::file(file));
    const SafeMovieSave save(movie);
    for (const AttachedStream& stream : save.attach(streams).streams)
        std::cout << findMetaDataKind(stream.type)->name << ": " << stream.entries << " entries\n";
    save.stamp("Example", "1.0");
}

} // namespace

int main(int count, char** arguments) {
    if (count != 2) {
        std::cerr << "usage: record_a_session MOVIE\n";
        return 2;
    }
    try {
        const FileLocation movie = arguments[1];
        saveInto(movie, recordInto(movie.parent_path()));
    } catch (const SaveError& error) { // the movie is unchanged
        std::cerr << error.what() << '\n';
        return 1;
    }
}
