#include "ZULMetaData/StreamBufferAccess.h"

#include <algorithm>

namespace ZULMetaData::detail {

void writeAcrossBlocks(std::ostream& stream, const char* bytes, std::size_t size) {
    std::streambuf& buffer = *stream.rdbuf();
    if (!placeFor(stream, 0) || size > StreamBufferAccess::capacity(buffer)) {
        stream.write(bytes, static_cast<std::streamsize>(size));
        return;
    }
    const std::size_t head = std::min(StreamBufferAccess::room(buffer), size);
    std::memcpy(StreamBufferAccess::putPosition(buffer), bytes, head);
    StreamBufferAccess::advancePut(buffer, head);
    if (head < size && stream.put(bytes[head])) // which writes the full area out
        writeBytes(stream, bytes + head + 1, size - head - 1);
}

} // namespace ZULMetaData::detail
