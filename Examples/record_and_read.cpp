#include "ZULMetaDataSession/ZULMetaDataSession.h"
#include <iostream>
using namespace ZULMetaData;

int main() {
    SessionWriter session("Movie.mp4.recording"); // a new folder, which only you can enter
    session.write<CursorLocationKind>(0, {640, 360});
    session.write<CursorLocationKind>(1.5, {652, 371}); // 1.5 s later
    session.write<TopmostAppNameKind>(1.5, "Editor");
    session.saveInto("Movie.mp4", "Recorder", "1.0"); // throws if it fails, and leaves the movie as it was
    session.removeFiles();

    const Recording recording("Movie.mp4");
    const Track<CursorLocationKind>& positions = recording.track<CursorLocationKind>();
    for (const double time : {0.5, 2.0})
        std::cout << "at " << time << " s the cursor is at " << *positions.at(time) << '\n';
    std::cout << "on top: " << recording.track<TopmostAppNameKind>().values().back() << '\n';
}
