#include "ZULMetaDataBridge/Source/KindEntries.h"

#include "ZULMetaData/ZULMMetaDataWriter.h"

namespace ZULMetaData {

bool isKnownStream(const MetaDataHeader& header) {
    const MetaDataKind* kind = findMetaDataKind(header.uuid);
    return kind && header.version >= 1 && header.version <= kind->currentVersion;
}

bool isDecodable(const MetaDataHeader& header) {
    return isKnownStream(header) && header.fixedEntrySize == entrySizeOf(header) &&
           RecordedKinds::visit(header.uuid, []<class Kind>() {});
}

std::uint32_t entrySizeOf(const MetaDataHeader& header) {
    std::uint32_t size = header.fixedEntrySize;
    if (isKnownStream(header))
        RecordedKinds::visit(header.uuid,
                             [&size]<class Kind>() { size = metaDataFixedEntrySize<typename Kind::Value>(); });
    return size;
}

std::optional<double> timeOfEntry(const MetaDataHeader& header, std::string_view bytes) {
    std::optional<double> time;
    if (isDecodable(header))
        RecordedKinds::visit(header.uuid, [&]<class Kind>() {
            if (const auto decoded = decodeEntry<typename Kind::Value>(bytes, header.version))
                time = decoded->time;
        });
    return time;
}

} // namespace ZULMetaData
