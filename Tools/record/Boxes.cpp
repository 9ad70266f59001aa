#include "Tools/record/Boxes.h"

namespace Recorder {

std::vector<Box> boxesIn(std::span<const std::uint8_t> bytes) {
    constexpr std::size_t header = 8;
    std::vector<Box> boxes;
    while (bytes.size() >= header) {
        BoxReader reader(bytes);
        const std::size_t size = reader.u32();
        const std::uint32_t type = reader.u32();
        if (size < header || size > bytes.size())
            break;
        boxes.push_back({type, bytes.first(size), bytes.subspan(header, size - header)});
        bytes = bytes.subspan(size);
    }
    return boxes;
}

Box childOf(const Box& parent, std::uint32_t type) {
    for (const Box& box : boxesIn(parent.payload))
        if (box.type == type)
            return box;
    return {};
}

} // namespace Recorder
