// Recording into a session, beside the writers of its kinds. Those keep their entries in memory where they can be told
// to: the session has to look at a clock for every entry, and they need not.

#include "Benchmarks/Runner.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"
#include "ZULMetaDataSession/SessionWriter.h"

#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

namespace ZULMetaData::Bench {

namespace {

const std::string s_described = scratchFolder() + "/described.dat";
const std::string s_session = scratchFolder() + "/session";

std::string contentsOf(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

/// `describe(writer, i)` and `record(session, i)` write entry `i`.
template <class Kind, class Writer, class Describe, class Record>
void compareWriting(const Measure& measure, int entries, Describe describe, Record record) {
    const auto baseline = [&] {
        Writer writer(s_described);
        if constexpr (requires { writer.setFlushEveryWrite(false); })
            writer.setFlushEveryWrite(false);
        for (int i = 0; i < entries; ++i)
            describe(writer, i);
        writer.finish();
    };
    const auto library = [&] {
        SessionWriter session(s_session);
        for (int i = 0; i < entries; ++i)
            record(session, i);
        session.finish();
    };
    const auto removeLast = [] { std::filesystem::remove_all(s_session); };
    const std::string stream = s_session + "/" + metaDataKindName(Kind::type) + ".dat";
    compare(measure, {baseline}, {library, removeLast}, entries,
            [&] { return contentsOf(stream) == contentsOf(s_described); });
}

constexpr auto s_inMemory = "its writer, without a flush";

void comparePositions() {
    compareWriting<CursorLocationKind, CursorLocationMetaDataWriter>(
        {"record a cursor position in a session", "its writer", 1.3}, 2'000'000,
        [](auto& writer, int i) { writer.write(ScreenPoint(i, -i), MediaTime(i, 1)); },
        [](auto& session, int i) { session.template write<CursorLocationKind>(i, Point(i, -i)); });
    compareWriting<ScrollActionKind, ScrollActionMetaDataWriter>(
        {"record a scroll delta in a session", s_inMemory, 1.3}, 5'000'000,
        [](auto& writer, int i) { writer.write(ScreenPoint(i, -i), MediaTime(i, 1)); },
        [](auto& session, int i) { session.template write<ScrollActionKind>(i, Point(i, -i)); });
}

void compareNumbers() {
    compareWriting<TopmostWindowKind, TopmostWindowMetaDataWriter>(
        {"record a window in a session", s_inMemory, 1.3}, 5'000'000,
        [](auto& writer, int i) { writer.write(ScreenRect(i, -i, 7, 9), MediaTime(i, 1)); },
        [](auto& session, int i) { session.template write<TopmostWindowKind>(i, Rect(i, -i, 7, 9)); });
    compareWriting<KeyboardActionKind, KeyboardActionMetaDataWriter>(
        {"record a key in a session", s_inMemory, 1.3}, 5'000'000,
        [](auto& writer, int i) { writer.writeCharacterCode(static_cast<std::uint32_t>(i), 0, MediaTime(i, 1)); },
        [](auto& session, int i) {
            session.template write<KeyboardActionKind>(i, KeyStroke(static_cast<std::uint32_t>(i), 0));
        });
    compareWriting<CPUUsageKind, CPUUsageMetaDataWriter>(
        {"record a processor usage in a session", s_inMemory, 1.3}, 5'000'000,
        [](auto& writer, int i) { writer.write(static_cast<float>(i), MediaTime(i, 1)); },
        [](auto& session, int i) { session.template write<CPUUsageKind>(i, static_cast<float>(i)); });
}

void compareTextsAndCursors() {
    const std::string text(40, 'x');
    compareWriting<TopmostWindowTitleKind, TopmostWindowTitleMetaDataWriter>(
        {"record a title of 40 bytes in a session", s_inMemory, 1.3}, 1'000'000,
        [&](auto& writer, int i) { writer.write(text.c_str(), MediaTime(i, 1)); },
        [&](auto& session, int i) { session.template write<TopmostWindowTitleKind>(i, text); });
    compareWriting<CursorImageKind, CursorImageMetaDataWriter>(
        {"record a cursor that was seen before in a session", "its writer", 1.3}, 1'000'000,
        [](auto& writer, int i) { writer.writeCursorWithExistingUID(7, MediaTime(i, 1)); },
        [](auto& session, int i) {
            session.template write<CursorImageKind>(i, CursorAppearance{7, {}, false, 3});
        });
}

} // namespace

} // namespace ZULMetaData::Bench

int main(int argc, char** argv) {
    using namespace ZULMetaData::Bench;
    return runBenchmarks(argc, argv, [] {
        comparePositions();
        compareNumbers();
        compareTextsAndCursors();
    });
}
