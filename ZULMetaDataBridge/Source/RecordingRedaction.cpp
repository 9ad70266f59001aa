#include "ZULMetaDataBridge/Source/RecordingRedaction.h"

#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/Containers/ContainerLayout.h"
#include "ZULMetaData/Containers/RecordingInfo.h"
#include "ZULMetaDataBridge/Source/MetaDataSection.h"
#include "ZULMetaDataBridge/Source/RecordingCopy.h"
#include "ZULMetaDataBridge/Source/Redaction/ContainerBytes.h"
#include "ZULMetaDataBridge/Source/Redaction/CopyCheck.h"
#include "ZULMetaDataBridge/Source/StreamSalvage.h"

#include <algorithm>
#include <fstream>
#include <limits>
#include <optional>
#include <system_error>
#include <utility>

namespace ZULMetaData {

namespace {

using Reason = RedactionError::Reason;

/// A stream does not call itself failed if it cannot tell its position, and what is written then would stand in the
/// wrong place.
std::uint64_t offsetOf(std::ostream& out) {
    const auto position = out.tellp();
    if (position < 0)
        failToWrite<RedactionError>();
    return static_cast<std::uint64_t>(position);
}

} // namespace

class RecordingRedactor::Work {
public:
    Work(ByteSource recording, Container::Type type, RecordingRedaction redaction, Progress progress)
        : redaction_(std::move(redaction)), progress_(std::move(progress)), file_(std::move(recording)),
          container_(type), total_(file_.size()) {
        if (!progress_)
            progress_ = [](Step, std::uint64_t, std::uint64_t) {};
        streams_ = detail::streamsIn(file_, container());
        items_ = topLevelItems(file_, container());
        media_ = detail::placesIn(file_, container());
        choosePlaces();
    }

    bool isEmpty() const { return streams_.empty() && places_.empty(); }

    RedactedRecording preview() {
        prepare();
        std::ofstream nowhere; // is not open and drops everything
        return result(redactAll(nowhere));
    }

    RedactedRecording write(const FileLocation& copy) {
        prepare();
        std::ofstream out;
        fileOpen(out, utf8Path(copy).c_str(), std::ios::binary | std::ios::trunc);
        if (!out.is_open())
            failToWrite<RedactionError>();
        std::vector<RedactedStream> streams = writeContents(out);
        finishCopy<RedactionError>(out, copy);
        const ByteSource written = opened(copy);
        std::uint64_t done = 0;
        check_->requireClean(written, container(), [&](std::uint64_t bytes) {
            done += bytes;
            progress_(Step::Checking, done, written.size());
        });
        return result(std::move(streams));
    }

private:
    static ByteSource opened(const FileLocation& copy) {
        try {
            return ByteSource::file(utf8Path(copy));
        } catch (const std::system_error& error) {
            throw RedactionError(Reason::CannotWrite, "cannot be read back: " + error.code().message());
        }
    }

    Container::Type container() const { return container_; }
    bool isMovie() const { return container() == Container::QuickTime; }

    void choosePlaces() {
        for (const detail::MediaPlace& place : media_.places) {
            const bool isText = place.use == detail::MediaPlace::Use::Text;
            if (isText ? redaction_.removesChapters : redaction_.blanksUnknown)
                addPlace(isText ? RedactedPlace::Text : RedactedPlace::Unknown, place);
        }
        if (redaction_.removesCreator && isMovie())
            chooseCreator();
        std::stable_sort(places_.begin(), places_.end(),
                         [](const auto& left, const auto& right) { return left.offset < right.offset; });
        std::uint64_t end = 0; // of the outermost place; what is inside goes with it
        std::erase_if(places_, [&end](const RedactedPlace& place) {
            const bool isInside = place.offset < end;
            end = std::max(end, place.offset + place.size);
            return isInside;
        });
    }

    void addPlace(RedactedPlace::Reason reason, const detail::MediaPlace& place) {
        places_.push_back({reason, place.path, place.offset, place.size});
        blanks_.insert(blanks_.end(), place.blanks.begin(), place.blanks.end());
    }

    void chooseCreator() {
        const ZCAPHeader info = detail::neutralRecordingInfo();
        const std::string neutral(reinterpret_cast<const char*>(&info), sizeof info);
        for (const ContainerItem& item : items_) {
            if (!item.holdsRecordingInfo())
                continue;
            std::string head = item.payloadSize() >= neutral.size() ? neutral : std::string();
            const std::string stored = detail::readBytes(file_, item.payloadOffset(), head.size());
            if (item.payloadSize() > 0 && (stored != head || item.payloadSize() != head.size()))
                addPlace(RedactedPlace::Creator, {{},
                                                  item.type.text(),
                                                  item.offset,
                                                  item.size,
                                                  {{item.payloadOffset(), item.payloadSize(), std::move(head)}}});
        }
    }

    void prepare() {
        if (check_)
            return;
        if (container() != Container::RawStream)
            requireWholeContainer<RedactionError>(file_, container(), items_);
        collectTexts();
        check_.emplace(redaction_, streamRedaction_, texts_);
        check_->requireNoTextStays(media_);
        if (container() != Container::RawStream)
            requireNothingMisplaced();
    }

    /// A text that one stream makes a secret is hidden in every stream, and in every text that contains it if it is
    /// long.
    void collectTexts() {
        for (const detail::StreamPart& stream : streams_)
            collectRedactedTexts(stream.bytes, redaction_.streams, texts_);
        streamRedaction_ = redaction_.streams;
        hiddenTexts_.emplace(texts_.hidden, redaction_.spellings);
        if (!redaction_.streams.removedTimes.empty() || redaction_.streams.hidesText)
            streamRedaction_.hidesText = [this](const std::string& text) {
                const auto& asked = redaction_.streams.hidesText;
                return text != s_hiddenText && (hiddenTexts_->isIn(text) || (asked && asked(text)));
            };
        if (!redaction_.removesCreator)
            return;
        for (const ZCAPHeader& info : readRecordingInfo(file_, container()))
            for (const std::string& text :
                 {info.creator.name(), info.creator.version(), info.creator.platformVersion()})
                if (!text.empty() && text != CreatorAttributes::platformNameMac())
                    texts_.removed.insert(text);
    }

    /// A stream in a place that is copied as it is would stay in the copy.
    void requireNothingMisplaced() {
        StreamSalvage salvage(file_, container(),
                              [this](std::uint64_t done) { progress_(Step::Searching, done, total_); });
        const SalvageReport report = salvage.run();
        if (report.hasMore)
            throw RedactionError(Reason::MisplacedStream,
                                 "has more than " + std::to_string(SalvageReport::s_maximumStreams) +
                                     " places that look like streams, and not all of them could be looked into");
        for (const SalvagedStream& stream : report.streams) {
            if (isCopied(stream.offset))
                throw RedactionError(Reason::MisplacedStream,
                                     metaDataKindName(stream.header.uuid) + " at offset " +
                                         std::to_string(stream.offset) +
                                         " is outside of the metadata and would stay in the copy");
            unreachable_ += stream.origin == SalvagedStream::Reachable ? 0 : 1;
        }
    }

    bool isCopied(std::uint64_t offset) const {
        return std::none_of(blanks_.begin(), blanks_.end(), [=](const auto& blank) { return blank.covers(offset); }) &&
               std::none_of(items_.begin(), items_.end(), [=](const auto& item) {
                   return item.holdsMetaData() && item.offset <= offset && offset < item.end();
               });
    }

    /// Whether something follows whose place may be known to the media.
    bool isBeforeMedia(std::size_t item) const {
        return std::any_of(items_.begin() + static_cast<std::ptrdiff_t>(item), items_.end(),
                           [](const auto& next) { return !next.holdsMetaData() && !next.holdsRecordingInfo(); });
    }

    RedactedRecording result(std::vector<RedactedStream> streams) const {
        return {std::move(streams), places_, unreachable_};
    }

    RedactedStream redact(const detail::StreamPart& stream, std::ostream& out) const {
        RedactedStream redacted = redactStream(stream.bytes, streamRedaction_, out);
        redacted.bytesLeftOut += stream.declared - stream.bytes.size();
        redacted.header.uuid = stream.type;
        return redacted;
    }

    std::vector<RedactedStream> writeContents(std::ostream& out) {
        if (container() == Container::RawStream) {
            std::vector<RedactedStream> streams = redactAll(out);
            if (streams.empty() || streams.front().removal != RedactedStream::Kept)
                throw RedactionError(Reason::NothingLeft, "nothing would be left of it");
            return streams;
        }
        writeMedia(out);
        try {
            return writeMetaData(out);
        } catch (const std::length_error& error) {
            throw RedactionError(Reason::TooLarge, error.what());
        }
    }

    std::vector<RedactedStream> redactAll(std::ostream& out) const {
        std::vector<RedactedStream> streams;
        for (const detail::StreamPart& stream : streams_)
            streams.push_back(redact(stream, out));
        return streams;
    }

    std::vector<RedactedStream> writeMetaData(std::ostream& out) const {
        std::vector<RedactedStream> streams;
        MetaDataSection section(out, container());
        for (const detail::StreamPart& stream : streams_)
            section.add([&](std::ostream& output) {
                streams.push_back(redact(stream, output));
                return streams.back().removal == RedactedStream::Kept;
            });
        section.finish();
        return streams;
    }

    /// Everything but the metadata, which leaves free space if media follow it.
    void writeMedia(std::ostream& out) {
        std::uint64_t done = 0;
        const auto advance = [&](std::uint64_t bytes) {
            done += bytes;
            progress_(Step::Copying, done, total_);
        };
        const ByteSource media = detail::withBlanks(file_, blanks_);
        for (std::size_t i = 0; i < items_.size(); ++i) {
            const ContainerItem& item = items_[i];
            if (!item.holdsMetaData())
                appendBytes(media, item.offset, item.size, out, advance);
            else if (isBeforeMedia(i))
                writeBlank(out, item);
            if (!isMovie())
                out.seekp(static_cast<std::streamoff>(offsetOf(out) % 2), std::ios::cur);
        }
    }

    void writeBlank(std::ostream& out, const ContainerItem& item) const {
        const auto end = static_cast<std::streamoff>(offsetOf(out) + item.size);
        const auto write = [&out](const auto& header) {
            out.write(header.data(), static_cast<std::streamsize>(header.size()));
        };
        if (!isMovie())
            write(detail::chunkHeader(detail::s_junkChunk, static_cast<std::uint32_t>(item.payloadSize())));
        else if (item.size > std::numeric_limits<std::uint32_t>::max())
            write(detail::extendedAtomHeader(detail::s_freeAtom, item.size));
        else
            write(detail::atomHeader(detail::s_freeAtom, static_cast<std::uint32_t>(item.size)));
        out.seekp(end);
    }

    RecordingRedaction redaction_;
    Progress progress_;
    ByteSource file_;
    Container::Type container_;
    std::uint64_t total_;
    std::vector<detail::StreamPart> streams_;
    std::vector<ContainerItem> items_; ///< at the top level
    detail::MediaPlaces media_;
    std::vector<RedactedPlace> places_;
    std::vector<detail::Blank> blanks_;
    RedactedTexts texts_;
    Redaction streamRedaction_; ///< of each stream, with the texts of all of them
    std::optional<detail::TextSearch> hiddenTexts_;
    std::optional<detail::CopyCheck> check_;
    std::uint64_t unreachable_ = 0;
};

RecordingRedactor::RecordingRedactor(ByteSource recording, Container::Type type, RecordingRedaction redaction,
                                     Progress progress)
    : work_(std::make_unique<Work>(std::move(recording), type, std::move(redaction), std::move(progress))) {}

RecordingRedactor::~RecordingRedactor() = default;

bool RecordingRedactor::isEmpty() const {
    return work_->isEmpty();
}

RedactedRecording RecordingRedactor::preview() {
    return work_->preview();
}

RedactedRecording RecordingRedactor::write(const FileLocation& copy) {
    return work_->write(copy);
}

} // namespace ZULMetaData
