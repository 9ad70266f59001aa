#include "ZULMetaDataBridge/ZULMetaDataBridge.h"
#include <iostream>
using namespace ZULMetaData;

int main() {
    CursorLocationMetaDataWriter writer("CursorLocation.dat");
    writer.write(ScreenPoint(640.5, 360), MediaTime(0, 600)); // at 0 s
    writer.write(ScreenPoint(652, 371), MediaTime(10, 600));  // at 10/600 s
    writer.finish();
    if (!writer.isHealthy()) // for example, because the disk is full
        std::cerr << "only " << writer.entriesWritten() << " positions could be recorded\n";
    SafeMovieSave("Movie.mp4").attach({StreamSource::file("CursorLocation.dat")}); // throws if it fails

    CursorLocationMetaDataParser parser("Movie.mp4");
    for (const EntryDictionary& entry : *parser.read())
        std::cout << entry.get<std::int32_t>("x") << ' ' << entry.get<float>("timestamp") << '\n';
}
