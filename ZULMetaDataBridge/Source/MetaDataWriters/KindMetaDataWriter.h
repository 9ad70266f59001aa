#pragma once

// How writers write: how a stream writer is created and released, and the three ways of writing entries. The writer of
// each kind adds what only its kind needs.

#include "../../../SharedDependencies/Export.h"
#include "../../../ZULMetaData/ZULMMetaDataWriter.h"
#include "../ApplicationValues.h"
#include "../MetaDataKinds.h"
#include "BaseMetaDataWriter.h"
#include "KeptReachable.h"

#include <cstdint>
#include <limits>
#include <memory>
#include <new>
#include <utility>

namespace ZULMetaData {

/// Whether a stream writer is released together with the writer that created it.
enum class StreamWriterRelease { WithWriter, Never };

/// Owns the stream writer of one kind.
template <class Kind, StreamWriterRelease Release = StreamWriterRelease::WithWriter>
class ZULMETADATA_API KindMetaDataWriter : public BaseMetaDataWriter {
public:
    using StreamWriter = MetaDataWriter<typename Kind::Value, int, int>; ///< the type that writes the file

    KindMetaDataWriter() = default;
    ~KindMetaDataWriter() override { release(); }

    /// Creates the file and writes its header.
    void setup() override {
        release();
        entriesWritten_ = 0;
        hasOnlyFiniteTimes_ = true;
        std::unique_ptr<StreamWriter, Destroyer> writer(new StreamWriter);
        if (Release == StreamWriterRelease::Never)
            keepReachable(writer.get());
        metaDataWriter_ = writer.release();
        metaDataWriter_->init(utf8Path(metaDataFile()), Kind::type, Kind::version);
    }

    /// \copydoc ZULMetaData::BaseMetaDataWriter::isHealthy
    bool isHealthy() const override { return isStreamGood() && hasOnlyFiniteTimes_; }

    /// \copydoc ZULMetaData::BaseMetaDataWriter::entriesWritten
    std::uint64_t entriesWritten() const override { return entriesWritten_; }

    /// Returns the stream writer, or null before the first `setup`.
    StreamWriter* metaDataWriter() const { return metaDataWriter_; }

    /// Stores the pointer. The previous stream writer now belongs to the caller; `writer` is released with this object.
    void setMetaDataWriter(StreamWriter* writer) { metaDataWriter_ = writer; }

protected:
    /// Writes an entry, or drops it if there is no stream writer. An entry at a time that is not finite is written too.
    void append(const typename Kind::Value& value, double seconds, bool flush) {
        if (metaDataWriter_)
            metaDataWriter_->write(seconds, value, flush);
        hasOnlyFiniteTimes_ &= isFinite(seconds);
        countEntry();
    }

    /// Called after every entry. Counts the entry if the stream accepted it.
    void countEntry() {
        if (isStreamGood())
            ++entriesWritten_;
    }

    /// Closes the file. Later entries are lost.
    void closeStream() {
        if (metaDataWriter_)
            metaDataWriter_->close();
    }

private:
    /// Does what std::isfinite does. Including `<cmath>` would add eight thousand lines to every program.
    static bool isFinite(double seconds) {
        return seconds >= std::numeric_limits<double>::lowest() && seconds <= std::numeric_limits<double>::max();
    }

    /// Destroys a stream writer that is exactly of this type. The destructor of stream writers is not virtual.
    struct Destroyer {
        void operator()(StreamWriter* writer) const {
            writer->StreamWriter::~StreamWriter();
            ::operator delete(writer);
        }
    };

    void release() {
        StreamWriter* writer = std::exchange(metaDataWriter_, nullptr);
        if (writer && Release == StreamWriterRelease::WithWriter)
            Destroyer()(writer);
    }

    bool isStreamGood() const { return metaDataWriter_ && metaDataWriter_->getStream().good(); }

    StreamWriter* metaDataWriter_ = nullptr;
    std::uint64_t entriesWritten_ = 0;
    bool hasOnlyFiniteTimes_ = true; // since the last `setup`
};

/// Writes any number of entries. Each entry is flushed, unless `setFlushEveryWrite(false)` leaves it in the buffer.
template <class Kind>
class ZULMETADATA_API ContinuousMetaDataWriter : public KindMetaDataWriter<Kind> {
public:
    ContinuousMetaDataWriter() = default; ///< creates a writer without a file; call `initWithMetaDataFile`

    /// Creates the file.
    explicit ContinuousMetaDataWriter(const FileLocation& file) { this->initWithMetaDataFile(file); }

    /// Creates the file and turns `flushEveryWrite` on.
    void setup() override {
        flushEveryWrite_ = true;
        KindMetaDataWriter<Kind>::setup();
    }

    void finish() { this->closeStream(); } ///< closes the file; later entries are lost

    /// Returns whether each entry is flushed. `setup` turns this on.
    bool flushEveryWrite() const { return flushEveryWrite_; }
    void setFlushEveryWrite(bool flush) { flushEveryWrite_ = flush; } ///< has effect until the next `setup`

protected:
    /// Writes an entry and flushes it if `flushEveryWrite` is on.
    void append(const typename Kind::Value& value, const MediaTime& time) {
        KindMetaDataWriter<Kind>::append(value, time.seconds(), flushEveryWrite_);
    }

private:
    bool flushEveryWrite_ = false;
};

/// Writes texts, which are stored unchanged.
template <class Kind>
class ZULMETADATA_API TextMetaDataWriter : public ContinuousMetaDataWriter<Kind> {
public:
    using ContinuousMetaDataWriter<Kind>::ContinuousMetaDataWriter;

    /// Writes `utf8`, which ends with a zero byte. If it is null, nothing is written.
    void write(const char* utf8, const MediaTime& time) {
        if (utf8)
            this->append(utf8, time);
    }
};

/// The number of entries from one flush to the next, for kinds that are written many times a second.
inline constexpr std::uint32_t s_flushInterval = 15;

/// Writes any number of entries. The first entry and every 15th entry after it are flushed.
template <class Kind>
class ZULMETADATA_API CountedMetaDataWriter : public KindMetaDataWriter<Kind> {
public:
    CountedMetaDataWriter() = default; ///< creates a writer without a file; call `initWithMetaDataFile`
    explicit CountedMetaDataWriter(const FileLocation& file) { this->initWithMetaDataFile(file); } ///< creates the file

    void finish() { this->closeStream(); } ///< closes the file; later entries are lost

    /// Called before an entry is counted. Returns whether the entry is flushed, and resets the count if it is.
    bool shouldFlush() {
        if (written_ % s_flushInterval != 0)
            return false;
        written_ = 0;
        return true;
    }

protected:
    /// Writes an entry, flushes it if `shouldFlush` returns true, and counts it.
    void append(const typename Kind::Value& value, const MediaTime& time) {
        KindMetaDataWriter<Kind>::append(value, time.seconds(), shouldFlush());
        ++written_;
    }

    /// Returns the number of entries since the last flush, including the entry that was flushed.
    std::uint32_t written() const { return written_; }
    void setWritten(std::uint32_t count) { written_ = count; } ///< 0 makes the next entry flush

private:
    std::uint32_t written_ = 0;
};

/// Writes a single entry at time 0 and closes the file. Further entries are ignored.
template <class Kind, StreamWriterRelease Release>
class ZULMETADATA_API OneShotMetaDataWriter : public KindMetaDataWriter<Kind, Release> {
public:
    OneShotMetaDataWriter() = default; ///< creates a writer without a file; call `initWithMetaDataFile`
    explicit OneShotMetaDataWriter(const FileLocation& file) { this->initWithMetaDataFile(file); } ///< creates the file

    bool hasWritten() const { return hasWritten_; }             ///< returns true even if the entry was lost
    void setHasWritten(bool written) { hasWritten_ = written; } ///< if true, the entry will be ignored

protected:
    /// Unless an entry was written, calls `makeValue`, writes its result and closes the file.
    template <class MakeValue>
    void writeOnce(MakeValue makeValue) {
        if (hasWritten_)
            return;
        const typename Kind::Value value = makeValue();
        if (this->metaDataWriter())
            metaDataWrite(0.0, value, this->metaDataWriter()->getStream(), Kind::version);
        this->closeStream();
        this->countEntry();
        hasWritten_ = true;
    }

private:
    bool hasWritten_ = false;
};

} // namespace ZULMetaData
