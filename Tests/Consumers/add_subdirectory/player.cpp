// Writes a stream and reads it back with the stream core alone.

#include "ZULMetaData/ZULMMetaDataParser.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"

#include <sstream>

using namespace ZULMetaData;

struct Sum final : DataStreamObserver<int> {
    bool dataRead(double, const int& value) override {
        total += value;
        return true;
    }
    int total = 0;
};

int main() {
    std::stringstream stream;
    const MetaDataHeader header{s_cursorActionUUID, 1, metaDataFixedEntrySize<int>()};
    stream.write(reinterpret_cast<const char*>(&header), sizeof header);
    metaDataWrite(0.5, 40, stream, 1);
    metaDataWrite(1.0, 2, stream, 1);

    Sum sum;
    const auto parser = MetaDataParser::create(stream, MetaDataParser::RawStream);
    parser->cacheFileStreamInfo();
    parser->loadDataType<int>(s_cursorActionUUID, sum, -1);
    return sum.total == 42 ? 0 : 1;
}
