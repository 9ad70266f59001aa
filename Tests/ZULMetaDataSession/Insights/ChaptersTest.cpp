#include "ZULMetaDataSession/Insights/Chapters.h"

#include "Tests/ZULMetaDataSession/Insights/Tracks.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <limits>
#include <string>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using Texts = std::vector<std::pair<double, std::string>>;

/// A recording of 100 seconds.
struct Scene {
    Texts titles = {};
    Texts applications = {};
    Texts slides = {};
    double duration = 100;

    std::vector<Chapter> chapters(const ChapterOptions& options = {}) const {
        return chaptersOf(trackOf<TopmostWindowTitleKind>(titles), trackOf<TopmostAppNameKind>(applications),
                          trackOf<SlideInfoTitleKind>(slides), duration, options);
    }
};

/// "START TITLE" for each chapter, after a check that they follow one another.
std::vector<std::string> startsAndTitles(const Scene& scene, const ChapterOptions& options = {}) {
    const std::vector<Chapter> chapters = scene.chapters(options);
    std::vector<std::string> lines;
    for (std::size_t i = 0; i < chapters.size(); ++i) {
        EXPECT_EQ(chapters[i].end, i + 1 < chapters.size() ? chapters[i + 1].start : scene.duration);
        lines.push_back(std::to_string(static_cast<int>(chapters[i].start)) + " " + chapters[i].title);
    }
    return lines;
}

TEST(Chapters, AreNoneIfNothingIsKnown) {
    EXPECT_THAT(Scene().chapters(), IsEmpty());
    EXPECT_THAT((Scene{.titles = {{0, "Mail"}}, .duration = 0}).chapters(), IsEmpty());
    EXPECT_THAT((Scene{.titles = {{100, "Mail"}}}).chapters(), IsEmpty()) << "at the end";
}

TEST(Chapters, BeginWhereATitleChanges) {
    const Scene scene{.titles = {{0, "Mail"}, {20, "Mail"}, {40, "Code"}},
                      .applications = {{0, "Post"}, {40, "Editor"}}};
    EXPECT_THAT(scene.chapters(), ElementsAre(Chapter{0, 40, "Mail", "Post", ChapterSource::WindowTitle},
                                              Chapter{40, 100, "Code", "Editor", ChapterSource::WindowTitle}));
}

TEST(Chapters, BeginAtZeroIfSomethingIsKnownSoon) {
    EXPECT_THAT(startsAndTitles({.titles = {{9, "Mail"}}}), ElementsAre("0 Mail"));
    EXPECT_THAT(startsAndTitles({.titles = {{30, "Mail"}}}), ElementsAre("30 Mail"));
    EXPECT_THAT(startsAndTitles({.titles = {{-5, "Old"}, {-1, "Mail"}}}), ElementsAre("0 Mail"));
}

TEST(Chapters, OfUntitledWindowsHaveTheNameOfTheApplication) {
    const Scene scene{.titles = {{0, "Mail"}, {30, " \t\r\n"}, {60, ""}}, .applications = {{0, "Post"}, {60, " "}}};
    EXPECT_THAT(scene.chapters(), ElementsAre(Chapter{0, 30, "Mail", "Post", ChapterSource::WindowTitle},
                                              Chapter{30, 60, "Post", "Post", ChapterSource::Application},
                                              Chapter{60, 100, "(untitled)", " ", ChapterSource::Nothing}));
    ChapterOptions options;
    options.untitled = "?";
    EXPECT_EQ(scene.chapters(options).at(2).title, "?");
}

TEST(Chapters, AreFoundFromApplicationsAlone) {
    EXPECT_THAT(startsAndTitles({.applications = {{0, "Post"}, {50, "Editor"}}}), ElementsAre("0 Post", "50 Editor"));
}

TEST(Chapters, KnowNoApplicationBeforeTheFirst) {
    const Scene scene{.titles = {{0, "Mail"}}, .applications = {{50, "Post"}}};
    EXPECT_THAT(scene.chapters(), ElementsAre(Chapter{0, 50, "Mail", "", ChapterSource::WindowTitle},
                                              Chapter{50, 100, "Mail", "Post", ChapterSource::WindowTitle}));
}

TEST(Chapters, PassOverTitlesThatFlicker) {
    EXPECT_THAT(startsAndTitles({.titles = {{0, "Mail"}, {50, "Loading"}, {50.5, "Mail"}}}), ElementsAre("0 Mail"));
    EXPECT_THAT(startsAndTitles({.titles = {{0, "Loading"}, {0.5, "Mail"}}}), ElementsAre("0 Mail"));
    EXPECT_THAT(startsAndTitles({.titles = {{0, "Mail"}, {99.5, "Stop"}}}), ElementsAre("0 Mail"));
    Texts progress{{0, "Mail"}};
    for (int i = 0; i < 100; ++i)
        progress.emplace_back(20 + 0.4 * i, std::to_string(i) + " %");
    progress.emplace_back(60, "Mail");
    EXPECT_THAT(startsAndTitles({.titles = progress}), ElementsAre("0 Mail"));
    ChapterOptions options;
    options.flicker = 60;
    EXPECT_THAT(startsAndTitles({.titles = {{0, "Mail"}, {60, "Code"}}}, options), ElementsAre("0 Mail"));
}

TEST(Chapters, HaveTheNameOfAnApplicationWhoseTitlesAllFlicker) {
    Scene scene{.titles = {{0, "Mail"}}, .applications = {{0, "Post"}, {20, "Terminal"}}};
    for (int i = 0; i < 160; ++i)
        scene.titles.emplace_back(20 + 0.5 * i, i % 2 ? "|" : "-");
    EXPECT_THAT(startsAndTitles(scene), ElementsAre("0 Mail", "20 Terminal"));
    EXPECT_THAT(startsAndTitles({.titles = {{0, "a"}, {0.5, "b"}}, .duration = 1}), ElementsAre("0 b"));
}

TEST(Chapters, BeginWithTheApplicationIfItsTitleComesALittleLater) {
    EXPECT_THAT(
        startsAndTitles({.titles = {{0, "Mail"}, {50.1, "Code"}}, .applications = {{0, "Post"}, {50, "Editor"}}}),
        ElementsAre("0 Mail", "50 Code"));
    const Scene titleFirst{.titles = {{0, "Mail"}, {49.9, "Code"}}, .applications = {{0, "Post"}, {50, "Editor"}}};
    EXPECT_THAT(titleFirst.chapters(), ElementsAre(Chapter{0, 50, "Mail", "Post", ChapterSource::WindowTitle},
                                                   Chapter{50, 100, "Code", "Editor", ChapterSource::WindowTitle}));
}

TEST(Chapters, LastAtLeastAsLongAsAskedFor) {
    const Scene scene{.titles = {{0, "A"}, {20, "B"}, {23, "C"}, {27, "D"}, {70, "E"}, {95, "F"}}};
    EXPECT_THAT(startsAndTitles(scene), ElementsAre("0 A", "20 D", "70 E"));
    ChapterOptions options;
    options.least = 3;
    EXPECT_THAT(startsAndTitles(scene, options), ElementsAre("0 A", "20 B", "23 C", "27 D", "70 E", "95 F"));
    options.least = 1000;
    EXPECT_THAT(startsAndTitles(scene, options), ElementsAre("0 D")) << "the title that held longest";
}

TEST(Chapters, OfTheSameNameAreOne) {
    EXPECT_THAT(startsAndTitles({.titles = {{0, "A"}, {30, "B"}, {33, "A"}}}), ElementsAre("0 A"));
}

TEST(Chapters, BeginWithSlides) {
    const Scene scene{.titles = {{0, "Deck"}}, .applications = {{0, "Show"}}, .slides = {{20, "Intro"}, {60, "End"}}};
    EXPECT_THAT(scene.chapters(), ElementsAre(Chapter{0, 20, "Deck", "Show", ChapterSource::WindowTitle},
                                              Chapter{20, 60, "Intro", "Show", ChapterSource::Slide},
                                              Chapter{60, 100, "End", "Show", ChapterSource::Slide}));
}

TEST(Chapters, AreNamedAfterTheSlideIfAWindowChangesWithIt) {
    for (const double window : {29.5, 30.0, 30.5})
        EXPECT_THAT(startsAndTitles({.titles = {{0, "Deck"}, {window, "Full screen"}}, .slides = {{30, "Intro"}}}),
                    ElementsAre("0 Deck", "30 Intro"));
}

TEST(Chapters, ReturnToTheWindowAfterASlideWithoutATitle) {
    EXPECT_THAT(startsAndTitles({.titles = {{0, "Deck"}}, .slides = {{20, "Intro"}, {60, ""}}}),
                ElementsAre("0 Deck", "20 Intro", "60 Deck"));
    EXPECT_THAT(startsAndTitles({.titles = {{0, "Deck"}, {60.5, "Mail"}}, .slides = {{20, "Intro"}, {60, ""}}}),
                ElementsAre("0 Deck", "20 Intro", "60 Mail"));
    EXPECT_THAT(startsAndTitles({.slides = {{0, ""}, {60, " "}}}), IsEmpty());
}

TEST(Chapters, LeaveASlideForAnotherWindow) {
    EXPECT_THAT(startsAndTitles({.titles = {{0, "Deck"}, {50, "Terminal"}, {80, "Deck"}}, .slides = {{20, "Demo"}}}),
                ElementsAre("0 Deck", "20 Demo", "50 Terminal", "80 Deck"));
}

TEST(Chapters, AreFoundInEntriesWithoutOrder) {
    const double nan = std::numeric_limits<double>::quiet_NaN();
    EXPECT_THAT(startsAndTitles({.titles = {{60, "C"}, {nan, "X"}, {0, "A"}, {1e300, "Y"}, {30, "B"}}}),
                ElementsAre("0 A", "30 B", "60 C"));
}

TEST(Chapters, AreFoundAmongAMillionEntriesAtOneTime) {
    constexpr std::size_t count = 1'000'000;
    std::vector<std::string> titles(count, "Mail");
    for (std::size_t i = 0; i < count; i += 2)
        titles[i] = "Code";
    const std::vector<double> times(count, 50);
    const std::vector<Chapter> chapters =
        chaptersOf({times, titles}, {times, titles}, {times, std::vector<std::string>(count, "")}, 1e9);
    EXPECT_THAT(chapters, ElementsAre(Chapter{50, 1e9, "Mail", "Mail", ChapterSource::WindowTitle}));
}

TEST(Chapters, AreFoundAmongAMillionChanges) {
    constexpr std::size_t count = 1'000'000;
    std::vector<double> times(count);
    std::vector<std::string> titles(count);
    for (std::size_t i = 0; i < count; ++i) {
        times[i] = 2.0 * static_cast<double>(i);
        titles[i] = std::to_string(i);
    }
    EXPECT_EQ(chaptersOf({times, titles}, {times, titles}, {}, 2e6).size(), 200'000U);
}

} // namespace
} // namespace ZULMetaData::Test
