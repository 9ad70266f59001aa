#pragma once

#include "../../../Platform/ProcessInfo.h"
#include "../../../SharedDependencies/Export.h"
#include "KindMetaDataWriter.h"

#include <list>
#include <string>

namespace ZULMetaData {

/// The machine that records: processors, operating system and memory. Its stream writer stays when it goes.
class ZULMETADATA_API SystemDataMetaDataWriter final
    : public OneShotMetaDataWriter<SystemDataKind, StreamWriterRelease::Never> {
public:
    using OneShotMetaDataWriter::OneShotMetaDataWriter;

    /// Asks the system what to write. Only the first call counts.
    void write() {
        writeOnce([] { return systemTexts(ProcessInfo::current()); });
    }

    /// The texts of an entry, which a reader finds by their position.
    static std::list<std::string> systemTexts(const ProcessInfo& machine);
};

} // namespace ZULMetaData
