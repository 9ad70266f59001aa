// What an editor draws over each frame of a movie: play_a_recording RECORDING

#include "ZULMetaDataSession/ZULMetaDataSession.h"

#include <iostream>

using namespace ZULMetaData;

int main(int count, char** arguments) try {
    if (count != 2)
        return std::cerr << "usage: play_a_recording RECORDING\n", 2;
    const Recording recording{FileLocation(arguments[1])};
    const Picture picture = recording.area().toPicture({1280, 720}); // the size of the movie
    Timeline timeline(recording);
    for (int frame = 0; frame <= 120; frame += 15) {
        const Snapshot& state = timeline.at(frame / 30.0);
        std::cout << frame << ": " << state.application.value_or("no application");
        if (state.cursor) {
            const ScreenPoint pixel = picture.toPixels(*state.cursor);
            std::cout << ", cursor at " << pixel.x << ", " << pixel.y;
        }
        if (state.buttons && state.buttons->contains(MouseButton::Left))
            std::cout << ", left button down";
        std::cout << '\n';
    }
} catch (const Error& error) {
    return std::cerr << error.what() << '\n', 1;
}
