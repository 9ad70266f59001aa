// The form in which this library stores edit lists.
//
//     {"schema": "zulm.edits", "schema_version": 1, "pieces": [
//       {"start": "10", "end": "61/3", "speed": "3/2"},
//       {"at": "25/2", "duration": "2"}
//     ]}

#include "ZULMetaDataSession/EditList.h"
#include "ZULMetaDataSession/EditLists/Decimal.h"
#include "ZULMetaDataSession/EditLists/Json.h"

#include <algorithm>
#include <array>

namespace ZULMetaData {

namespace {

using detail::JsonValue;

constexpr std::string_view s_schema = "zulm.edits";
constexpr std::string_view s_schemaVersion = "1";

/// Reads the pieces of one document.
class OwnFormReader {
public:
    OwnFormReader(const JsonValue& document, const std::string& file) : document_(document), file_(file) {}

    EditList read() {
        if (!document_.isObject())
            fail("an edit list is a JSON object");
        requireMembers(document_, {"schema", "schema_version", "pieces"});
        const JsonValue* schema = document_.find("schema");
        if (!schema || !schema->isText(s_schema))
            fail("\"schema\" is not \"zulm.edits\"");
        const JsonValue* version = document_.find("schema_version");
        if (!version || !version->isNumber() || detail::exactDecimal(version->text) != Rational(1))
            fail("\"schema_version\" is not 1, which is the only version that can be read");
        const JsonValue* pieces = document_.find("pieces");
        if (!pieces || !pieces->isArray())
            fail("\"pieces\" is no array");
        for (const JsonValue& piece : pieces->items) {
            ++piece_;
            readPiece(piece);
        }
        return std::move(edits_);
    }

private:
    [[noreturn]] void fail(const std::string& sentence) const {
        throw Error(file_, (piece_ == 0 ? "" : "piece " + std::to_string(piece_) + ": ") + sentence);
    }

    template <std::size_t Count>
    void requireMembers(const JsonValue& object, const std::string_view (&known)[Count]) const {
        for (const JsonValue& member : object.items)
            if (std::find(std::begin(known), std::end(known), member.name) == std::end(known))
                fail('"' + member.name + "\" is no member that can stand here");
    }

    void readPiece(const JsonValue& piece) {
        if (!piece.isObject())
            fail("a piece is a JSON object");
        requireMembers(piece, {"start", "end", "speed", "at", "duration"});
        const bool isHeld = piece.find("at") != nullptr;
        if (isHeld == (piece.find("start") != nullptr))
            fail(isHeld ? "it has both \"start\" and \"at\"" : "it has neither \"start\" nor \"at\"");
        for (const char* other : {isHeld ? "speed" : "duration", isHeld ? "end" : "duration"})
            if (piece.find(other))
                fail('"' + std::string(other) + "\" cannot stand beside \"" + (isHeld ? "at" : "start") + '"');
        const Rational start = number(piece, isHeld ? "at" : "start");
        const Rational end = number(piece, isHeld ? "duration" : "end");
        const Rational speed = piece.find("speed") ? number(piece, "speed") : Rational(1);
        try {
            if (isHeld)
                edits_.hold(start, end);
            else
                edits_.keep(start, end, speed);
        } catch (const Error& error) {
            fail(error.sentence());
        }
    }

    Rational number(const JsonValue& piece, const char* name) const {
        const JsonValue* value = piece.find(name);
        if (!value)
            fail('"' + std::string(name) + "\" is missing");
        const auto number = value->isNumber() ? detail::nearestDouble(value->text)
                            : value->isText() ? Rational::parse(value->text)
                                              : std::nullopt;
        if (!number)
            fail('"' + std::string(name) + "\" is no finite number such as 12.5, \"12.5\" or \"61/3\"");
        return *number;
    }

    const JsonValue& document_;
    const std::string& file_;
    std::size_t piece_ = 0;
    EditList edits_;
};

std::string pieceText(const EditPiece& piece) {
    if (piece.isHeld())
        return "{\"at\": \"" + piece.start.text() + "\", \"duration\": \"" + piece.duration.text() + "\"}";
    const std::string speed = piece.speed == 1 ? "" : ", \"speed\": \"" + piece.speed.text() + '"';
    return "{\"start\": \"" + piece.start.text() + "\", \"end\": \"" + piece.end.text() + '"' + speed + '}';
}

} // namespace

std::string EditList::json() const {
    std::string document = "{\"schema\": \"" + std::string(s_schema) +
                           "\", \"schema_version\": " + std::string(s_schemaVersion) + ", \"pieces\": [";
    const char* separator = "\n  ";
    for (const EditPiece& piece : pieces_) {
        document += separator + pieceText(piece);
        separator = ",\n  ";
    }
    return document + (pieces_.empty() ? "]}\n" : "\n]}\n");
}

EditList EditList::read(std::string_view json, const std::string& file) {
    return OwnFormReader(detail::readJson(json, file), file).read();
}

} // namespace ZULMetaData
