#pragma once

// A copy of a recording without what nobody else should see. Its media part is copied as it is; its metadata is written
// anew from what is left of it.

#include "Tools/zulm/HeldStreams.h"

#include <cstdint>
#include <ostream>
#include <string>
#include <vector>

namespace Zulm {

class RedactedCopy {
public:
    /// Throws `Failure` where the container is damaged, and where metadata outside of its place would stay in the copy.
    RedactedCopy(Recording& recording, const ZULMetaData::Redaction& redaction);

    /// Fills the file at `path`, which has the container's extension; messages call it `name`. Throws `Failure`.
    void write(const std::string& path, const std::string& name);

    /// What became of the streams that readers find, in the order of their identifiers.
    const std::vector<ZULMetaData::RedactedStream>& streams() const { return streams_; }

    /// Streams in the metadata that readers do not find; they are not in the copy.
    std::uint64_t unreachableStreams() const { return unreachable_; }

private:
    /// Of the file that holds the redacted streams for the time being.
    struct Part {
        std::uint64_t offset;
        std::uint64_t size;
    };

    ZULMetaData::MetaDataParser::StreamType container() const { return recording_.parser().getStreamType(); }
    void requireWholeContainer();
    void requireNothingHidden();
    bool isKept(std::uint64_t offset) const;
    bool isBeforeMedia(std::size_t item) const;

    ZULMetaData::Redaction redactionOfAllStreams();
    void writeStreams(const std::string& file);
    void writeMovie(const std::string& output, const std::string& streamFile) const;
    void writeRIFF(const std::string& output, const std::string& streamFile) const;
    void writeItems(std::ostream& output) const;
    void writeBlank(std::ostream& output, const ZULMetaData::ContainerItem& item) const;

    Recording& recording_;
    const ZULMetaData::Redaction& redaction_;
    std::vector<ZULMetaData::ContainerItem> items_; ///< at the top level
    std::uint64_t total_ = 0;
    std::uint64_t unreachable_ = 0;
    std::string name_; ///< of the copy
    std::vector<ZULMetaData::RedactedStream> streams_;
    std::vector<Part> parts_; ///< of those that are left
};

} // namespace Zulm
