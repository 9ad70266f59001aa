// Timelines of auto-editor, which count frames.
//
//     {"version": "1", "timebase": "30/1", "source": "a.mp4", "chunks": [[0, 26, 1.0], [26, 34, 99999.0]]}
//     {"version": "2", "tb": "30/1", "source": "a.mp4", "effects": [[], ["speed:2"]], "clips": [[0, 26, 0]]}
//     {"version": "3", "timebase": "30/1",
//      "v": [[{"src": "a.mp4", "start": 0, "dur": 26, "offset": 0, "speed": 1.0, "stream": 0}]], "a": []}

#include "ZULMetaDataSession/EditLists/Decimal.h"
#include "ZULMetaDataSession/EditLists/Formats.h"
#include "ZULMetaDataSession/EditLists/ListBuilder.h"

#include <algorithm>
#include <array>

namespace ZULMetaData::detail {

namespace {

/// Actions that change neither the times nor the place of anything in the picture.
constexpr std::array s_otherActions{"nil",     "volume", "deesser", "duck",       "invert",   "brightness", "blur",
                                    "opacity", "luv",    "erosion", "aberration", "pixelate", "drawbox",    "ease"};

/// A clip of version 3.
struct TimelineClip {
    std::size_t number = 0; ///< in the file, counted from 1
    Rational start;         ///< in frames of the timeline
    Rational duration;      ///< in frames of the timeline
    Rational offset;        ///< in frames of the source as it plays at the clip's speed
    Rational speed;
};

/// Reads one timeline.
class TimelineReader {
public:
    TimelineReader(const JsonValue& document, const std::string& file, const EditListOptions& options)
        : document_(document), list_(file), options_(options) {}

    EditList read() {
        if (!document_.isObject())
            list_.fail("a timeline is an object");
        const std::string& version = textMember(list_, document_, "version");
        if (version == "1")
            readChunks();
        else if (version == "2")
            readClips();
        else if (version == "3")
            readLayers();
        else
            list_.fail("the timeline is of version " + inQuotes(version) + "; versions 1, 2 and 3 can be read");
        return list_.take();
    }

private:
    /// Takes the frame rate from a member, or from the caller if there is no such member.
    void readFrameRate(const char* member) {
        if (document_.find(member)) {
            const std::string& text = textMember(list_, document_, member);
            const auto rate = Rational::parse(text);
            if (!rate || rate->isZero() || text.find('.') != std::string::npos)
                list_.fail(inQuotes(member) + " is no fraction such as \"30/1\" or \"30000/1001\"");
            frameRate_ = *rate;
        } else if (options_.frameRate) {
            frameRate_ = *options_.frameRate;
        } else {
            list_.fail("it counts frames; name its frame rate");
        }
    }

    Rational seconds(const Rational& frames) const { return frames / frameRate_; }

    const JsonValue& triple(const JsonValue& value, const char* parts) const {
        if (!value.isArray() || value.items.size() != 3)
            list_.fail("it is no array of " + std::string(parts));
        return value;
    }

    void readChunks() {
        constexpr std::int64_t cut = 99999;
        readFrameRate("timebase");
        textMember(list_, document_, "source");
        std::size_t number = 0;
        for (const JsonValue& value : arrayMember(list_, document_, "chunks").items) {
            list_.moveTo("chunk", ++number);
            const JsonValue& chunk = triple(value, "start, end and speed");
            const Rational start = requireNumber(list_, chunk.items[0], "the start");
            const Rational end = requireNumber(list_, chunk.items[1], "the end");
            const Rational speed = requireNumber(list_, chunk.items[2], "the speed");
            if (!speed.isZero() && speed < cut)
                list_.keep(seconds(start), seconds(end), speed);
        }
    }

    void readClips() {
        readFrameRate("tb");
        textMember(list_, document_, "source");
        std::vector<std::optional<Rational>> speeds; // nothing for what is cut
        for (const JsonValue& effect : arrayMember(list_, document_, "effects").items) {
            list_.moveTo("effect", speeds.size());
            speeds.push_back(speedOf(effect));
        }
        std::size_t number = 0;
        list_.moveToFile();
        for (const JsonValue& value : arrayMember(list_, document_, "clips").items) {
            list_.moveTo("clip", ++number);
            const JsonValue& clip = triple(value, "start, end and effect");
            const Rational start = requireNumber(list_, clip.items[0], "the start");
            const Rational end = requireNumber(list_, clip.items[1], "the end");
            const Rational effect = requireNumber(list_, clip.items[2], "the effect");
            if (const auto& speed = speeds[indexOf(effect, speeds.size())])
                list_.keep(seconds(start), seconds(end), *speed);
        }
    }

    std::size_t indexOf(const Rational& effect, std::size_t count) const {
        const std::string text = effect.text();
        if (effect.isNegative() || effect >= static_cast<std::int64_t>(count) || text.find('/') != std::string::npos)
            list_.fail("there is no effect " + inQuotes(text));
        return std::stoul(text);
    }

    /// Returns the speed that actions such as ["speed:2", "volume:0.5"] lead to, or nothing if they cut.
    std::optional<Rational> speedOf(const JsonValue& actions) const {
        if (!actions.isArray())
            list_.fail("the actions are no array");
        Rational speed = 1;
        bool isCut = false;
        for (const JsonValue& action : actions.items) {
            if (!action.isText())
                list_.fail("an action is no text");
            const std::string_view text = action.text;
            const std::size_t mark = std::min(text.find(':'), text.size());
            const std::string_view name = text.substr(0, mark);
            if (name == "speed" || name == "varispeed")
                speed = speed * factorOf(text.substr(std::min(mark + 1, text.size())), action.text);
            else if (name == "cut")
                isCut = true;
            else if (std::find(s_otherActions.begin(), s_otherActions.end(), name) == s_otherActions.end())
                list_.fail("an edit list cannot say the action " + inQuotes(action.text));
        }
        return isCut ? std::nullopt : std::optional(speed);
    }

    Rational factorOf(std::string_view text, const std::string& action) const {
        const auto factor = Rational::parse(text);
        if (!factor || factor->isZero())
            list_.fail("the action " + inQuotes(action) + " has no speed above 0");
        return *factor;
    }

    void readLayers() {
        readFrameRate("timebase");
        requireNoTransitions();
        const JsonValue* layer = nullptr;
        for (const JsonValue& candidate : arrayMember(list_, document_, "v").items) {
            if (!candidate.isArray())
                list_.fail("a layer of \"v\" is no array");
            if (layer && !candidate.items.empty())
                list_.fail("the timeline has several layers of pictures, which an edit list cannot say");
            layer = candidate.items.empty() ? layer : &candidate;
        }
        if (!layer)
            return requireNoSound();
        std::vector<TimelineClip> clips;
        for (const JsonValue& value : layer->items) {
            list_.moveTo("clip", clips.size() + 1);
            clips.push_back(clipOf(value));
            clips.back().number = clips.size();
        }
        addInOrder(std::move(clips));
    }

    void requireNoTransitions() const {
        const JsonValue* transitions = document_.find("transitions");
        const JsonValue* ofPictures = transitions ? transitions->find("v") : nullptr;
        if (ofPictures && std::any_of(ofPictures->items.begin(), ofPictures->items.end(),
                                      [](const JsonValue& layer) { return !layer.items.empty(); }))
            list_.fail("the timeline has transitions, which an edit list cannot say");
    }

    void requireNoSound() const {
        const JsonValue* sound = document_.find("a");
        if (sound && std::any_of(sound->items.begin(), sound->items.end(),
                                 [](const JsonValue& layer) { return !layer.items.empty(); }))
            list_.fail("the timeline has sound without pictures");
    }

    TimelineClip clipOf(const JsonValue& value) {
        if (!value.isObject())
            list_.fail("it is no object");
        if (const JsonValue* name = value.find("name"); name && !name->isText("video"))
            list_.fail("it is no video, which is all that an edit list can say");
        list_.requireSource(textMember(list_, value, "src"));
        const JsonValue* stream = value.find("stream");
        const Rational track = stream ? requireNumber(list_, *stream, "\"stream\"") : Rational(0);
        if (track_ && *track_ != track)
            list_.fail("it plays another stream than the clip before it, which an edit list cannot say");
        track_ = track;
        TimelineClip clip;
        clip.start = numberMember(list_, value, "start");
        clip.duration = numberMember(list_, value, "dur");
        clip.offset = numberMember(list_, value, "offset");
        clip.speed = value.find("speed") ? numberMember(list_, value, "speed") : Rational(1);
        if (const JsonValue* actions = value.find("effects")) {
            const auto speed = speedOf(*actions);
            if (!speed)
                list_.fail("it is cut, but lasts " + clip.duration.text() + " frames");
            clip.speed = clip.speed * *speed;
        }
        if (clip.speed.isZero())
            list_.fail("\"speed\" is 0; it must be above 0");
        return clip;
    }

    /// A clip that begins later than the one before it ends leaves a gap.
    void addInOrder(std::vector<TimelineClip> clips) {
        std::stable_sort(clips.begin(), clips.end(),
                         [](const TimelineClip& left, const TimelineClip& right) { return left.start < right.start; });
        Rational end;
        for (const TimelineClip& clip : clips) {
            list_.moveTo("clip", clip.number);
            if (clip.start != end)
                list_.fail("it begins at frame " + clip.start.text() +
                           " of the timeline, and the clip before it ends at " + end.text() +
                           "; an edit list has neither gaps nor layers");
            list_.play(seconds(clip.offset * clip.speed), seconds(clip.duration), clip.speed);
            end = clip.start + clip.duration;
        }
    }

    const JsonValue& document_;
    ListBuilder list_;
    const EditListOptions& options_;
    Rational frameRate_;
    std::optional<Rational> track_;
};

} // namespace

EditList readAutoEditor(const JsonValue& document, const std::string& file, const EditListOptions& options) {
    return TimelineReader(document, file, options).read();
}

} // namespace ZULMetaData::detail
