#include "ZULMetaData/RecordingInfo.h"

#include "ZULMetaData/ContainerLayout.h"

namespace ZULMetaData {

std::vector<ZCAPHeader> readRecordingInfo(MetaDataParser& movie) {
    std::vector<ZCAPHeader> infos;
    std::istream& stream = movie.getStream();
    for (const ContainerItem& atom : listTopLevel(stream, movie.getStreamType())) {
        ZCAPHeader info;
        if (atom.type != "ZULR" || atom.payloadSize() < sizeof info)
            continue;
        stream.clear();
        stream.seekg(static_cast<std::streamoff>(atom.payloadOffset()));
        if (stream.read(reinterpret_cast<char*>(&info), sizeof info))
            infos.push_back(info);
    }
    return infos;
}

} // namespace ZULMetaData
