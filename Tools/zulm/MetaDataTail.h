#pragma once

// Copies of a recording that differ from it in its metadata alone: without the streams that no reader takes any more,
// or without any metadata. The media is copied as it is and stays in its place.

#include "ZULMetaData/Containers/ContainerLayout.h"
#include "ZULMetaDataBridge/Source/Recording.h"

#include <cstdint>
#include <string>
#include <vector>

namespace Zulm {

class OutputFile;

/// Which metadata a copy has.
enum class KeptMetaData { Newest, Nothing };

class MetaDataTail {
public:
    /// Throws `Failure` for a bare stream and for a damaged container. If metadata is kept, also for streams that no
    /// reader finds because of damage: the copy would lose them.
    MetaDataTail(ZULMetaData::Recording& recording, KeptMetaData kept);

    /// Fills `output` and calls it `name` in messages. Throws `Failure`.
    void write(OutputFile& output, const std::string& name);

    const std::vector<ZULMetaData::StreamInfo>& streams() const { return streams_; } ///< in the copy
    std::uint64_t streamsLeftOut() const { return streamsLeftOut_; }                 ///< found by readers or superseded
    std::uint64_t creatorsLeftOut() const { return creatorsLeftOut_; } ///< recording info that is in no copy
    std::uint64_t bytesCut() const { return bytesCut_; }               ///< of entries that were incomplete
    std::uint64_t sizeBefore() const { return size_; }                 ///< of the recording in bytes
    std::uint64_t sizeAfter() const { return sizeAfter_; }             ///< of the copy in bytes

private:
    using Items = std::vector<ZULMetaData::ContainerItem>;

    bool isMovie() const;
    void requireWholeContainer() const;
    void requireReachableStreams();
    void findTail();
    bool isCopyOfIndex(const ZULMetaData::ContainerItem& blank) const;
    void chooseCreators();
    std::string bytesOf(const ZULMetaData::ContainerItem& item) const;
    void blankEarlierMetaData(const std::string& path, const std::string& name) const;
    void attachStreams(const std::string& path, const std::string& name);
    void appendChunks(const std::string& path, const std::string& name) const;
    void appendItems(const std::string& path, const std::string& name) const;

    ZULMetaData::Recording& recording_;
    KeptMetaData kept_;
    std::uint64_t size_ = 0;
    std::uint64_t sizeAfter_ = 0;
    Items items_;          ///< at the top level
    std::size_t tail_ = 0; ///< the first item of the tail
    Items appended_;       ///< recording info and the index of fragments, which follow the streams
    std::vector<ZULMetaData::StreamInfo> streams_;
    std::uint64_t streamsLeftOut_ = 0;
    std::uint64_t creatorsLeftOut_ = 0;
    std::uint64_t bytesCut_ = 0;
};

} // namespace Zulm
