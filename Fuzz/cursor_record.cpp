// One record of a cursor image. The first byte chooses the version that it is read as.

#include "Fuzz/Target.h"
#include "ZULMetaData/StreamEntries.h"

#include <sstream>

using namespace ZULMetaData;

void runTarget(std::string_view bytes) {
    const int version = Fuzz::takeByte(bytes) % 4;
    Fuzz::documented([&] {
        std::istringstream stream{std::string(bytes)};
        CursorImage image;
        double time = 0;
        metaDataRead<CursorImage>(stream, &time, &image, version);
        if (image.imageData && image.imageDataSize == 0)
            Fuzz::fail("an image without a size");
    });
    Fuzz::hasRefusedMemory();
    const auto decoded = decodeEntry<CursorImage>(bytes, version);
    if (decoded && decoded->value.imageData && decoded->value.imageDataSize > bytes.size())
        Fuzz::fail("an image larger than its record");
    if (Fuzz::hasRefusedMemory())
        Fuzz::fail("much memory for a careful look");
}
