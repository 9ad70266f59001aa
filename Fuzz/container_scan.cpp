// A container: what the scan finds lies where it says, the streams can be copied out, and the validator and the salvage
// come to an end.

#include "Fuzz/Target.h"
#include "ZULMetaData/Containers/ContainerLayout.h"
#include "ZULMetaData/Containers/MovieDuration.h"
#include "ZULMetaDataBridge/Source/StreamSalvage.h"
#include "ZULMetaDataBridge/Source/Validation/MetaDataValidator.h"

#include <map>
#include <sstream>

using namespace ZULMetaData;

namespace {

constexpr auto s_type = MetaDataParser::ZULM_FUZZ_CONTAINER;

void scan(std::istream& stream, std::string_view bytes) {
    const auto parser = MetaDataParser::create(stream, s_type);
    std::map<uuid, std::string> streams;
    parser->loadAllData(streams);
    for (const auto& [type, contents] : streams) {
        const auto [offset, length] = parser->fileDataForUUID(type);
        if (contents.size() > length || bytes.substr(offset, contents.size()) != contents)
            Fuzz::fail("a stream that is not what the file holds");
    }
    movieDuration(*parser);
}

} // namespace

void runTarget(std::string_view bytes) {
    std::istringstream stream{std::string(bytes)};
    scan(stream, bytes);
    for (const ContainerItem& item : topLevelItems(ByteSource::stream(stream), s_type))
        if (item.offset + item.headerSize > bytes.size())
            Fuzz::fail("a header that is not there");
    const ValidationReport report = validateRecording(ByteSource::stream(stream), s_type);
    for (const StreamReport& found : report.streams)
        if (found.offset + found.presentBytes > bytes.size() || found.readableBytes > found.presentBytes)
            Fuzz::fail("the validator counts bytes that are not there");
    stream.clear();
    for (const SalvagedStream& found : StreamSalvage(ByteSource::stream(stream), s_type).run().streams)
        if (found.end() > bytes.size())
            Fuzz::fail("bytes are salvaged that are not there");
    if (Fuzz::hasRefusedMemory())
        Fuzz::fail("much memory");
}
