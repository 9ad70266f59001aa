// What any application does with the library: records, reads back, and relies on types of the library being the same
// ones on both sides.

#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <cstdio>
#include <fstream>
#include <iostream>
#include <string>

using namespace ZULMetaData;

namespace {

class Collector final : public DataStreamObserver<Point> {
public:
    bool dataRead(double time, const Point& value) override {
        lastTime = time;
        last = value;
        return true;
    }

    double lastTime = -1;
    Point last;
};

int failures = 0;

void expect(bool condition, const char* sentence) {
    if (condition)
        return;
    std::cerr << "not so: " << sentence << '\n';
    ++failures;
}

void record(const std::string& file) {
    CursorLocationMetaDataWriter writer(file);
    writer.write(ScreenPoint(640.5, 360), MediaTime(0, 600));
    writer.write(ScreenPoint(652, 371), MediaTime(300, 600));
    writer.finish();
    expect(writer.isHealthy() && writer.entriesWritten() == 2, "both positions are written");
}

void readWithParserClass(const std::string& file) {
    CursorLocationMetaDataParser parser(file);
    const auto entries = parser.read();
    expect(entries->size() == 2, "the parser reads two entries");
    expect(entries->at(0).get<std::int32_t>("x") == 640, "the first position is the one that was written");
    BaseMetaDataParser& base = parser;
    expect(dynamic_cast<CursorLocationMetaDataParser*>(&base) == &parser, "a parser is recognised by its base");
}

void readWithOwnObserver(const std::string& file) {
    Collector collector;
    const auto parser = MetaDataParser::create(file);
    parser->cacheFileStreamInfo();
    parser->loadDataType<Point>(s_cursorLocationUUID, collector, -1);
    expect(collector.lastTime == 0.5 && collector.last == Point(652, 371), "the observer sees the last position");
}

void catchErrors() {
    try {
        SafeMovieSave("there is no such movie.mp4").attach({});
        expect(false, "attaching to a missing movie throws");
    } catch (const SaveError& error) {
        expect(error.reason() == SaveError::Reason::Failed, "the error says that nothing was changed");
    }
}

void encodeImage() {
    const Image image(1, 1, {255, 0, 0, 128});
    const auto bitmap = BitmapImageRep::fromTIFF(image.tiffRepresentation());
    expect(bitmap && !bitmap->pngRepresentation().empty(), "images are encoded");
}

} // namespace

int main() {
    const std::string file = "CursorLocation.dat";
    record(file);
    readWithParserClass(file);
    readWithOwnObserver(file);
    catchErrors();
    encodeImage();
    std::remove(file.c_str());
    return failures == 0 ? 0 : 1;
}
