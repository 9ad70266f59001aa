#include "ZULMetaData/Containers/RecordingInfo.h"

#include "ZULMetaData/ByteReader.h"
#include "ZULMetaData/Containers/ContainerLayout.h"

namespace ZULMetaData {

std::vector<ZCAPHeader> readRecordingInfo(const ByteSource& file, Container::Type type) {
    std::vector<ZCAPHeader> infos;
    ItemWalk items(file, type);
    while (const auto item = items.next())
        if (item->holdsRecordingInfo() && item->payloadSize() >= sizeof(ZCAPHeader))
            if (const auto info = items.reader().numberAt<ZCAPHeader>(item->payloadOffset()))
                infos.push_back(*info);
    return infos;
}

std::vector<ZCAPHeader> readRecordingInfo(MetaDataParser& recording) {
    return readRecordingInfo(ByteSource::stream(recording.getStream()), recording.getStreamType());
}

} // namespace ZULMetaData
