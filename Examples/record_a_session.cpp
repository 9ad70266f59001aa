// Records a session of four seconds into a folder beside the movie, and saves it into the movie: record_a_session MOVIE

#include "ZULMetaDataSession/ZULMetaDataSession.h"

#include <iostream>

using namespace ZULMetaData;

namespace {

void record(SessionWriter& session) {
    session.write<RecordingRegionKind>(Rect(0, 0, 1920, 1080));
    session.write<TopmostAppNameKind>(0, "Editor");
    session.write<TopmostAppNameKind>(3, "Browser");
    for (int milliseconds = 0; milliseconds <= 4000; milliseconds += 100) {
        const double time = milliseconds / 1000.0;
        session.write<CursorLocationKind>(time, ScreenPoint(200 + 400 * time, 150 + 200 * time));
        if (milliseconds == 1000 || milliseconds == 1500 || milliseconds == 3500) { // three clicks
            session.write<CursorActionKind>(time, storedButtonAction(MouseButton::Left, true));
            session.write<CursorActionKind>(time + 0.08, storedButtonAction(MouseButton::Left, false));
        }
    }
}

} // namespace

int main(int count, char** arguments) {
    if (count != 2) {
        std::cerr << "usage: record_a_session MOVIE\n";
        return 2;
    }
    try {
        const std::string movie = arguments[1];
        SessionOptions options;
        options.onLoss = [](const Error& loss) { std::cerr << loss.what() << '\n'; }; // such as a full disk
        SessionWriter session(movie + ".recording", options);
        record(session);
        for (const AttachedStream& stream : session.saveInto(movie, "Example", "1.0").streams)
            std::cout << metaDataKindName(stream.type) << ": " << stream.entries << " entries\n";
        session.removeFiles();
    } catch (const Error& error) { // the movie is unchanged, and the stream files still exist
        std::cerr << error.what() << '\n';
        return 1;
    }
}
