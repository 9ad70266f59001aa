#pragma once

// The mechanism of the writer family: how a stream writer is created and released, and the three ways of writing.
// A class of the family adds what is peculiar to its kind.

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

/// What becomes of the stream writer when the writer that made it is destroyed.
enum class StreamWriterRelease { WithWriter, Never };

/// Owns the stream writer of one kind.
template <class Kind, StreamWriterRelease Release = StreamWriterRelease::WithWriter>
class ZULMETADATA_API KindMetaDataWriter : public BaseMetaDataWriter {
public:
    using StreamWriter = MetaDataWriter<typename Kind::Value, int, int>; ///< what writes the file

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

    /// Null before the first `setup`.
    StreamWriter* metaDataWriter() const { return metaDataWriter_; }

    /// Only stores the pointer: what was there before is the caller's now, and `writer` is released with this.
    void setMetaDataWriter(StreamWriter* writer) { metaDataWriter_ = writer; }

protected:
    /// Without a stream writer the entry is dropped. An entry at a time that is not finite is written as it is.
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

    /// What is written afterwards is lost.
    void closeStream() {
        if (metaDataWriter_)
            metaDataWriter_->close();
    }

private:
    /// <cmath> has this too, at the price of ten thousand lines in every program.
    static bool isFinite(double seconds) {
        return seconds >= std::numeric_limits<double>::lowest() && seconds <= std::numeric_limits<double>::max();
    }

    /// A stream writer's destructor is not virtual: for one that is of exactly this type.
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

/// Any number of entries, each flushed unless `setFlushEveryWrite(false)` leaves that to the file buffer.
template <class Kind>
class ZULMETADATA_API ContinuousMetaDataWriter : public KindMetaDataWriter<Kind> {
public:
    ContinuousMetaDataWriter() = default; ///< has no file before `initWithMetaDataFile` gives it one

    /// Creates the file.
    explicit ContinuousMetaDataWriter(const FileLocation& file) { this->initWithMetaDataFile(file); }

    /// Creates the file, and goes back to flushing every write.
    void setup() override {
        flushEveryWrite_ = true;
        KindMetaDataWriter<Kind>::setup();
    }

    void finish() { this->closeStream(); } ///< closes the file: what is written afterwards is lost

    /// True from the first `setup` on, unless it was set otherwise.
    bool flushEveryWrite() const { return flushEveryWrite_; }
    void setFlushEveryWrite(bool flush) { flushEveryWrite_ = flush; } ///< until the next `setup`

protected:
    /// Flushes as `flushEveryWrite` says.
    void append(const typename Kind::Value& value, const MediaTime& time) {
        KindMetaDataWriter<Kind>::append(value, time.seconds(), flushEveryWrite_);
    }

private:
    bool flushEveryWrite_ = false;
};

/// Texts, stored as they are.
template <class Kind>
class ZULMETADATA_API TextMetaDataWriter : public ContinuousMetaDataWriter<Kind> {
public:
    using ContinuousMetaDataWriter<Kind>::ContinuousMetaDataWriter;

    /// `utf8` ends with a zero byte. Null is not written.
    void write(const char* utf8, const MediaTime& time) {
        if (utf8)
            this->append(utf8, time);
    }
};

/// Entries between two flushes of the kinds that come many times a second.
inline constexpr std::uint32_t s_flushInterval = 15;

/// Any number of entries, of which the first and every 15th after it are flushed.
template <class Kind>
class ZULMETADATA_API CountedMetaDataWriter : public KindMetaDataWriter<Kind> {
public:
    CountedMetaDataWriter() = default; ///< has no file before `initWithMetaDataFile` gives it one
    explicit CountedMetaDataWriter(const FileLocation& file) { this->initWithMetaDataFile(file); } ///< creates the file

    void finish() { this->closeStream(); } ///< closes the file: what is written afterwards is lost

    /// Asked before an entry is counted. Starts the count anew where it says yes.
    bool shouldFlush() {
        if (written_ % s_flushInterval != 0)
            return false;
        written_ = 0;
        return true;
    }

protected:
    /// Flushes as `shouldFlush` says, and counts.
    void append(const typename Kind::Value& value, const MediaTime& time) {
        KindMetaDataWriter<Kind>::append(value, time.seconds(), shouldFlush());
        ++written_;
    }

    std::uint32_t written() const { return written_; } ///< entries since the last flush, the flushed one included
    void setWritten(std::uint32_t count) { written_ = count; } ///< 0 makes the next entry a flushed one

private:
    std::uint32_t written_ = 0;
};

/// One entry at time 0, after which the file is closed and every further one is ignored.
template <class Kind, StreamWriterRelease Release>
class ZULMETADATA_API OneShotMetaDataWriter : public KindMetaDataWriter<Kind, Release> {
public:
    OneShotMetaDataWriter() = default; ///< has no file before `initWithMetaDataFile` gives it one
    explicit OneShotMetaDataWriter(const FileLocation& file) { this->initWithMetaDataFile(file); } ///< creates the file

    bool hasWritten() const { return hasWritten_; }             ///< also where the entry was lost
    void setHasWritten(bool written) { hasWritten_ = written; } ///< true makes this ignore its entry

protected:
    /// Asks for the value where none was written yet, and closes the file behind it.
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
