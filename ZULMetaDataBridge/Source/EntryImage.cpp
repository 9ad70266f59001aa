#include "Platform/Image.h"
#include "ZULMetaDataBridge/Source/MetaDataKinds.h"

namespace ZULMetaData {

EntryValue entryImage(const CursorImage& cursor) {
    if (cursor.imageData)
        if (auto image = Image::fromEncodedBytes({cursor.imageData, cursor.imageDataSize}))
            return std::make_shared<const Image>(*std::move(image));
    return "nil";
}

} // namespace ZULMetaData
