#include "ZULMetaDataBridge/Source/StreamRedaction.h"

#include "ZULMetaData/ZULMMetaDataWriter.h"
#include "ZULMetaDataBridge/Source/KindEntries.h"

#include <string_view>

namespace ZULMetaData {

namespace {

/// Decides over the entries of one kind.
template <class Kind>
class EntryRedactor {
public:
    using Value = typename Kind::Value;

    EntryRedactor(const Redaction& redaction, RedactedStream& result, std::ostream& out)
        : redaction_(redaction), result_(result), out_(out) {}

    /// False where the entry does not fit its kind.
    bool copy(std::string_view bytes) {
        const auto decoded = decodeEntry<Value>(bytes, result_.header.version);
        if (!decoded)
            return false;
        if (isRemoved(decoded->time)) {
            ++result_.entriesRemoved;
            return true;
        }
        ++result_.entries;
        if (!writeChanged(*decoded))
            out_.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
        return true;
    }

private:
    bool isRemoved(double time) const {
        const auto& range = redaction_.removedTimes;
        return range && !(time < range->from) && !(time > range->to);
    }

    bool writeChanged(const TimedValue<Value>& decoded) {
        Value value = decoded.value;
        if constexpr (std::same_as<Value, KeyStroke>) {
            if (redaction_.clearsKeys)
                value = KeyStroke();
        } else if constexpr (std::same_as<Value, std::string>) {
            if (redaction_.hidesText && redaction_.hidesText(value))
                value = s_hiddenText;
        }
        if (value == decoded.value)
            return false;
        ++result_.entriesChanged;
        metaDataWrite<Value>(decoded.time, value, out_, result_.header.version);
        return true;
    }

    const Redaction& redaction_;
    RedactedStream& result_;
    std::ostream& out_;
};

/// Whether an entry of any kind might have to go or to change.
bool mustLookInto(const Redaction& redaction, const uuid& type) {
    return redaction.hidesText || redaction.removedTimes || (redaction.clearsKeys && type == s_keyboardActionUUID);
}

RedactedStream::Removal removalOf(const std::optional<MetaDataHeader>& header, const Redaction& redaction) {
    if (!header)
        return RedactedStream::Headless;
    if (redaction.removedKinds.contains(header->uuid))
        return RedactedStream::Asked;
    const bool isLegible = isDecodable(*header) || !mustLookInto(redaction, header->uuid);
    return isLegible ? RedactedStream::Kept : RedactedStream::Undecodable;
}

void writeHeader(MetaDataHeader header, std::ostream& out) {
    header.fixedEntrySize = entrySizeOf(header); // what readers go by, whatever it said
    out.write(reinterpret_cast<const char*>(&header), sizeof header);
}

/// `copy` gets the bytes of each entry; false ends the walk in front of it. Gives where it ended.
template <class Copy>
std::uint64_t walk(StreamEntries& entries, Copy copy) {
    while (const auto entry = entries.next())
        if (!copy(entries.bytesOf(*entry)))
            return entry->offset;
    return entries.wholeBytes();
}

} // namespace

RedactedStream redactStream(const StreamSource::Bytes& stream, const Redaction& redaction, std::ostream& out) {
    RedactedStream result;
    StreamEntries entries = entriesOf(stream.read, stream.length);
    result.header = entries.header().value_or(MetaDataHeader());
    result.removal = removalOf(entries.header(), redaction);
    if (result.removal != RedactedStream::Kept)
        return result;
    writeHeader(result.header, out);
    std::uint64_t end = s_metaDataHeaderSize;
    const bool isWalked = isDecodable(result.header) && RecordedKinds::visit(result.header.uuid, [&]<class Kind>() {
                              EntryRedactor<Kind> redactor(redaction, result, out);
                              end = walk(entries, [&](std::string_view bytes) { return redactor.copy(bytes); });
                          });
    if (!isWalked)
        end = walk(entries, [&](std::string_view bytes) {
            out.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
            ++result.entries;
            return true;
        });
    result.bytesLeftOut = stream.length - end;
    return result;
}

} // namespace ZULMetaData
