#include "ZULMetaDataBridge/Source/Validation/StreamWalk.h"

#include "ZULMetaData/ZULMMetaDataWriter.h"
#include "ZULMetaDataBridge/Source/EntryTexts.h"
#include "ZULMetaDataBridge/Source/MetaDataKinds.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <concepts>
#include <cstddef>
#include <string_view>
#include <tuple>
#include <vector>

namespace ZULMetaData::detail {

namespace {

constexpr std::uint32_t s_timeSize = sizeof(double);
constexpr std::uint32_t s_sizeSize = sizeof(std::uint32_t);
constexpr std::uint32_t s_countSize = sizeof(std::uint32_t);

/// The longest character of UTF-8, which may begin at the end of one piece of a text and end in the next.
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

} // namespace

StreamWalk::Outcome StreamWalk::run() {
    report_.offset = input_.position();
    report_.presentBytes = end_ - report_.offset;
    if (!readHeader())
        return {end_, false};
    outcome_ = {input_.position(), false};
    report_.readableBytes = sizeof(MetaDataHeader);
    const bool isWalked =
        isVersionKnown() && RecordedKinds::visit(report_.type, [this]<class Kind>() { walkKind<Kind>(); });
    if (!isWalked)
        walkUnknown();
    reportBeyondDuration();
    return outcome_;
}

bool StreamWalk::readHeader() {
    if (report_.presentBytes < sizeof(MetaDataHeader)) {
        add(FindingCode::ShortHeader, report_.offset, "the stream has ", report_.presentBytes,
            " bytes, fewer than the ", sizeof(MetaDataHeader), " of a header");
        return false;
    }
    const auto header = input_.read<MetaDataHeader>();
    report_.type = header.uuid;
    report_.version = header.version;
    report_.fixedEntrySize = header.fixedEntrySize;
    const MetaDataKind* kind = findMetaDataKind(header.uuid);
    report_.kind = kind ? kind->name : std::string_view();
    place_ = report_.name();
    if (!kind)
        add(FindingCode::UnknownKind, report_.offset, "no kind of stream is registered under this identifier");
    return true;
}

bool StreamWalk::isVersionKnown() {
    const std::uint64_t offset = report_.offset + offsetof(MetaDataHeader, version);
    const MetaDataKind* kind = findMetaDataKind(report_.type);
    if (report_.version < 1)
        add(FindingCode::BadVersion, offset, "version ", report_.version, " is below 1: readers refuse the stream");
    else if (kind && report_.version > kind->currentVersion)
        add(FindingCode::NewerVersion, offset, "version ", report_.version, " is newer than ", kind->currentVersion,
            ", the newest that is known: readers refuse the stream");
    return kind && report_.version >= 1 && report_.version <= kind->currentVersion;
}

bool StreamWalk::hasEntriesOf(std::uint32_t expected) {
    const bool isSo = report_.fixedEntrySize == expected;
    if (!isSo)
        add(FindingCode::EntrySizeMismatch, report_.offset + offsetof(MetaDataHeader, fixedEntrySize),
            "the header says that entries take ", report_.fixedEntrySize, " bytes, but those of this kind take ",
            expected, expected == 0 ? " (each carries its own size)" : "", ": they were not read");
    return isSo;
}

template <class Kind>
void StreamWalk::walkKind() {
    using Value = typename Kind::Value;
    if (!hasEntriesOf(metaDataFixedEntrySize<Value>()))
        return;
    if constexpr (FixedSizeValue<Value>) {
        walkFixed(metaDataFixedEntrySize<Value>());
    } else if constexpr (std::same_as<Value, std::string>) {
        walkSized(s_timeSize, [this](const Entry& entry) { return checkString(entry); });
    } else if constexpr (std::same_as<Value, CursorImage>) {
        const CursorImageSchema schema(report_.version);
        CursorImage image;
        double time = 0;
        Record record{image, time};
        const std::uint32_t baseSize = schema.GetSizeOfSchemaFieldSteps(schema.GetBaseInfoSteps(), record);
        walkSized(baseSize - s_sizeSize, [this](const Entry& entry) { return checkCursorImage(entry); });
    } else {
        constexpr std::uint32_t neededTexts = std::tuple_size_v<decltype(Kind::fields)>;
        walkSized(s_countSize, [this](const Entry& entry) { return checkList(entry, neededTexts); });
    }
}

/// Of a kind or version whose values nobody here knows: the header tells the layout of its entries.
void StreamWalk::walkUnknown() {
    if (report_.fixedEntrySize == 0)
        walkSized(1, [](const Entry&) { return true; });
    else if (report_.fixedEntrySize >= s_timeSize)
        walkFixed(report_.fixedEntrySize);
    else
        add(FindingCode::EntrySizeMismatch, report_.offset + offsetof(MetaDataHeader, fixedEntrySize),
            "the header says that entries take ", report_.fixedEntrySize, " bytes, too few for a time");
}

void StreamWalk::walkFixed(std::uint64_t entrySize) {
    std::uint64_t& wholeEnd = outcome_.wholeEnd;
    while (end_ - wholeEnd >= entrySize) {
        noteTime(wholeEnd, input_.read<double>());
        ++report_.wholeEntries;
        wholeEnd += entrySize;
        input_.moveTo(wholeEnd);
    }
    report_.readableBytes = wholeEnd - report_.offset;
    if (wholeEnd < end_ && !isTailLeftOut())
        add(FindingCode::TornEntry, wholeEnd, "the last entry has ", end_ - wholeEnd, " of ", entrySize, " bytes");
}

template <class Check>
void StreamWalk::walkSized(std::uint32_t minimum, Check check) {
    std::uint64_t& wholeEnd = outcome_.wholeEnd;
    while (wholeEnd < end_) {
        Entry entry{wholeEnd, end_};
        std::uint32_t size = 0;
        if (end_ - entry.start >= s_sizeSize)
            size = input_.read<std::uint32_t>();
        if (size < minimum || end_ - input_.position() < size) {
            if (!isTailLeftOut())
                reportFrame(entry, size, minimum);
            return; // what follows cannot be told apart
        }
        entry.end = input_.position() + size;
        const bool isReadable = report_.readableBytes == entry.start - report_.offset;
        wholeEnd = entry.end;
        if (check(entry)) {
            ++report_.wholeEntries;
            if (isReadable)
                report_.readableBytes = wholeEnd - report_.offset;
        }
        input_.moveTo(wholeEnd);
    }
}

void StreamWalk::reportFrame(const Entry& entry, std::uint32_t size, std::uint32_t minimum) {
    const std::uint64_t left = entry.end - entry.start;
    if (left < s_sizeSize)
        add(FindingCode::TornEntry, entry.start, "the last entry has ", left, " bytes, too few for its size");
    else if (size == 0)
        add(FindingCode::ZeroEntrySize, entry.start, "the entry says that it has 0 bytes");
    else if (size < minimum)
        add(FindingCode::EntryTooSmall, entry.start, "the entry says that ", size,
            " bytes follow its size, but at least ", minimum, " must");
    else if (left < std::uint64_t{s_sizeSize} + minimum)
        add(FindingCode::TornEntry, entry.start, "the last entry has ", left, " of at least ", s_sizeSize + minimum,
            " bytes");
    else
        add(FindingCode::EntryBeyondEnd, entry.start, "the entry says that ", size, " bytes follow its size, but only ",
            left - s_sizeSize, " do");
}

bool StreamWalk::isTailLeftOut() {
    outcome_.isTailLeftOut = isNextStream_(outcome_.wholeEnd);
    if (outcome_.isTailLeftOut)
        report_.presentBytes = outcome_.wholeEnd - report_.offset;
    return outcome_.isTailLeftOut;
}

bool StreamWalk::checkString(const Entry& entry) {
    noteTime(entry.start, input_.read<double>());
    checkText(entry.end - input_.position());
    return true;
}

/// Every text repeats the entry's time. They are in no encoding in particular.
bool StreamWalk::checkList(const Entry& entry, std::uint32_t neededTexts) {
    const auto count = input_.read<std::uint32_t>();
    const std::uint64_t room = (entry.end - input_.position()) / (s_sizeSize + s_timeSize);
    if (count > room) {
        add(FindingCode::ListCount, entry.start, "the list counts ", count, " texts, but has room for ", room,
            " at most");
        return false;
    }
    for (std::uint32_t index = 0; index < count; ++index)
        if (!checkListText(entry, index))
            return false;
    if (input_.position() != entry.end) {
        add(FindingCode::ListTotal, entry.start, "the list's total counts ", entry.end - input_.position(),
            " bytes after its last text");
        return false;
    }
    if (count < neededTexts)
        add(FindingCode::TooFewTexts, entry.start, "the list has ", count, " texts, but its kind needs ", neededTexts);
    return true;
}

bool StreamWalk::checkListText(const Entry& entry, std::uint32_t index) {
    const std::uint64_t start = input_.position();
    if (entry.end - start < s_sizeSize + s_timeSize) {
        add(FindingCode::ListTotal, entry.start, "the list's total ends before text ", index + 1);
        return false;
    }
    const auto size = input_.read<std::uint32_t>();
    if (size < s_timeSize) {
        add(FindingCode::EntryTooSmall, start, "text ", index + 1, " says that ", size,
            " bytes follow its size, but at least ", s_timeSize, " must");
        return false;
    }
    if (size > entry.end - input_.position()) {
        add(FindingCode::ListTotal, entry.start, "the list's total ends inside text ", index + 1, ", which has ", size,
            " bytes after its size");
        return false;
    }
    const auto time = input_.read<double>();
    if (index == 0 || !std::isfinite(time))
        noteTime(index == 0 ? entry.start : start, time);
    input_.moveTo(start + s_sizeSize + size);
    return true;
}

bool StreamWalk::checkCursorImage(const Entry& entry) {
    const CursorImageSchema schema(report_.version);
    CursorImage image;
    double time = 0;
    Record record{image, time};
    for (const SchemaFieldStep& step : schema.GetBaseInfoSteps().subspan(1)) {
        const FieldInfo field = step.fieldGetter(record);
        input_.read(field.data, field.size);
    }
    noteTime(entry.start, time);
    if (record.justMetadataSize != entry.end - input_.position()) {
        add(FindingCode::CursorSizes, entry.start, "the record says that its data part has ", record.justMetadataSize,
            " bytes, but its own size leaves ", entry.end - input_.position());
        return false;
    }
    return checkCursorData(entry, schema, record);
}

bool StreamWalk::checkCursorData(const Entry& entry, const CursorImageSchema& schema, Record& record) {
    bool hasImage = false;
    for (const SchemaFieldStep& step : schema.GetDataSteps()) {
        if (!step.existsIn(report_.version) || !step.condition(record))
            continue;
        const bool isImage = step.fieldGetter == schema.GetImageFieldInfoFn(); // which would allocate the image
        const FieldInfo field = isImage ? FieldInfo{nullptr, schema.GetImageSize(record)} : step.fieldGetter(record);
        const std::uint64_t left = entry.end - input_.position();
        if (field.size > left) {
            add(isImage ? FindingCode::ImageBeyondEntry : FindingCode::CursorData, entry.start, "the record has ", left,
                " bytes left for its field ", step.name, ", which takes ", field.size);
            return false;
        }
        if (isImage)
            checkImage(field.size);
        else
            input_.read(field.data, field.size);
        hasImage |= isImage && field.size > 0;
    }
    noteCursor(entry.start, record.image.uniqueId, hasImage);
    if (input_.position() < entry.end)
        add(FindingCode::LeftoverBytes, input_.position(), "the record has ", entry.end - input_.position(),
            " bytes after its last known field");
    return true;
}

void StreamWalk::checkImage(std::uint32_t size) {
    if (size == 0)
        return;
    const std::uint64_t offset = input_.position();
    if (size > s_largestStoredImage) {
        input_.moveTo(offset + size);
        add(FindingCode::AbsurdImage, offset, "the image takes ", size,
            " bytes, far more than a cursor: it was not read");
        return;
    }
    std::vector<std::uint8_t> encoded(size);
    input_.read(encoded.data(), size);
    reportImage(offset, size, Image::checkEncodedBytes(encoded, memoryForImage(input_.total()) - size));
}

void StreamWalk::reportImage(std::uint64_t offset, std::uint32_t size, const EncodedImageCheck& check) {
    const bool isUnpacked = check.state != EncodedImageCheck::NotUnpacked;
    if (check.state == EncodedImageCheck::Undecodable && check.surplusBytes > 0)
        add(FindingCode::UndecodableImage, offset, "the image of ", size,
            " bytes cannot be decoded: ", check.surplusBytes, " of them follow its last pixel");
    else if (check.state == EncodedImageCheck::Undecodable)
        add(FindingCode::UndecodableImage, offset, "the image of ", size, " bytes cannot be decoded");
    else if (isAbsurd(check, size))
        add(FindingCode::AbsurdImage, offset, "the image of ", size, " bytes claims ", check.width, "x", check.height,
            " pixels, which unpack to ", check.unpackedBytes, " bytes, far more than a cursor",
            isUnpacked ? "" : "; they were not unpacked");
    else if (!isUnpacked)
        add(FindingCode::ImageNotDecoded, offset, "the image was not decoded: ", check.width, "x", check.height,
            " pixels are too large for a file of this size");
    if (check.state != EncodedImageCheck::Undecodable && check.surplusBytes > 0)
        add(FindingCode::ImageSurplus, offset + size - check.surplusBytes, "the image ends before the last ",
            check.surplusBytes, " of its ", size, " bytes");
}

void StreamWalk::checkText(std::uint64_t size) {
    std::array<char, 16384> piece;
    std::size_t held = 0; // bytes of a character that the last piece cut
    while (size > 0) {
        const auto count = static_cast<std::size_t>(std::min<std::uint64_t>(size, piece.size() - held));
        input_.read(piece.data() + held, count);
        size -= count;
        const std::string_view text(piece.data(), held + count);
        const std::size_t valid = validUTF8Length(text);
        held = text.size() - valid;
        if (held >= s_longestCharacter || (size == 0 && held > 0)) {
            add(FindingCode::NotUTF8, input_.position() - held, "the text is not UTF-8 from here on");
            return;
        }
        std::copy_n(piece.begin() + static_cast<std::ptrdiff_t>(valid), held, piece.begin());
    }
}

void StreamWalk::noteTime(std::uint64_t entryStart, double time) {
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

/// Nobody knows what the entries of an unknown kind begin with.
void StreamWalk::reportBeyondDuration() {
    if (beyondDuration_ > 0 && findMetaDataKind(report_.type))
        add(FindingCode::BeyondDuration, firstBeyond_, beyondDuration_,
            beyondDuration_ == 1 ? " entry lies" : " entries lie", " after the end of the movie at ", *duration_,
            " seconds, the first at ", firstTimeBeyond_);
}

/// Once for each identifier.
void StreamWalk::noteCursor(std::uint64_t entryStart, std::uint64_t identifier, bool hasImage) {
    if (cursors_.insert(identifier).second && !hasImage)
        add(FindingCode::CursorWithoutImage, entryStart, "the cursor ", identifier,
            " has no image in this entry or in an earlier one");
}

} // namespace ZULMetaData::detail
