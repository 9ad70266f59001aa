#include "ZULMetaDataBridge/Source/Redaction/TextTrack.h"

#include <algorithm>
#include <array>
#include <optional>

namespace ZULMetaData::detail {

namespace {

constexpr std::uint64_t s_largestTable = 64 << 20; // bytes; an hour has fewer samples
constexpr std::size_t s_entriesOffset = 8;         // version, flags and a count come first
constexpr std::size_t s_sizesOffset = 12;          // in `stsz`, also the size that all samples share

struct SampleTables {
    std::string sizes;   ///< `stsz`
    std::string chunks;  ///< `stsc`: first chunk, samples in each, description
    std::string offsets; ///< `stco` or `co64`
    std::size_t offsetSize = 0;

    std::uint64_t samples() const { return bigEndianAt(sizes, s_entriesOffset, 4); }
    std::uint64_t chunkCount() const {
        return std::min<std::uint64_t>(bigEndianAt(offsets, 4, 4), (offsets.size() - s_entriesOffset) / offsetSize);
    }
    std::uint64_t offsetOf(std::uint64_t chunk) const {
        return bigEndianAt(offsets, s_entriesOffset + static_cast<std::size_t>(chunk) * offsetSize, offsetSize);
    }
    std::uint64_t sizeOf(std::uint64_t sample) const {
        const std::uint64_t shared = bigEndianAt(sizes, 4, 4);
        return shared != 0 ? shared : bigEndianAt(sizes, s_sizesOffset + static_cast<std::size_t>(sample) * 4, 4);
    }
    bool haveOneSize() const { return bigEndianAt(sizes, 4, 4) != 0; }
    bool holdsSizes() const { return haveOneSize() || sizes.size() >= s_sizesOffset + samples() * 4; }
    std::uint64_t firstChunk(std::size_t run) const { return bigEndianAt(chunks, s_entriesOffset + run * 12, 4); }
    std::uint64_t samplesInChunk(std::size_t run) const {
        return bigEndianAt(chunks, s_entriesOffset + run * 12 + 4, 4);
    }
};

/// Empty if there is no such table, or it is too large for what it says.
std::string tableIn(const MovieTrack& track, FourCC type, const ByteSource& file) {
    const auto found = track.tables.find(type.value);
    if (found == track.tables.end() || found->second.payloadSize() > s_largestTable)
        return {};
    return readBytes(file, found->second.payloadOffset(), found->second.payloadSize(), s_largestTable);
}

std::optional<SampleTables> tablesOf(const MovieTrack& track, const ByteSource& file) {
    SampleTables tables{tableIn(track, "stsz", file), tableIn(track, "stsc", file), tableIn(track, "stco", file), 4};
    if (tables.offsets.empty())
        tables = {tables.sizes, tables.chunks, tableIn(track, "co64", file), 8};
    if (tables.sizes.size() < s_sizesOffset || tables.chunks.size() < s_entriesOffset ||
        tables.offsets.size() < s_entriesOffset || !tables.holdsSizes())
        return std::nullopt;
    return tables;
}

} // namespace

bool MovieTrack::holdsTexts() const {
    constexpr std::array handlers{"text", "sbtl", "subt", "clcp"};
    return std::find(handlers.begin(), handlers.end(), handler) != handlers.end();
}

bool visitSamples(const MovieTrack& track, const ByteSource& file,
                  const std::function<bool(const SampleRange&)>& visit) {
    const auto tables = tablesOf(track, file);
    if (!tables)
        return false;
    const bool isVisitedByChunk = tables->haveOneSize() && !track.holdsTexts(); // sound has millions of samples
    std::uint64_t sample = 0;
    std::size_t run = 0;
    for (std::uint64_t chunk = 0; chunk < tables->chunkCount() && sample < tables->samples(); ++chunk) {
        while (tables->firstChunk(run + 1) > 0 && tables->firstChunk(run + 1) <= chunk + 1)
            ++run;
        SampleRange range{tables->offsetOf(chunk), 0};
        const std::uint64_t end = std::min(tables->samples(), sample + tables->samplesInChunk(run));
        while (sample < end) {
            const std::uint64_t count = isVisitedByChunk ? end - sample : 1;
            range.size = count * tables->sizeOf(sample);
            if (!visit(range))
                return true;
            range.offset += range.size;
            sample += count;
        }
    }
    return sample == tables->samples();
}

// [size: 2][text]; styles may follow. Tracks of other kinds hold atoms or XML.
std::vector<std::string> textsOfSample(std::string_view sample) {
    const std::uint64_t size = bigEndianAt(sample, 0, 2);
    if (sample.size() >= 2 && size <= sample.size() - 2)
        return {decodedText(sample.substr(2, static_cast<std::size_t>(size)))};
    return textRuns(sample);
}

} // namespace ZULMetaData::detail
