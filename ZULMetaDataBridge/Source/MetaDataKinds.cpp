#include "ZULMetaDataBridge/Source/MetaDataKinds.h"

#include "Platform/Image.h"

#include <memory>
#include <utility>

namespace ZULMetaData {

EntryValue entryImage(const CursorImage& cursor) {
    if (cursor.imageData)
        if (auto image = Image::fromEncodedBytes({cursor.imageData, cursor.imageDataSize}))
            return std::make_shared<const Image>(*std::move(image));
    return "nil";
}

} // namespace ZULMetaData
