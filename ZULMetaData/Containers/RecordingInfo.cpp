#include "ZULMetaData/Containers/RecordingInfo.h"

#include "ZULMetaData/Containers/ContainerLayout.h"

namespace ZULMetaData {

std::vector<ZCAPHeader> readRecordingInfo(MetaDataParser& movie) {
    std::vector<ContainerItem> atoms;
    std::istream& stream = movie.getStream();
    visitTopLevel(stream, movie.getStreamType(), [&](const ContainerItem& atom) {
        if (atom.type == "ZULR" && atom.payloadSize() >= sizeof(ZCAPHeader))
            atoms.push_back(atom);
        return true;
    });
    std::vector<ZCAPHeader> infos;
    for (const ContainerItem& atom : atoms) {
        ZCAPHeader info;
        stream.clear();
        stream.seekg(static_cast<std::streamoff>(atom.payloadOffset()));
        if (stream.read(reinterpret_cast<char*>(&info), sizeof info))
            infos.push_back(info);
    }
    return infos;
}

} // namespace ZULMetaData
