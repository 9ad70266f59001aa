#include "ZULMetaDataBridge/Source/MetaDataWriters/SystemDataMetaDataWriter.h"

namespace ZULMetaData {

std::list<std::string> SystemDataMetaDataWriter::systemTexts(const ProcessInfo& machine) {
    const auto memoryInMebibytes = static_cast<std::int64_t>(machine.physicalMemory >> 20);
    return {
        "ProcessorCount:" + std::to_string(machine.processorCount),
        "ActiveProcessorCount:" + std::to_string(machine.activeProcessorCount),
        "OSVersion:" + machine.operatingSystemVersionString,
        "RAM:" + std::to_string(memoryInMebibytes) + "MB",
    };
}

} // namespace ZULMetaData
