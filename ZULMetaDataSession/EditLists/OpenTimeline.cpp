// OpenTimelineIO: a timeline is a stack of tracks, and a track a row of clips.
//
//     {"OTIO_SCHEMA": "Timeline.1", "tracks": {"OTIO_SCHEMA": "Stack.1", "children": [
//       {"OTIO_SCHEMA": "Track.1", "kind": "Video", "children": [
//         {"OTIO_SCHEMA": "Clip.2", "source_range": {"OTIO_SCHEMA": "TimeRange.1",
//           "start_time": {"OTIO_SCHEMA": "RationalTime.1", "value": 240, "rate": 24},
//           "duration": {"OTIO_SCHEMA": "RationalTime.1", "value": 48, "rate": 24}}}]}]}}

#include "ZULMetaDataSession/EditLists/Formats.h"
#include "ZULMetaDataSession/EditLists/ListBuilder.h"

namespace ZULMetaData::detail {

namespace {

/// A range of times in seconds.
struct OpenRange {
    Rational start;
    Rational duration;
};

/// Reads one timeline.
class OpenTimelineReader {
public:
    explicit OpenTimelineReader(const std::string& file) : list_(file) {}

    EditList read(const JsonValue& timeline) {
        requireSchema(timeline, "Timeline", "a timeline");
        const JsonValue& stack = requireMember(list_, timeline, "tracks");
        requireSchema(stack, "Stack", "the stack of tracks");
        requireUntouched(stack, "the stack of tracks");
        const JsonValue* pictures = nullptr;
        for (const JsonValue& track : arrayMember(list_, stack, "children").items) {
            requireSchema(track, "Track", "a track");
            const std::string& kind = textMember(list_, track, "kind");
            if (kind != "Video" && kind != "Audio")
                list_.fail("a track is of the kind " + inQuotes(kind) + ", neither Video nor Audio");
            const bool isSeen =
                kind == "Video" && isEnabled(track) && !arrayMember(list_, track, "children").items.empty();
            if (isSeen && pictures)
                list_.fail("the timeline has several tracks of pictures, which an edit list cannot say");
            pictures = isSeen ? &track : pictures;
        }
        if (pictures)
            readTrack(*pictures);
        return list_.take();
    }

private:
    /// Returns the name of an object's schema without its version; empty if there is none.
    static std::string_view schemaOf(const JsonValue& object) {
        const JsonValue* schema = object.find("OTIO_SCHEMA");
        const std::string_view text = schema && schema->isText() ? std::string_view(schema->text) : std::string_view();
        return text.substr(0, text.find('.'));
    }

    void requireSchema(const JsonValue& object, std::string_view schema, const std::string& what) const {
        if (schemaOf(object) != schema)
            list_.fail(what + " is no " + std::string(schema));
    }

    static const JsonValue* present(const JsonValue& object, const char* name) {
        const JsonValue* member = object.find(name);
        return member && member->type != JsonValue::Type::Null ? member : nullptr;
    }

    static bool isEnabled(const JsonValue& object) {
        const JsonValue* enabled = present(object, "enabled");
        return !enabled || enabled->text != "false";
    }

    /// Fails if an object shows its children in another way than one after the other, each as it is.
    void requireUntouched(const JsonValue& object, const std::string& what) const {
        if (present(object, "source_range"))
            list_.fail(what + " is trimmed; trim its clips instead");
        if (speedOf(object) != 1)
            list_.fail(what + " has another speed; change that of its clips instead");
    }

    void readTrack(const JsonValue& track) {
        requireUntouched(track, "the track");
        std::size_t number = 0;
        for (const JsonValue& item : arrayMember(list_, track, "children").items) {
            list_.moveTo("item", ++number);
            const std::string_view schema = schemaOf(item);
            if (schema == "Clip")
                readClip(item);
            else if (schema == "Gap")
                readGap(item);
            else
                list_.fail("it is a " + (schema.empty() ? "JSON value" : inQuotes(schema)) +
                           ", which an edit list cannot say");
        }
    }

    void readGap(const JsonValue& gap) const {
        const JsonValue* range = present(gap, "source_range");
        if (!range || !rangeOf(*range).duration.isZero())
            list_.fail("it is a gap, which an edit list cannot say");
    }

    void readClip(const JsonValue& clip) {
        if (!isEnabled(clip))
            list_.fail("the clip is switched off, which leaves a gap");
        const JsonValue* media = mediaOf(clip);
        list_.requireSource(sourceOf(media));
        const JsonValue* available = media ? present(*media, "available_range") : nullptr;
        const JsonValue* played = present(clip, "source_range");
        if (!played && !available)
            list_.fail("it has no \"source_range\"");
        const OpenRange range = rangeOf(played ? *played : *available);
        const Rational begin = available ? rangeOf(*available).start : Rational(0);
        list_.play(range.start - begin, range.duration, speedOf(clip));
    }

    /// Returns the reference that a clip plays, or null if it has none.
    const JsonValue* mediaOf(const JsonValue& clip) const {
        const JsonValue* references = present(clip, "media_references");
        if (!references)
            return present(clip, "media_reference");
        const JsonValue* key = present(clip, "active_media_reference_key");
        const JsonValue* media = references->find(key && key->isText() ? key->text : "DEFAULT_MEDIA");
        if (!media)
            list_.fail("it plays a media reference that it does not have");
        return media->type == JsonValue::Type::Null ? nullptr : media;
    }

    /// Returns the address of the media; empty if it is not known.
    std::string sourceOf(const JsonValue* media) const {
        if (!media || schemaOf(*media) == "MissingReference")
            return {};
        if (schemaOf(*media) != "ExternalReference")
            list_.fail("its media is a " + inQuotes(schemaOf(*media)) + ", not a file");
        return textMember(list_, *media, "target_url");
    }

    /// Returns the speed that the effects of an object lead to. Other effects change the picture, but no time.
    Rational speedOf(const JsonValue& object) const {
        Rational speed = 1;
        if (const JsonValue* effects = present(object, "effects"))
            for (const JsonValue& effect : effects->items) {
                const std::string_view schema = schemaOf(effect);
                if (!isEnabled(effect))
                    continue;
                if (schema == "FreezeFrame")
                    speed = 0;
                else if (schema == "LinearTimeWarp")
                    speed = speed * numberMember(list_, effect, "time_scalar");
                else if (schema != "Effect")
                    list_.fail("it has the effect " + inQuotes(schema) + ", which an edit list cannot say");
            }
        return speed;
    }

    OpenRange rangeOf(const JsonValue& range) const {
        requireSchema(range, "TimeRange", "a range");
        return {timeOf(requireMember(list_, range, "start_time")), timeOf(requireMember(list_, range, "duration"))};
    }

    Rational timeOf(const JsonValue& time) const {
        requireSchema(time, "RationalTime", "a time");
        const Rational rate = numberMember(list_, time, "rate");
        if (rate.isZero() || rate.isNegative())
            list_.fail("the rate of a time is not above 0");
        return numberMember(list_, time, "value") / rate;
    }

    ListBuilder list_;
};

} // namespace

EditList readOpenTimeline(const JsonValue& document, const std::string& file) {
    return OpenTimelineReader(file).read(document);
}

} // namespace ZULMetaData::detail
