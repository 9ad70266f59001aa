// A PNG or TIFF file. What decodes has as many pixels as it says, needs as much memory as was foretold, and comes back
// the same from its TIFF data.

#include "Fuzz/Target.h"
#include "Platform/Image.h"

#include <algorithm>
#include <span>

using namespace ZULMetaData;

void runTarget(std::string_view bytes) {
    const std::span encoded(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
    const auto info = Image::infoOfEncodedBytes(encoded);
    if (info && info->decodingMemory > 16 << 20)
        return;
    const auto image = Image::fromEncodedBytes(encoded);
    if (Fuzz::hasRefusedMemory())
        Fuzz::fail("more memory than was foretold");
    if (!image)
        return;
    if (!info || image->width() != info->width || image->height() != info->height ||
        image->rgba().size() != std::size_t{4} * image->width() * image->height())
        Fuzz::fail("not the image that was foretold");
    const auto again = Image::fromEncodedBytes(image->tiffRepresentation());
    if (!again || !std::equal(image->rgba().begin(), image->rgba().end(), again->rgba().begin(), again->rgba().end()))
        Fuzz::fail("another image");
}
