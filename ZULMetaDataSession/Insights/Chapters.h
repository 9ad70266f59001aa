#pragma once

// Chapters of a recording, after its slides, windows and applications.
//
//     for (const Chapter& chapter : chaptersOf(titles, applications, slides, duration))
//         std::cout << chapter.start << " s: " << chapter.title << '\n';

#include "../../SharedDependencies/Export.h"
#include "../Track.h"

#include <cstdint>
#include <string>
#include <vector>

namespace ZULMetaData {

/// Which changes make a chapter.
struct ChapterOptions {
    double least = 10;                   ///< seconds of a chapter, at least, if the recording is that long
    double flicker = 1;                  ///< seconds; a title or an application that stays shorter is passed over
    std::string untitled = "(untitled)"; ///< the title of a chapter without any name
};

/// What a chapter is named after.
enum class ChapterSource : std::uint8_t { Slide, WindowTitle, Application, Nothing };

/// A part of a recording.
struct Chapter {
    double start = 0;        ///< in seconds
    double end = 0;          ///< in seconds: the start of the next chapter, or the end of the recording
    std::string title;       ///< as stored: of the slide, else of the window, else the name of the application
    std::string application; ///< as stored; empty if it is not known
    ChapterSource source = ChapterSource::Nothing; ///< what `title` is

    friend bool operator==(const Chapter&, const Chapter&) = default; ///< compares all fields
};

/// Returns the chapters between 0 and `duration` seconds, in their order. They follow one another without a gap; the
/// first begins at 0, unless nothing is known for the first `ChapterOptions::least` seconds.
///
/// A chapter begins when a slide, the title of the window on top, or the application changes. Titles that consist of
/// white space are left out: the chapter then has the name of the application. A title that flickers is passed over,
/// and the one before it goes on; if all titles of an application flicker, the chapter has the name of the application.
/// If a slide and a window change together, the slide counts. Changes that follow one another too quickly for
/// chapters of their own share one, which has the title that held longest. Takes O(n log n) time and O(n) memory.
ZULMETADATA_API std::vector<Chapter> chaptersOf(const Track<TopmostWindowTitleKind>& titles,
                                                const Track<TopmostAppNameKind>& applications,
                                                const Track<SlideInfoTitleKind>& slides, double duration,
                                                const ChapterOptions& options = {});

} // namespace ZULMetaData
