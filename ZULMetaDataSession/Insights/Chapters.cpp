#include "ZULMetaDataSession/Insights/Chapters.h"

#include <algorithm>
#include <cstddef>
#include <map>
#include <string_view>
#include <utility>

namespace ZULMetaData {

namespace {

/// A text that holds until the next state begins.
struct TextState {
    double start;
    std::string_view text;
};

/// A chapter may begin here.
struct ChapterMark {
    double start;
    std::string_view title;
    std::string_view application;
    ChapterSource source;
};

bool isBlankTitle(std::string_view text) {
    return text.find_first_not_of(" \t\r\n") == std::string_view::npos;
}

void append(std::vector<TextState>& states, const TextState& state) {
    if (!states.empty() && states.back().start == state.start)
        states.pop_back(); // it held for no time
    if (states.empty() || states.back().text != state.text)
        states.push_back(state);
}

/// Returns what holds from `start` until before `end`.
template <class Kind>
std::vector<TextState> statesIn(const Track<Kind>& track, double start, double end) {
    std::vector<TextState> states;
    if (start >= end)
        return states;
    if (const std::string* text = track.at(start))
        states.push_back({start, *text});
    const auto part = track.between(start, end);
    for (std::size_t i = 0; i < part.size(); ++i)
        append(states, {part.times[i], part.values[i]});
    return states;
}

/// Passes over those that hold for less than `flicker` seconds, up to `end`. The first that stays begins where the
/// first of all did.
std::vector<TextState> steadyOf(const std::vector<TextState>& states, double end, double flicker) {
    std::vector<TextState> steady;
    for (std::size_t i = 0; i < states.size(); ++i) {
        const double until = i + 1 < states.size() ? states[i + 1].start : end;
        if (until - states[i].start >= flicker)
            append(steady, {steady.empty() ? states.front().start : states[i].start, states[i].text});
    }
    return steady;
}

/// Returns the steady ones, or the last one if all flicker.
std::vector<TextState> steadyOrLastOf(const std::vector<TextState>& states, double end, double flicker) {
    std::vector<TextState> steady = steadyOf(states, end, flicker);
    if (steady.empty() && !states.empty())
        steady.push_back({states.front().start, states.back().text});
    return steady;
}

ChapterMark windowMark(double start, std::string_view title, std::string_view application, std::string_view untitled) {
    const bool hasApplication = !isBlankTitle(application);
    if (!isBlankTitle(title))
        return {start, title, application, ChapterSource::WindowTitle};
    return {start, hasApplication ? application : untitled, application,
            hasApplication ? ChapterSource::Application : ChapterSource::Nothing};
}

/// Collects the windows of a recording, application by application.
class WindowMarks {
public:
    WindowMarks(const Track<TopmostWindowTitleKind>& titles, const ChapterOptions& options)
        : titles_(titles), options_(options) {}

    std::vector<ChapterMark> read(const Track<TopmostAppNameKind>& applications, double duration) {
        const std::vector<TextState> names =
            steadyOrLastOf(statesIn(applications, 0, duration), duration, options_.flicker);
        readTitles(0, names.empty() ? duration : names.front().start, {});
        for (std::size_t i = 0; i < names.size(); ++i) {
            const double end = i + 1 < names.size() ? names[i + 1].start : duration;
            readTitles(names[i].start, end, names[i].text);
        }
        return std::move(marks_);
    }

private:
    void readTitles(double start, double end, std::string_view application) {
        if (start >= end)
            return;
        const std::vector<TextState> states = statesIn(titles_, start, end);
        std::vector<TextState> steady = steadyOf(states, end, options_.flicker);
        if (steady.empty() && isBlankTitle(application))
            steady = steadyOrLastOf(states, end, options_.flicker);
        if (!isBlankTitle(application) && (steady.empty() || steady.front().start > start))
            add(start, {}, application); // no title is known yet
        for (const TextState& title : steady)
            add(title.start, title.text, application);
    }

    void add(double start, std::string_view title, std::string_view application) {
        marks_.push_back(windowMark(start, title, application, options_.untitled));
    }

    const Track<TopmostWindowTitleKind>& titles_;
    const ChapterOptions& options_;
    std::vector<ChapterMark> marks_;
};

const ChapterMark* lastMarkAt(double time, const std::vector<ChapterMark>& marks) {
    const auto after = std::upper_bound(marks.begin(), marks.end(), time,
                                        [](double asked, const ChapterMark& mark) { return asked < mark.start; });
    return after == marks.begin() ? nullptr : &*(after - 1);
}

/// Returns one mark for each slide. After a slide without a title, the window counts again.
std::vector<ChapterMark> slideMarks(const std::vector<TextState>& slides, const std::vector<ChapterMark>& windows) {
    std::vector<ChapterMark> marks;
    for (const TextState& slide : slides) {
        const ChapterMark* window = lastMarkAt(slide.start, windows);
        if (!isBlankTitle(slide.text))
            marks.push_back(
                {slide.start, slide.text, window ? window->application : std::string_view(), ChapterSource::Slide});
        else if (window)
            marks.push_back({slide.start, window->title, window->application, window->source});
    }
    return marks;
}

/// Joins both in the order of time. A window that changes together with a slide is left out.
std::vector<ChapterMark> joinedMarks(const std::vector<ChapterMark>& windows, const std::vector<ChapterMark>& slides,
                                     double flicker) {
    const auto isBeside = [flicker](const ChapterMark& slide, double time) {
        const double apart = std::max(slide.start, time) - std::min(slide.start, time);
        return slide.source == ChapterSource::Slide && (apart == 0 || apart < flicker);
    };
    std::vector<ChapterMark> marks;
    auto slide = slides.begin();
    for (const ChapterMark& window : windows) {
        for (; slide != slides.end() && slide->start <= window.start; ++slide)
            marks.push_back(*slide);
        const bool isCovered = (slide != slides.end() && isBeside(*slide, window.start)) ||
                               (slide != slides.begin() && isBeside(*(slide - 1), window.start));
        if (!isCovered)
            marks.push_back(window);
    }
    marks.insert(marks.end(), slide, slides.end());
    return marks;
}

/// Makes chapters of marks.
class ChapterMaker {
public:
    ChapterMaker(const std::vector<ChapterMark>& marks, double duration, double least)
        : marks_(marks), duration_(duration), least_(least) {}

    std::vector<Chapter> make() const {
        std::vector<std::size_t> firsts = firstMarks();
        std::vector<Chapter> chapters;
        for (std::size_t i = 0; i < firsts.size(); ++i) {
            const std::size_t end = i + 1 < firsts.size() ? firsts[i + 1] : marks_.size();
            add(chapters, firsts[i], end);
        }
        return chapters;
    }

private:
    double startOf(std::size_t mark) const {
        if (mark == marks_.size())
            return duration_;
        return mark == 0 && marks_[0].start < least_ ? 0 : marks_[mark].start;
    }

    /// Returns the numbers of the marks at which chapters begin.
    std::vector<std::size_t> firstMarks() const {
        std::vector<std::size_t> firsts;
        for (std::size_t i = 0; i < marks_.size(); ++i)
            if (firsts.empty() || startOf(i) - startOf(firsts.back()) >= least_)
                firsts.push_back(i);
        if (firsts.size() > 1 && duration_ - startOf(firsts.back()) < least_)
            firsts.pop_back();
        return firsts;
    }

    /// Returns the mark whose name holds longest among [begin, end), the first of several.
    const ChapterMark& longestOf(std::size_t begin, std::size_t end) const {
        std::map<std::pair<std::string_view, std::string_view>, double> lengths;
        const auto lengthOf = [&](const ChapterMark& mark) -> double& {
            return lengths[{mark.title, mark.application}];
        };
        for (std::size_t i = begin; i < end; ++i)
            lengthOf(marks_[i]) += startOf(i + 1) - startOf(i);
        std::size_t longest = begin;
        for (std::size_t i = begin; i < end; ++i)
            if (lengthOf(marks_[i]) > lengthOf(marks_[longest]))
                longest = i;
        return marks_[longest];
    }

    void add(std::vector<Chapter>& chapters, std::size_t begin, std::size_t end) const {
        const ChapterMark& mark = longestOf(begin, end);
        Chapter chapter{startOf(begin), startOf(end), std::string(mark.title), std::string(mark.application),
                        mark.source};
        if (!chapters.empty() && chapters.back().title == chapter.title &&
            chapters.back().application == chapter.application)
            chapters.back().end = chapter.end;
        else
            chapters.push_back(std::move(chapter));
    }

    const std::vector<ChapterMark>& marks_;
    double duration_;
    double least_;
};

} // namespace

std::vector<Chapter> chaptersOf(const Track<TopmostWindowTitleKind>& titles,
                                const Track<TopmostAppNameKind>& applications, const Track<SlideInfoTitleKind>& slides,
                                double duration, const ChapterOptions& options) {
    const std::vector<ChapterMark> windows = WindowMarks(titles, options).read(applications, duration);
    const std::vector<TextState> steadySlides =
        steadyOrLastOf(statesIn(slides, 0, duration), duration, options.flicker);
    const std::vector<ChapterMark> marks = joinedMarks(windows, slideMarks(steadySlides, windows), options.flicker);
    return ChapterMaker(marks, duration, options.least).make();
}

} // namespace ZULMetaData
