#pragma once

#include "../../../Platform/ProcessInfo.h"
#include "../../../SharedDependencies/Export.h"
#include "KindMetaDataWriter.h"

#include <list>
#include <string>

namespace ZULMetaData {

/// Writes the facts about the machine: processors, operating system and memory. Its stream writer is never released.
class ZULMETADATA_API SystemDataMetaDataWriter final
    : public OneShotMetaDataWriter<SystemDataKind, StreamWriterRelease::Never> {
public:
    using OneShotMetaDataWriter::OneShotMetaDataWriter;

    /// Asks the system for the facts, writes the only entry and closes the file. Later calls have no effect.
    void write() {
        writeOnce([] { return systemTexts(ProcessInfo::current()); });
    }

    /// Returns the texts of an entry. Readers find each text by its position.
    static std::list<std::string> systemTexts(const ProcessInfo& machine);
};

} // namespace ZULMetaData
