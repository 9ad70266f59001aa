// An edit list of one form. The first byte chooses what the caller knows: a frame rate, and the duration of the source.
// Either an error names the file, or the list can be written and read again.

#include "Fuzz/Target.h"
#include "ZULMetaDataSession/EditList.h"

using namespace ZULMetaData;

namespace {

constexpr const char* s_name = "list";

EditListOptions optionsOf(std::uint8_t choice) {
    EditListOptions options;
    options.format = EditListFormat::ZULM_FUZZ_FORM;
    if (choice % 4 != 0)
        options.frameRate = choice % 4 == 1 ? Rational(25) : choice % 4 == 2 ? Rational(30000, 1001) : Rational(60);
    if (choice & 4)
        options.duration = Rational(1001, 3);
    return options;
}

void requireWhole(const EditList& edits) {
    if (edits.bases().size() != edits.pieces().size())
        Fuzz::fail("a piece without a base");
    Rational end;
    for (std::size_t i = 0; i < edits.pieces().size(); ++i) {
        const EditPiece& piece = edits.pieces()[i];
        if (piece.start.isNegative() || piece.end < piece.start || piece.speed <= 0 || piece.duration <= 0)
            Fuzz::fail("an impossible piece");
        if (edits.bases()[i] != end || (!piece.isHeld() && piece.duration * piece.speed != piece.end - piece.start))
            Fuzz::fail("a piece in the wrong place");
        end = end + piece.duration;
    }
    if (edits.duration() != end)
        Fuzz::fail("another duration");
    const std::string json = edits.json();
    if (EditList::read(json, s_name).json() != json)
        Fuzz::fail("another list");
}

} // namespace

void runTarget(std::string_view bytes) {
    const EditListOptions options = optionsOf(Fuzz::takeByte(bytes));
    std::optional<EditList> edits;
    try {
        edits = EditList::open(ByteSource::memory(bytes), s_name, options);
    } catch (const Error& error) {
        if (error.file() != s_name || error.sentence().empty() || error.sentence().size() > 1000)
            Fuzz::fail(error.what());
    }
    if (edits)
        requireWhole(*edits);
    if (Fuzz::hasRefusedMemory())
        Fuzz::fail("much memory");
}
