#include "ZULMetaDataBridge/Source/Validation/StreamWalk.h"

#include "Platform/Image.h"
#include "ZULMetaData/CursorImageSchema.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"
#include "ZULMetaDataBridge/Source/EntryTexts.h"
#include "ZULMetaDataBridge/Source/KindEntries.h"

#include <algorithm>
#include <cmath>
#include <concepts>
#include <cstddef>
#include <cstring>
#include <limits>
#include <span>
#include <system_error>
#include <tuple>

namespace ZULMetaData::detail {

namespace {

constexpr std::uint32_t s_timeSize = sizeof(double);
constexpr std::uint32_t s_sizeSize = sizeof(std::uint32_t);
constexpr std::uint32_t s_countSize = sizeof(std::uint32_t);

/// The longest character of UTF-8 in bytes.
constexpr std::size_t s_longestCharacter = 4;

/// What one image of a file of `total` bytes may take, encoded and decoded: of the 16 MiB that the whole program may
/// take beside twice the file, half is left to everything else.
constexpr std::uint64_t memoryForImage(std::uint64_t total) {
    return 2 * total + (std::uint64_t{8} << 20);
}

/// No cursor is nearly as large. A whole image of more bytes is not even read.
constexpr std::uint32_t s_largestCursorSide = 2048;
constexpr std::uint32_t s_largestStoredImage = std::uint32_t{32} << 20;

/// A cursor of ordinary size may be empty, and shrinks by any ratio. A larger picture that shrinks like this is no
/// cursor.
bool isAbsurd(const EncodedImageCheck& image, std::uint64_t size) {
    constexpr std::uint64_t ordinarySize = std::uint64_t{1} << 20; // 512x512 pixels
    constexpr std::uint64_t ordinaryRatio = 200;
    return std::max(image.width, image.height) > s_largestCursorSide ||
           (image.unpackedBytes > ordinarySize && image.unpackedBytes / ordinaryRatio > size);
}

/// Seconds. Movies count their duration in whole units, often of 1/600 or 1/1000 second.
constexpr double s_durationTolerance = 0.01;

class StreamWalk {
public:
    StreamWalk(const ByteSource& stream, std::uint64_t fileSize, std::optional<double> duration, FindingLog& log,
               StreamReport& report, IsNextStream isNextStream)
        : entries_(stream), fileSize_(fileSize), size_(stream.size()), log_(log), report_(report), duration_(duration),
          isNextStream_(std::move(isNextStream)) {}

    WalkedStream run() {
        report_.presentBytes = size_;
        wholeEnd_ = entries_.header() ? s_metaDataHeaderSize : size_;
        if (entries_.header()) {
            noteHeader();
            checkVersion();
            walkEntries();
            reportBeyondDuration();
        } else {
            add(FindingCode::ShortHeader, 0, "the stream has ", size_, " bytes, fewer than the ", s_metaDataHeaderSize,
                " of a header");
        }
        return {report_.offset + wholeEnd_, isTailLeftOut_};
    }

private:
    /// The fields of one entry, read one after the other. Throws `std::system_error` if bytes that must be there do not
    /// come.
    class Fields {
    public:
        Fields(ByteReader& reader, const StreamEntry& entry)
            : reader_(reader), position_(entry.offset), end_(entry.end()) {}

        std::uint64_t position() const { return position_; }
        std::uint64_t left() const { return end_ - position_; }

        std::string_view peek(std::uint64_t size) const {
            const std::string_view bytes = reader_.at(position_, size);
            if (bytes.size() < size)
                throw std::system_error(std::make_error_code(std::errc::io_error),
                                        "cannot be read at offset " + std::to_string(position_) + " of a stream");
            return bytes;
        }

        void skip(std::uint64_t bytes) { position_ += bytes; }
        void read(void* field, std::size_t size) {
            std::memcpy(field, peek(size).data(), size);
            skip(size);
        }

        template <class Number>
        Number next() {
            Number number;
            read(&number, sizeof number);
            return number;
        }

    private:
        ByteReader& reader_;
        std::uint64_t position_; ///< in the stream
        std::uint64_t end_;
    };

    template <class... Parts>
    void add(FindingCode code, std::uint64_t position, const Parts&... parts) {
        log_.add(report_.findings, code, place_, report_.offset + position, parts...);
    }

    /// Adds a finding for a check that fails by it.
    template <class... Parts>
    bool fail(const Parts&... parts) {
        add(parts...);
        return false;
    }

    void noteHeader() {
        const MetaDataHeader& header = *entries_.header();
        report_.readableBytes = s_metaDataHeaderSize;
        report_.type = header.uuid;
        report_.version = header.version;
        report_.fixedEntrySize = header.fixedEntrySize;
        const MetaDataKind* kind = findMetaDataKind(header.uuid);
        report_.kind = kind ? kind->name : std::string_view();
        place_ = report_.name();
        if (!kind)
            add(FindingCode::UnknownKind, 0, "no kind of stream is registered under this identifier");
    }

    void checkVersion() {
        constexpr std::uint64_t position = offsetof(MetaDataHeader, version);
        const MetaDataKind* kind = findMetaDataKind(report_.type);
        if (report_.version < 1)
            add(FindingCode::BadVersion, position, "version ", report_.version,
                " is below 1: readers refuse the stream");
        else if (kind && report_.version > kind->currentVersion)
            add(FindingCode::NewerVersion, position, "version ", report_.version, " is newer than ",
                kind->currentVersion, ", the newest that is known: readers refuse the stream");
    }

    void walkEntries() {
        const auto walk = [this]<class Kind>() { walkKind<Kind>(); };
        if (!isKnownStream(*entries_.header()) || !RecordedKinds::visit(report_.type, walk))
            walkUnknown();
    }

    template <class Kind>
    void walkKind() {
        using Value = typename Kind::Value;
        constexpr std::uint64_t position = offsetof(MetaDataHeader, fixedEntrySize);
        if (const std::uint32_t expected = metaDataFixedEntrySize<Value>(); report_.fixedEntrySize != expected) {
            add(FindingCode::EntrySizeMismatch, position, "the header says that entries take ", report_.fixedEntrySize,
                " bytes, but those of this kind take ", expected, expected == 0 ? " (each carries its own size)" : "",
                ": they were not read");
            return;
        }
        if constexpr (FixedSizeValue<Value>) {
            walkFixed();
        } else if constexpr (std::same_as<Value, std::string>) {
            walkSized(s_timeSize, [this](const auto& entry, Fields& fields) {
                noteTime(entry.offset, fields.next<double>());
                checkText(fields);
                return true;
            });
        } else if constexpr (std::same_as<Value, CursorImage>) {
            const CursorImageSchema schema(report_.version);
            CursorImage image;
            double time = 0;
            Record record{image, time};
            const std::uint32_t baseSize = schema.GetSizeOfSchemaFieldSteps(schema.GetBaseInfoSteps(), record);
            walkSized(baseSize - s_sizeSize,
                      [this](const auto& entry, Fields& fields) { return checkCursorImage(entry, fields); });
        } else {
            constexpr std::uint32_t neededTexts = std::tuple_size_v<decltype(Kind::fields)>;
            walkSized(s_countSize,
                      [this](const auto& entry, Fields& fields) { return checkList(entry, fields, neededTexts); });
        }
    }

    /// Walks over entries of a kind or version whose values nobody here knows. The header tells their layout.
    void walkUnknown() {
        if (report_.fixedEntrySize == 0)
            walkSized(1, [](const StreamEntry&, Fields&) { return true; });
        else if (report_.fixedEntrySize >= s_timeSize)
            walkFixed();
        else
            add(FindingCode::EntrySizeMismatch, offsetof(MetaDataHeader, fixedEntrySize),
                "the header says that entries take ", report_.fixedEntrySize, " bytes, too few for a time");
    }

    void walkFixed() {
        while (const auto entry = entries_.next()) {
            noteTime(entry->offset, Fields(entries_.reader(), *entry).next<double>());
            ++report_.wholeEntries;
        }
        wholeEnd_ = report_.readableBytes = entries_.wholeBytes();
        noteEnd();
        if (wholeEnd_ < size_ && !isTailLeftOut_)
            add(FindingCode::TornEntry, wholeEnd_, "the last entry has ", size_ - wholeEnd_, " of ",
                report_.fixedEntrySize, " bytes");
    }

    /// Walks over entries that begin with the number of bytes that follow, of which there must be `minimum`. `check`
    /// gets the fields after that number and returns whether the entry fits its own sizes.
    template <class Check>
    void walkSized(std::uint32_t minimum, Check check) {
        for (auto entry = entries_.next(); entry && entry->size >= s_sizeSize + minimum; entry = entries_.next()) {
            Fields fields(entries_.reader(), *entry);
            fields.skip(s_sizeSize);
            const bool isReadable = report_.readableBytes == entry->offset;
            wholeEnd_ = entry->end();
            if (!check(*entry, fields))
                continue;
            ++report_.wholeEntries;
            if (isReadable)
                report_.readableBytes = wholeEnd_;
        }
        noteEnd();
        if (wholeEnd_ < size_ && !isTailLeftOut_)
            reportFrame(wholeEnd_, minimum); // what follows cannot be told apart
    }

    void reportFrame(std::uint64_t position, std::uint32_t minimum) {
        const std::uint64_t left = size_ - position;
        const std::uint32_t size = entries_.reader().numberAt<std::uint32_t>(position).value_or(0);
        if (left < s_sizeSize)
            add(FindingCode::TornEntry, position, "the last entry has ", left, " bytes, too few for its size");
        else if (size == 0)
            add(FindingCode::ZeroEntrySize, position, "the entry says that it has 0 bytes");
        else if (size < minimum)
            add(FindingCode::EntryTooSmall, position, "the entry says that ", size,
                " bytes follow its size, but at least ", minimum, " must");
        else if (left < std::uint64_t{s_sizeSize} + minimum)
            add(FindingCode::TornEntry, position, "the last entry has ", left, " of at least ", s_sizeSize + minimum,
                " bytes");
        else
            add(FindingCode::EntryBeyondEnd, position, "the entry says that ", size,
                " bytes follow its size, but only ", left - s_sizeSize, " do");
    }

    /// Finds out whether a torn entry at the end was never copied.
    void noteEnd() {
        isTailLeftOut_ = wholeEnd_ < size_ && isNextStream_(report_.offset + wholeEnd_);
        if (isTailLeftOut_)
            report_.presentBytes = wholeEnd_;
    }

    /// Every text repeats the entry's time. They are in no encoding in particular.
    bool checkList(const StreamEntry& entry, Fields& fields, std::uint32_t neededTexts) {
        const auto count = fields.next<std::uint32_t>();
        const std::uint64_t room = (fields.left()) / (s_sizeSize + s_timeSize);
        if (count > room)
            return fail(FindingCode::ListCount, entry.offset, "the list counts ", count, " texts, but has room for ",
                        room, " at most");
        for (std::uint32_t index = 0; index < count; ++index)
            if (!checkListText(entry, fields, index))
                return false;
        if (fields.left() > 0)
            return fail(FindingCode::ListTotal, entry.offset, "the list's total counts ", fields.left(),
                        " bytes after its last text");
        if (count < neededTexts)
            add(FindingCode::TooFewTexts, entry.offset, "the list has ", count, " texts, but its kind needs ",
                neededTexts);
        return true;
    }

    bool checkListText(const StreamEntry& entry, Fields& fields, std::uint32_t index) {
        const std::uint64_t start = fields.position();
        if (fields.left() < s_sizeSize + s_timeSize)
            return fail(FindingCode::ListTotal, entry.offset, "the list's total ends before text ", index + 1);
        const auto size = fields.next<std::uint32_t>();
        if (size < s_timeSize)
            return fail(FindingCode::EntryTooSmall, start, "text ", index + 1, " says that ", size,
                        " bytes follow its size, but at least ", s_timeSize, " must");
        if (size > fields.left())
            return fail(FindingCode::ListTotal, entry.offset, "the list's total ends inside text ", index + 1,
                        ", which has ", size, " bytes after its size");
        const auto time = fields.next<double>();
        if (index == 0 || !std::isfinite(time))
            noteTime(index == 0 ? entry.offset : start, time);
        fields.skip(size - s_timeSize);
        return true;
    }

    bool checkCursorImage(const StreamEntry& entry, Fields& fields) {
        const CursorImageSchema schema(report_.version);
        CursorImage image;
        double time = 0;
        Record record{image, time};
        for (const SchemaFieldStep& step : schema.GetBaseInfoSteps().subspan(1)) {
            const FieldInfo field = step.fieldGetter(record);
            fields.read(field.data, field.size);
        }
        noteTime(entry.offset, time);
        if (record.justMetadataSize != fields.left())
            return fail(FindingCode::CursorSizes, entry.offset, "the record says that its data part has ",
                        record.justMetadataSize, " bytes, but its own size leaves ", fields.left());
        return checkCursorData(entry, fields, schema, record);
    }

    bool checkCursorData(const StreamEntry& entry, Fields& fields, const CursorImageSchema& schema, Record& record) {
        bool hasImage = false;
        for (const SchemaFieldStep& step : schema.GetDataSteps()) {
            if (!step.existsIn(report_.version) || !step.condition(record))
                continue;
            const bool isImage = step.fieldGetter == schema.GetImageFieldInfoFn(); // which would allocate the image
            const FieldInfo field =
                isImage ? FieldInfo{nullptr, schema.GetImageSize(record)} : step.fieldGetter(record);
            const std::uint64_t left = fields.left();
            if (field.size > left)
                return fail(isImage ? FindingCode::ImageBeyondEntry : FindingCode::CursorData, entry.offset,
                            "the record has ", left, " bytes left for its field ", step.name, ", which takes ",
                            field.size);
            if (isImage)
                checkImage(fields, field.size);
            else
                fields.read(field.data, field.size);
            hasImage |= isImage && field.size > 0;
        }
        noteCursor(entry.offset, record.image.uniqueId, hasImage);
        if (fields.left() > 0)
            add(FindingCode::LeftoverBytes, fields.position(), "the record has ", fields.left(),
                " bytes after its last known field");
        return true;
    }

    void checkImage(Fields& fields, std::uint32_t size) {
        const std::uint64_t position = fields.position();
        if (size > s_largestStoredImage) {
            add(FindingCode::AbsurdImage, position, "the image takes ", size,
                " bytes, far more than a cursor: it was not read");
        } else if (size > 0) {
            const std::string_view bytes = fields.peek(size);
            const std::span encoded(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
            reportImage(position, size, Image::checkEncodedBytes(encoded, memoryForImage(fileSize_) - size));
        }
        fields.skip(size);
    }

    void reportImage(std::uint64_t offset, std::uint32_t size, const EncodedImageCheck& check) {
        const bool isUnpacked = check.state != EncodedImageCheck::NotUnpacked;
        if (check.state == EncodedImageCheck::Undecodable && check.surplusBytes > 0)
            add(FindingCode::UndecodableImage, offset, "the image of ", size,
                " bytes cannot be decoded: ", check.surplusBytes, " of them follow its last pixel");
        else if (check.state == EncodedImageCheck::Undecodable)
            add(FindingCode::UndecodableImage, offset, "the image of ", size, " bytes cannot be decoded");
        else if (isAbsurd(check, size))
            add(FindingCode::AbsurdImage, offset, "the image of ", size, " bytes claims ", check.width, "x",
                check.height, " pixels, which unpack to ", check.unpackedBytes, " bytes, far more than a cursor",
                isUnpacked ? "" : "; they were not unpacked");
        else if (!isUnpacked)
            add(FindingCode::ImageNotDecoded, offset, "the image was not decoded: ", check.width, "x", check.height,
                " pixels are too large for a file of this size");
        if (check.state != EncodedImageCheck::Undecodable && check.surplusBytes > 0)
            add(FindingCode::ImageSurplus, offset + size - check.surplusBytes, "the image ends before the last ",
                check.surplusBytes, " of its ", size, " bytes");
    }

    /// Checks in pieces. A character may begin at the end of one piece and end in the next.
    void checkText(Fields& fields) {
        constexpr std::uint64_t longestPiece = 16384;
        while (fields.left() > 0) {
            const std::string_view piece = fields.peek(std::min(fields.left(), longestPiece));
            const std::size_t valid = validUTF8Length(piece);
            const std::size_t rest = piece.size() - valid;
            const bool isLast = piece.size() == fields.left();
            fields.skip(valid);
            if (rest >= s_longestCharacter || (isLast && rest > 0)) {
                add(FindingCode::NotUTF8, fields.position(), "the text is not UTF-8 from here on");
                return;
            }
        }
    }

    void noteTime(std::uint64_t entryStart, double time) {
        if (!std::isfinite(time)) {
            add(FindingCode::TimeNotFinite, entryStart, "the entry's time is ", time);
            return;
        }
        if (time < latestTime_)
            add(FindingCode::TimeBackwards, entryStart, "the entry's time ", time, " is before ", latestTime_,
                ", the time of an earlier entry");
        latestTime_ = time;
        if (duration_ && *duration_ > 0 && time > *duration_ + s_durationTolerance && beyondDuration_++ == 0) {
            firstBeyond_ = entryStart;
            firstTimeBeyond_ = time;
        }
        if (!report_.firstTime)
            report_.firstTime = time;
        report_.lastTime = time;
    }

    /// Once for each identifier.
    void noteCursor(std::uint64_t entryStart, std::uint64_t identifier, bool hasImage) {
        if (cursors_.insert(identifier).second && !hasImage)
            add(FindingCode::CursorWithoutImage, entryStart, "the cursor ", identifier,
                " has no image in this entry or in an earlier one");
    }

    /// Nobody knows what the entries of an unknown kind begin with.
    void reportBeyondDuration() {
        if (beyondDuration_ > 0 && findMetaDataKind(report_.type))
            add(FindingCode::BeyondDuration, firstBeyond_, beyondDuration_,
                beyondDuration_ == 1 ? " entry lies" : " entries lie", " after the end of the movie at ", *duration_,
                " seconds, the first at ", firstTimeBeyond_);
    }

    StreamEntries entries_;
    std::uint64_t fileSize_;
    std::uint64_t size_;
    FindingLog& log_;
    StreamReport& report_;
    std::optional<double> duration_;
    IsNextStream isNextStream_;
    std::uint64_t wholeEnd_ = 0; ///< in the stream: the end of the last whole entry
    bool isTailLeftOut_ = false;
    std::string place_ = "stream";
    double latestTime_ = -std::numeric_limits<double>::infinity();
    std::uint64_t beyondDuration_ = 0; ///< entries
    std::uint64_t firstBeyond_ = 0;    ///< its offset in the file
    double firstTimeBeyond_ = 0;
    std::set<std::uint64_t> cursors_; ///< identifiers that had an image or were reported
};

} // namespace

WalkedStream walkStream(const ByteSource& stream, std::uint64_t fileSize, std::optional<double> duration,
                        FindingLog& log, StreamReport& report, IsNextStream isNextStream) {
    return StreamWalk(stream, fileSize, duration, log, report, std::move(isNextStream)).run();
}

} // namespace ZULMetaData::detail
