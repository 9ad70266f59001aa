// CMX 3600 edit decision lists: an event in each line, with time codes of the source and of the edited movie.
//
//     TITLE: TALK
//     FCM: NON-DROP FRAME
//     001  AX       V     C        00:00:10:00 00:00:20:00 01:00:00:00 01:00:05:00
//     M2   AX             050.0                00:00:10:00

#include "ZULMetaDataSession/EditLists/Formats.h"
#include "ZULMetaDataSession/EditLists/ListBuilder.h"

#include <algorithm>
#include <array>

namespace ZULMetaData::detail {

namespace {

/// Some of the fields of an event of pictures. Frames are whole numbers.
struct CMXEvent {
    std::size_t line = 0;
    std::string reel;
    std::string clip; ///< as a comment names it
    std::int64_t sourceIn = 0;
    std::int64_t sourceOut = 0;
    std::int64_t recordIn = 0;
    std::int64_t recordOut = 0;
    std::optional<Rational> motion; ///< frames of the source for each second

    std::int64_t sourceLength() const { return sourceOut - sourceIn; }
    std::int64_t recordLength() const { return recordOut - recordIn; }
};

bool isCMXNumber(std::string_view word) {
    return !word.empty() && word.find_first_not_of("0123456789") == std::string_view::npos;
}

std::int64_t cmxNumberOf(std::string_view digits) {
    std::int64_t number = 0;
    for (const char digit : digits)
        number = number * 10 + (digit - '0');
    return number;
}

/// Returns whether a word looks like "01:00:00:00", with any of ":;." between its pairs of digits.
bool isTimeCode(std::string_view word) {
    constexpr std::size_t length = 11;
    if (word.size() != length)
        return false;
    for (std::size_t i = 0; i < length; ++i)
        if (i % 3 == 2 ? std::string_view(":;.,").find(word[i]) == std::string_view::npos
                       : !isCMXNumber(word.substr(i, 1)))
            return false;
    return true;
}

/// Turns time codes into frames.
class TimeCodes {
public:
    explicit TimeCodes(const Rational& rate) : rate_(rate), nominal_(1) {
        while (nominal_ < mostFrames && rate > nominal_)
            ++nominal_;
    }

    std::int64_t nominalRate() const { return nominal_; } ///< frames that a time code counts for each second
    bool isWhole() const { return rate_ == nominal_; }
    bool isPossible() const { return !(rate_ > nominal_) && rate_ * 10 > nominal_ * 10 - 1; }

    /// Returns whether time codes at this rate may leave out numbers.
    bool canDrop() const { return !isWhole() && (nominal_ == 30 || nominal_ == 60); }

    /// Returns nothing for a time code that no frame has.
    std::optional<std::int64_t> frames(std::string_view timeCode, bool drops) const {
        const std::int64_t hours = cmxNumberOf(timeCode.substr(0, 2));
        const std::int64_t minutes = cmxNumberOf(timeCode.substr(3, 2));
        const std::int64_t seconds = cmxNumberOf(timeCode.substr(6, 2));
        const std::int64_t frames = cmxNumberOf(timeCode.substr(9, 2));
        const std::int64_t dropped = drops ? nominal_ / 15 : 0; // numbers of each minute but every tenth
        const bool isDropped = minutes % 10 != 0 && seconds == 0 && frames < dropped;
        if (minutes >= 60 || seconds >= 60 || frames >= nominal_ || isDropped)
            return std::nullopt;
        const std::int64_t allMinutes = hours * 60 + minutes;
        return (allMinutes * 60 + seconds) * nominal_ + frames - dropped * (allMinutes - allMinutes / 10);
    }

    Rational seconds(std::int64_t frames) const { return Rational(frames) / rate_; }

private:
    static constexpr std::int64_t mostFrames = 100;

    Rational rate_;
    std::int64_t nominal_;
};

/// Reads the events of one list.
class EventReader {
public:
    EventReader(const std::string& file, const Rational& frameRate) : list_(file), codes_(frameRate) {
        if (!codes_.isPossible())
            list_.fail("time codes cannot count " + frameRate.text() + " frames for each second");
    }

    EditList read(std::string_view text) {
        for (line_ = 1; !text.empty(); ++line_) {
            list_.moveTo("line", line_);
            readLine(takeLine(text));
        }
        list_.moveToFile();
        if (events_.empty())
            list_.fail("the list has no events of pictures");
        addEvents();
        return list_.take();
    }

private:
    void readLine(std::string_view line) {
        constexpr std::string_view clipName = "* FROM CLIP NAME:";
        const std::vector<std::string_view> words = wordsOf(line);
        if (words.empty())
            return;
        if (isCMXNumber(words[0]) && words.size() > 3)
            readEvent(words);
        else if (words[0] == "FCM:")
            readFrameCode(line);
        else if (words[0] == "M2")
            readMotion(words);
        else if (trimmed(line).starts_with(clipName) && isInPictures_)
            events_.back().clip = trimmed(trimmed(line).substr(clipName.size()));
    }

    void readFrameCode(std::string_view line) {
        const std::string_view code = trimmed(line.substr(line.find(':') + 1));
        if (code != "DROP FRAME" && code != "NON-DROP FRAME" && code != "NON DROP FRAME")
            list_.fail(inQuotes(code) + " is neither DROP FRAME nor NON-DROP FRAME");
        drops_ = code == "DROP FRAME";
    }

    /// [number] [reel] [channels] [transition] ... [source in] [source out] [record in] [record out]
    void readEvent(const std::vector<std::string_view>& words) {
        constexpr std::size_t timeCodes = 4;
        const std::string_view channels = words[2];
        isInPictures_ = channels == "B" || channels.find('V') != std::string_view::npos;
        if (!isInPictures_)
            return;
        if (words[3] != "C")
            list_.fail("the transition " + inQuotes(words[3]) + " is no cut, which is all that an edit list can say");
        if (words.size() != timeCodes + 4 || !std::all_of(words.end() - timeCodes, words.end(), isTimeCode))
            list_.fail("the event does not end in four time codes");
        if (words[1] == "BL")
            list_.fail("the event is black, which an edit list cannot say");
        CMXEvent event;
        event.line = line_;
        event.reel = words[1];
        event.sourceIn = framesOf(words[4]);
        event.sourceOut = framesOf(words[5]);
        event.recordIn = framesOf(words[6]);
        event.recordOut = framesOf(words[7]);
        events_.push_back(std::move(event));
    }

    std::int64_t framesOf(std::string_view timeCode) const {
        const bool isMarked = timeCode.find_first_of(";,") != std::string_view::npos;
        if ((isMarked || drops_.value_or(false)) && !codes_.canDrop())
            list_.fail("drop-frame time codes need a frame rate of 30000/1001 or 60000/1001");
        if (!isMarked && !drops_ && codes_.canDrop())
            list_.fail("the list does not say whether it counts drop frames; add a line \"FCM: DROP FRAME\" or \"FCM: "
                       "NON-DROP FRAME\"");
        if (isMarked && drops_ == false)
            list_.fail("the time code " + std::string(timeCode) +
                       " counts drop frames, and the list says that it does "
                       "not");
        const auto frames = codes_.frames(timeCode, isMarked || drops_.value_or(false));
        if (!frames)
            list_.fail("no frame has the time code " + std::string(timeCode));
        return *frames;
    }

    /// M2 [reel] [frames for each second] [time code]
    void readMotion(const std::vector<std::string_view>& words) {
        if (!isInPictures_)
            return;
        if (words.size() < 4 || events_.back().reel != words[1])
            list_.fail("the motion does not belong to the event before it");
        const bool isNegative = words[2].starts_with('-');
        const std::string_view digits = words[2].substr(isNegative || words[2].starts_with('+') ? 1 : 0);
        const auto rate = Rational::parse(digits);
        if (!rate || digits.find('/') != std::string_view::npos)
            list_.fail(inQuotes(words[2]) + " is no number of frames for each second");
        if (isNegative && !rate->isZero())
            list_.fail("it runs backwards, which an edit list cannot say");
        events_.back().motion = *rate;
    }

    /// The time codes of the edited movie say in which order events play.
    void addEvents() {
        std::stable_sort(events_.begin(), events_.end(),
                         [](const CMXEvent& left, const CMXEvent& right) { return left.recordIn < right.recordIn; });
        std::int64_t end = events_.front().recordIn;
        for (const CMXEvent& event : events_) {
            list_.moveTo("line", event.line);
            if (event.recordIn != end)
                list_.fail("the event does not begin where the event before it ends; an edit list has neither gaps nor "
                           "layers");
            list_.requireSource(event.reel == "AX" && !event.clip.empty() ? event.clip : event.reel);
            if (event.recordLength() <= 0)
                list_.fail("the event does not end after its beginning");
            list_.play(codes_.seconds(event.sourceIn), codes_.seconds(event.recordLength()), speedOf(event));
            end = event.recordOut;
        }
    }

    /// Returns how many times as fast an event plays. In lists the source out of an event with motion has one of two
    /// meanings: the real end of the source, or a time as far from the source in as the record out is from the record
    /// in.
    Rational speedOf(const CMXEvent& event) const {
        const Rational ratio(event.sourceLength(), event.recordLength());
        if (!event.motion) {
            if (ratio != 1)
                list_.fail("the event has another length in the source than in the edited movie, and no motion");
            return 1;
        }
        const Rational speed = *event.motion / codes_.nominalRate();
        const bool isExact = speed.isZero() || (codes_.isWhole() && (ratio == 1 || agrees(event, speed)));
        const bool isRough = !codes_.isWhole() && (ratio != 1 || isUsual(*event.motion)) && agreesRoughly(event, ratio);
        if (!isExact && !isRough)
            list_.fail("the motion does not say how the length in the source becomes that in the edited movie");
        return isExact ? speed : ratio;
    }

    /// Returns whether the length in the source is that of the edited movie at a speed, to a frame.
    static bool agrees(const CMXEvent& event, const Rational& speed) {
        const Rational difference = speed * event.recordLength() - event.sourceLength();
        return difference <= 1 && difference >= -1;
    }

    /// A rate that is no whole number is written with one digit after the point.
    bool agreesRoughly(const CMXEvent& event, const Rational& ratio) const {
        const Rational tolerance =
            Rational(1, 5) * std::max(Rational(1), ratio) + Rational(codes_.nominalRate(), event.recordLength());
        const Rational difference = *event.motion - ratio * codes_.nominalRate();
        return difference <= tolerance && Rational() - difference <= tolerance;
    }

    bool isUsual(const Rational& motion) const {
        const Rational difference = motion - codes_.nominalRate();
        return difference * 5 <= 1 && difference * 5 >= -1;
    }

    ListBuilder list_;
    TimeCodes codes_;
    std::optional<bool> drops_;
    std::size_t line_ = 0;
    bool isInPictures_ = false; ///< whether the last event is one of pictures
    std::vector<CMXEvent> events_;
};

} // namespace

EditList readCMX3600(std::string_view text, const std::string& file, const EditListOptions& options) {
    if (!options.frameRate)
        throw Error(file, "an edit decision list counts frames; name its frame rate");
    return EventReader(file, *options.frameRate).read(text);
}

bool beginsCMX3600(std::string_view line) {
    const std::vector<std::string_view> words = wordsOf(line);
    if (words.empty())
        return false;
    return words[0] == "TITLE:" || words[0] == "FCM:" ||
           (isCMXNumber(words[0]) && words.size() >= 8 && isTimeCode(words.back()));
}

} // namespace ZULMetaData::detail
