#pragma once

// For every recorded kind: its classes, and a few observations with the bytes that they become in the stream and the
// entries that these bytes are read back as. All three are written down by hand.

#include "Tests/Support/Bytes.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <tuple>
#include <vector>

namespace ZULMetaData::Test {

template <class Writer>
struct Sample {
    void (*record)(Writer&);
    std::string bytes;
    std::string entry; ///< as `asText` shows it
};

template <class K, class W, class P>
struct KindClasses {
    using Kind = K;
    using Writer = W;
    using Parser = P;
    using Samples = std::vector<Sample<W>>;

    /// Whether the stream writer goes with the writer that made it.
    static constexpr bool releasesStreamWriter = true;
};

/// An entry of fixed size is read from its first 8 bytes on: those of its time.
inline constexpr std::size_t s_bytesOfATime = 8;

/// A text is read from its first 4 bytes on: those of its size.
inline constexpr std::size_t s_bytesOfASize = 4;

struct CursorActionSamples : KindClasses<CursorActionKind, CursorActionMetaDataWriter, CursorActionMetaDataParser> {
    static constexpr std::string_view name = "cursorAction";
    static constexpr auto list = &CursorActionMetaDataParser::cursorActionData;
    static constexpr auto setList = &CursorActionMetaDataParser::setCursorActionData;
    static constexpr std::size_t readFrom = s_bytesOfATime;
    static std::string header() { return streamHeader("2b7b6af0", 1, 12); }
    static Samples samples() {
        return {
            {[](Writer& writer) {
                 writer.write(1 + 16 + 128, {1, 4});
             },
             hex("000000000000d03f 91000000"),
             "action = text 'left down + shift + cmd', rawActionValue = int32 145, timestamp = float 0.25"},
            {[](Writer& writer) {
                 writer.write(256, {3, 2});
             },
             hex("000000000000f83f 00010000"),
             "action = text 'mouse init', rawActionValue = int32 256, timestamp = float 1.5"},
            {[](Writer& writer) {
                 writer.write(-256, {5, 2});
             },
             hex("0000000000000440 00ffffff"),
             "action = text '-256', rawActionValue = int32 -256, timestamp = float 2.5"},
        };
    }
};

/// A PNG file of 77 bytes: a pixel of opaque red and one of half transparent green.
inline std::string redAndGreenPNG() {
    return hex("89504e470d0a1a0a"
               "0000000d 49484452 00000002 00000001 08 06 00 00 00 f4227f8a"
               "00000014 49444154 7801 01 0900 f6ff 00 ff0000ff 00ff0080 1079037e 36a06860"
               "00000000 49454e44 ae426082");
}

struct CursorImageSamples : KindClasses<CursorImageKind, CursorImageMetaDataWriter, CursorImageMetaDataParser> {
    static constexpr std::string_view name = "cursorImage";
    static constexpr auto list = &CursorImageMetaDataParser::cursorImageData;
    static constexpr auto setList = &CursorImageMetaDataParser::setCursorImageData;
    static constexpr std::size_t readFrom = 20; ///< what stands in front of the size of the data part
    static std::string header() { return streamHeader("2b7b6af1", 2, 0); }
    static Samples samples() {
        return {
            {[](Writer& writer) {
                 std::string png = redAndGreenPNG();
                 CursorImage cursor(7, 3, -2, reinterpret_cast<unsigned char*>(png.data()), 77, CursorTypeID(5),
                                    CursorImage::CursorImageFlags(1));
                 writer.writeCursorImage(cursor, 0.25);
             },
             hex("75000000 000000000000d03f 0700000000000000 61000000 4d000000 03000000 feffffff") + redAndGreenPNG() +
                 hex("05000000 01000000"),
             "image = image 2x1 ff0000ff 00ff0080, id = int64 7, hotspotOffsetX = int32 3, "
             "hotspotOffsetY = int32 -2, timestamp = float 0.25"},
            {[](Writer& writer) {
                 writer.writeCursorWithExistingUID(7, {3, 2});
             },
             hex("1c000000 000000000000f83f 0700000000000000 08000000 00000000 03000000"),
             "image = text 'nil', id = int64 7, hotspotOffsetX = int32 0, hotspotOffsetY = int32 0, "
             "timestamp = float 1.5"},
        };
    }
};

struct CursorLocationSamples
    : KindClasses<CursorLocationKind, CursorLocationMetaDataWriter, CursorLocationMetaDataParser> {
    static constexpr std::string_view name = "cursorLocation";
    static constexpr auto list = &CursorLocationMetaDataParser::cursorLocationData;
    static constexpr auto setList = &CursorLocationMetaDataParser::setCursorLocationData;
    static constexpr std::size_t readFrom = s_bytesOfATime;
    static std::string header() { return streamHeader("2b7b6af2", 1, 16); }
    static Samples samples() {
        return {
            {[](Writer& writer) {
                 writer.write({10.9, -3.7}, {1, 4});
             },
             hex("000000000000d03f 0a000000 fdffffff"), "x = int32 10, y = int32 -3, timestamp = float 0.25"},
            {[](Writer& writer) {
                 writer.write({1279.5, 719.5}, {1, 2});
             },
             hex("000000000000e03f ff040000 cf020000"), "x = int32 1279, y = int32 719, timestamp = float 0.5"},
            {[](Writer& writer) {
                 writer.write({1279.5, 719.5}, {1, 2});
             },
             hex("000000000000e03f ff040000 cf020000"), "x = int32 1279, y = int32 719, timestamp = float 0.5"},
        };
    }
};

struct CursorOpacitySamples : KindClasses<CursorOpacityKind, CursorOpacityMetaDataWriter, CursorOpacityMetaDataParser> {
    static constexpr std::string_view name = "cursorOpacity";
    static constexpr auto list = &CursorOpacityMetaDataParser::cursorOpacityData;
    static constexpr auto setList = &CursorOpacityMetaDataParser::setCursorOpacityData;
    static constexpr std::size_t readFrom = s_bytesOfATime;
    static std::string header() { return streamHeader("2b7b6af3", 1, 16); }
    static Samples samples() {
        return {
            {[](Writer& writer) {
                 writer.write(0.1, {1, 4});
             },
             hex("000000000000d03f 9a9999999999b93f"), "opacity = float 0.100000001, timestamp = float 0.25"},
            {[](Writer& writer) {
                 writer.write(1, {3, 2});
             },
             hex("000000000000f83f 000000000000f03f"), "opacity = float 1, timestamp = float 1.5"},
        };
    }
};

struct KeyboardActionSamples
    : KindClasses<KeyboardActionKind, KeyboardActionMetaDataWriter, KeyboardActionMetaDataParser> {
    static constexpr std::string_view name = "keyboardAction";
    static constexpr auto list = &KeyboardActionMetaDataParser::keyboardActionData;
    static constexpr auto setList = &KeyboardActionMetaDataParser::setKeyboardActionData;
    static constexpr std::size_t readFrom = s_bytesOfATime;
    static std::string header() { return streamHeader("2b7b6af5", 1, 16); }
    static Samples samples() {
        return {
            {[](Writer& writer) {
                 writer.writeCharacterCode(65, 0x00120000, {1, 4});
             },
             hex("000000000000d03f 41000000 00001200"),
             "characterCode = int32 65, characterString = text 'A', eventFlagsCode = int32 1179648, "
             "eventFlagsString = text '<Shift><Cmd>', timestamp = float 0.25"},
            {[](Writer& writer) {
                 writer.writeCharacterCode(13, 0x80000000, {1, 2});
             },
             hex("000000000000e03f 0d000000 00000080"),
             "characterCode = int32 13, characterString = text 'returnKey', eventFlagsCode = int32 -2147483648, "
             "eventFlagsString = text '<Win>', timestamp = float 0.5"},
            {[](Writer& writer) {
                 writer.writeCharacterCode(0xffffffe4, 0, {3, 2});
             },
             hex("000000000000f83f e4ffffff 00000000"),
             "characterCode = int32 -28, characterString = text '\xe4', eventFlagsCode = int32 0, "
             "eventFlagsString = text 'NONE', timestamp = float 1.5"},
        };
    }
};

struct RecordingRegionSamples
    : KindClasses<RecordingRegionKind, RecordingRegionMetaDataWriter, RecordingRegionMetaDataParser> {
    static constexpr std::string_view name = "recordingRegion";
    static constexpr auto list = &RecordingRegionMetaDataParser::recordingRegionData;
    static constexpr auto setList = &RecordingRegionMetaDataParser::setRecordingRegionData;
    static constexpr std::size_t readFrom = s_bytesOfATime;
    static std::string header() { return streamHeader("2b7b6af6", 1, 24); }
    static Samples samples() {
        return {
            {[](Writer& writer) {
                 writer.writeAndFinalize({-1280.5, 0.9, 2560, 1440.9});
             },
             hex("0000000000000000 00fbffff 00000000 000a0000 a0050000"),
             "x = int32 -1280, y = int32 0, width = int32 2560, height = int32 1440, timestamp = float 0"},
        };
    }
};

struct TopmostWindowSamples : KindClasses<TopmostWindowKind, TopmostWindowMetaDataWriter, TopmostWindowMetaDataParser> {
    static constexpr std::string_view name = "topmostWindow";
    static constexpr auto list = &TopmostWindowMetaDataParser::topmostWindowData;
    static constexpr auto setList = &TopmostWindowMetaDataParser::setTopmostWindowData;
    static constexpr std::size_t readFrom = s_bytesOfATime;
    static std::string header() { return streamHeader("2b7b6af7", 1, 24); }
    static Samples samples() {
        return {
            {[](Writer& writer) {
                 writer.write({10.9, -3.7, 100.5, 50.99}, {1, 4});
             },
             hex("000000000000d03f 0a000000 fdffffff 64000000 32000000"),
             "x = int32 10, y = int32 -3, width = int32 100, height = int32 50, timestamp = float 0.25"},
            {[](Writer& writer) {
                 writer.write({-1, 0.999, 1920, 1080}, {1001, 30000});
             },
             hex("7240388c6f15a13f ffffffff 00000000 80070000 38040000"),
             "x = int32 -1, y = int32 0, width = int32 1920, height = int32 1080, timestamp = float 0.0333666652"},
        };
    }
};

struct SlideInfoTitleSamples
    : KindClasses<SlideInfoTitleKind, SlideInfoTitleMetaDataWriter, SlideInfoTitleMetaDataParser> {
    static constexpr std::string_view name = "slideTitles";
    static constexpr auto list = &SlideInfoTitleMetaDataParser::slideTitleData;
    static constexpr auto setList = &SlideInfoTitleMetaDataParser::setSlideTitleData;
    static constexpr std::size_t readFrom = s_bytesOfASize;
    static std::string header() { return streamHeader("2b7b6af8", 1, 0); }
    static Samples samples() {
        return {
            {[](Writer& writer) {
                 writer.write("Intro", {1, 4});
             },
             hex("0d000000 000000000000d03f 49 6e 74 72 6f"), "title = text 'Intro', timestamp = float 0.25"},
            {[](Writer& writer) {
                 writer.write("", {1, 2});
             },
             hex("08000000 000000000000e03f"), "title = text '', timestamp = float 0.5"},
            {[](Writer& writer) {
                 writer.write("Q&A", {3, 2});
             },
             hex("0b000000 000000000000f83f 51 26 41"), "title = text 'Q&A', timestamp = float 1.5"},
        };
    }
};

struct SlideInfoTextSamples : KindClasses<SlideInfoTextKind, SlideInfoTextMetaDataWriter, SlideInfoTextMetaDataParser> {
    static constexpr std::string_view name = "slideText";
    static constexpr auto list = &SlideInfoTextMetaDataParser::slideTextData;
    static constexpr auto setList = &SlideInfoTextMetaDataParser::setSlideTextData;
    static constexpr std::size_t readFrom = s_bytesOfASize;
    static std::string header() { return streamHeader("2b7b6af9", 1, 0); }
    static Samples samples() {
        return {
            {[](Writer& writer) {
                 writer.write("a\nb", {1, 4});
             },
             hex("0b000000 000000000000d03f 61 0a 62"), "text = text 'a\nb', timestamp = float 0.25"},
            {[](Writer& writer) {
                 writer.write("Goals", {1, 2});
             },
             hex("0d000000 000000000000e03f 47 6f 61 6c 73"), "text = text 'Goals', timestamp = float 0.5"},
        };
    }
};

struct SlideInfoCommentSamples
    : KindClasses<SlideInfoCommentKind, SlideInfoCommentMetaDataWriter, SlideInfoCommentMetaDataParser> {
    static constexpr std::string_view name = "slideComment";
    static constexpr auto list = &SlideInfoCommentMetaDataParser::slideCommentData;
    static constexpr auto setList = &SlideInfoCommentMetaDataParser::setSlideCommentData;
    static constexpr std::size_t readFrom = s_bytesOfASize;
    static std::string header() { return streamHeader("2b7b6afa", 1, 0); }
    static Samples samples() {
        return {
            {[](Writer& writer) {
                 writer.write("slow down", {1, 4});
             },
             hex("11000000 000000000000d03f 73 6c 6f 77 20 64 6f 77 6e"),
             "comment = text 'slow down', timestamp = float 0.25"},
            {[](Writer& writer) {
                 writer.write("ok", {3, 2});
             },
             hex("0a000000 000000000000f83f 6f 6b"), "comment = text 'ok', timestamp = float 1.5"},
        };
    }
};

struct ScaleFactorSamples : KindClasses<ScaleFactorKind, ScaleFactorMetaDataWriter, ScaleFactorMetaDataParser> {
    static constexpr std::string_view name = "recordingScaleFactor";
    static constexpr auto list = &ScaleFactorMetaDataParser::scaleFactorData;
    static constexpr auto setList = &ScaleFactorMetaDataParser::setScaleFactorData;
    static constexpr std::size_t readFrom = s_bytesOfATime;
    static constexpr bool releasesStreamWriter = false;
    static std::string header() { return streamHeader("2b7b6afb", 1, 12); }
    static Samples samples() {
        return {
            {[](Writer& writer) { writer.writeAndFinalize(2); }, hex("0000000000000000 02000000"),
             "scaleFactor = int32 2, timestamp = float 0"},
        };
    }
};

/// What a writer records depends on the machine; these are the texts of a machine with 8 processors.
struct SystemDataSamples : KindClasses<SystemDataKind, SystemDataMetaDataWriter, SystemDataMetaDataParser> {
    static constexpr std::string_view name = "systemData";
    static constexpr auto list = &SystemDataMetaDataParser::systemDataMetaData;
    static constexpr auto setList = &SystemDataMetaDataParser::setSystemDataMetaData;
    static constexpr std::size_t readFrom = 108;    ///< up to and including the size of the fourth text
    static constexpr std::size_t listOfNoTexts = 4; ///< cut here, the number of texts is missing and counts as 0
    static constexpr bool releasesStreamWriter = false;
    static std::string header() { return streamHeader("2b7b6afc", 1, 0); }
    static Samples samples() {
        return {
            {[](Writer& writer) { writer.write(); },
             hex("7b000000 04000000") +                                        //
                 hex("18000000 0000000000000000") + "ProcessorCount:8" +       //
                 hex("1e000000 0000000000000000") + "ActiveProcessorCount:6" + //
                 hex("1e000000 0000000000000000") + "OSVersion:Version 14.2" + //
                 hex("13000000 0000000000000000") + "RAM:16384MB",
             "processorCount = text 'ProcessorCount:8', activeProcessorCount = text 'ActiveProcessorCount:6', "
             "osVersion = text 'OSVersion:Version 14.2', ram = text 'RAM:16384MB', timestamp = float 0"},
        };
    }
    static std::string streamOfThisMachine() {
        const ProcessInfo machine = ProcessInfo::current();
        const std::vector<std::string> texts{"ProcessorCount:" + std::to_string(machine.processorCount),
                                             "ActiveProcessorCount:" + std::to_string(machine.activeProcessorCount),
                                             "OSVersion:" + machine.operatingSystemVersionString,
                                             "RAM:" + std::to_string(machine.physicalMemory / 1048576) + "MB"};
        std::string records;
        for (const std::string& text : texts)
            records += le32(static_cast<std::uint32_t>(text.size() + 8)) + hex("0000000000000000") + text;
        return header() + le32(static_cast<std::uint32_t>(records.size() + 4)) + le32(4) + records;
    }
};

struct ScrollActionSamples : KindClasses<ScrollActionKind, ScrollActionMetaDataWriter, ScrollActionMetaDataParser> {
    static constexpr std::string_view name = "scrollAction";
    static constexpr auto list = &ScrollActionMetaDataParser::scrollActionData;
    static constexpr auto setList = &ScrollActionMetaDataParser::setScrollActionData;
    static constexpr std::size_t readFrom = s_bytesOfATime;
    static std::string header() { return streamHeader("2b7b6a05", 1, 16); }
    static Samples samples() {
        return {
            {[](Writer& writer) {
                 writer.write({0, -12.75}, {3, 2});
             },
             hex("000000000000f83f 00000000 f4ffffff"), "x = int32 0, y = int32 -12, timestamp = float 1.5"},
            {[](Writer& writer) {
                 writer.write({2147483647, -2147483648.0}, {5, 2});
             },
             hex("0000000000000440 ffffff7f 00000080"),
             "x = int32 2147483647, y = int32 -2147483648, timestamp = float 2.5"},
        };
    }
};

struct TopmostAppNameSamples
    : KindClasses<TopmostAppNameKind, TopmostAppNameMetaDataWriter, TopmostAppNameMetaDataParser> {
    static constexpr std::string_view name = "topmostAppName";
    static constexpr auto list = &TopmostAppNameMetaDataParser::appNameData;
    static constexpr auto setList = &TopmostAppNameMetaDataParser::setAppNameData;
    static constexpr std::size_t readFrom = s_bytesOfASize;
    static std::string header() { return streamHeader("2b7b6a06", 1, 0); }
    static Samples samples() {
        return {
            {[](Writer& writer) {
                 writer.write("Editor", {1, 4});
             },
             hex("0e000000 000000000000d03f 45 64 69 74 6f 72"), "name = text 'Editor', timestamp = float 0.25"},
            {[](Writer& writer) {
                 writer.write("Game", {3, 2});
             },
             hex("0c000000 000000000000f83f 47 61 6d 65"), "name = text 'Game', timestamp = float 1.5"},
        };
    }
};

struct TopmostWindowTitleSamples
    : KindClasses<TopmostWindowTitleKind, TopmostWindowTitleMetaDataWriter, TopmostWindowTitleMetaDataParser> {
    static constexpr std::string_view name = "topmostWindowTitle";
    static constexpr auto list = &TopmostWindowTitleMetaDataParser::windowTitleData;
    static constexpr auto setList = &TopmostWindowTitleMetaDataParser::setWindowTitleData;
    static constexpr std::size_t readFrom = s_bytesOfASize;
    static std::string header() { return streamHeader("2b7b6a07", 1, 0); }
    static Samples samples() {
        return {
            {[](Writer& writer) {
                 writer.write("Inbox (3)", {1, 4});
             },
             hex("11000000 000000000000d03f 49 6e 62 6f 78 20 28 33 29"),
             "title = text 'Inbox (3)', timestamp = float 0.25"},
            {[](Writer& writer) {
                 writer.write("x", {3, 2});
             },
             hex("09000000 000000000000f83f 78"), "title = text 'x', timestamp = float 1.5"},
        };
    }
};

struct CPUUsageSamples : KindClasses<CPUUsageKind, CPUUsageMetaDataWriter, CPUUsageMetaDataParser> {
    static constexpr std::string_view name = "cpuUsage";
    static constexpr auto list = &CPUUsageMetaDataParser::cpuUsageData;
    static constexpr auto setList = &CPUUsageMetaDataParser::setCpuUsageData;
    static constexpr std::size_t readFrom = s_bytesOfATime;
    static std::string header() { return streamHeader("2b7b6a08", 1, 12); }
    static Samples samples() {
        return {
            {[](Writer& writer) {
                 writer.write(0.1F, {1, 4});
             },
             hex("000000000000d03f cdcccc3d"), "cpuUsage = float 0.100000001, timestamp = float 0.25"},
            {[](Writer& writer) {
                 writer.write(99.5F, {3, 2});
             },
             hex("000000000000f83f 0000c742"), "cpuUsage = float 99.5, timestamp = float 1.5"},
        };
    }
};

struct HoverRectSamples : KindClasses<HoverRectKind, HoverRectMetaDataWriter, HoverRectMetaDataParser> {
    static constexpr std::string_view name = "hoverRect";
    static constexpr auto list = &HoverRectMetaDataParser::hoverRectData;
    static constexpr auto setList = &HoverRectMetaDataParser::setHoverRectData;
    static constexpr std::size_t readFrom = s_bytesOfATime;
    static std::string header() { return streamHeader("2b7b6a09", 1, 24); }
    static Samples samples() {
        return {
            {[](Writer& writer) {
                 writer.write({5.5, 6.5, 7.5, 8.5}, {1, 4});
             },
             hex("000000000000d03f 05000000 06000000 07000000 08000000"),
             "x = int32 5, y = int32 6, width = int32 7, height = int32 8, timestamp = float 0.25"},
            {[](Writer& writer) {
                 writer.write({-5.5, -6.5, 0, -0.5}, {3, 2});
             },
             hex("000000000000f83f fbffffff faffffff 00000000 00000000"),
             "x = int32 -5, y = int32 -6, width = int32 0, height = int32 0, timestamp = float 1.5"},
        };
    }
};

using EveryKind = std::tuple<CursorActionSamples, CursorImageSamples, CursorLocationSamples, CursorOpacitySamples,
                             KeyboardActionSamples, RecordingRegionSamples, TopmostWindowSamples, SlideInfoTitleSamples,
                             SlideInfoTextSamples, SlideInfoCommentSamples, ScaleFactorSamples, SystemDataSamples,
                             ScrollActionSamples, TopmostAppNameSamples, TopmostWindowTitleSamples, CPUUsageSamples,
                             HoverRectSamples>;

/// For the names of tests that run for several kinds.
struct KindName {
    template <class S>
    static std::string GetName(int) {
        return std::string(S::name);
    }
};

template <class S>
std::string goldenStream() {
    std::string stream = S::header();
    for (const auto& sample : S::samples())
        stream += sample.bytes;
    return stream;
}

template <class S>
std::vector<std::string> goldenEntries() {
    std::vector<std::string> entries;
    for (const auto& sample : S::samples())
        entries.push_back(sample.entry);
    return entries;
}

/// What recording the samples makes of a file.
template <class S>
std::string recordedStream() {
    if constexpr (requires { S::streamOfThisMachine(); })
        return S::streamOfThisMachine();
    else
        return goldenStream<S>();
}

template <class S>
void recordSamples(typename S::Writer& writer) {
    for (const auto& sample : S::samples())
        sample.record(writer);
}

/// Nothing for writers that close their file at their only entry.
template <class Writer>
void finish(Writer& writer) {
    if constexpr (requires { writer.finish(); })
        writer.finish();
}

} // namespace ZULMetaData::Test
