#include "Tools/render/Composer.h"

#include <ctime>
#include <utility>

namespace Render {

namespace {

/// Returns the seconds of a processor that this thread has had.
double processorTime() {
    timespec time{};
    clock_gettime(CLOCK_THREAD_CPUTIME_ID, &time);
    return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_nsec) * 1e-9;
}

} // namespace

Composer::Composer(FilmSession& session, PictureReader& pictures, const Stage& stage, const Style& style, Cover cover)
    : session_(session), pictures_(pictures), stage_(stage), style_(style), cover_(std::move(cover)),
      backdrop_(stage, style, pictures.at(session.times().at(0).source).matrix()), cursor_(style.cursor),
      captions_(style.keys), base_(backdrop_.picture().copy()) {}

void Composer::drawMovie(const FilmTime& time, const View& view) {
    const YuvPicture& decoded = pictures_.at(time.source);
    const double begin = processorTime();
    YuvPicture picture = decoded;
    const double taken = pictures_.pictureTime(); // which is later if the movie begins late or cannot be sought in
    bool isCovered = cover_.picture && cover_.picture(picture, time.source);
    if (cover_.picture && taken > time.source)
        isCovered = cover_.picture(picture, taken) || isCovered;
    const PicturePart part = view.partOf(picture.width(), picture.height());
    if (isCovered || shownPicture_ != pictures_.pictureNumber() || part != shownPart_) {
        resample(picture, part, base_, stage_.frame());
        shownPart_ = part;
        shownPicture_ = isCovered ? 0 : pictures_.pictureNumber();
    }
    drawing_ += processorTime() - begin;
}

bool Composer::isHidden(const ZULMetaData::ScreenPoint& position, const FilmTime& time) const {
    return cover_.hides && cover_.hides(position, time.source);
}

const YuvPicture& Composer::frameAt(const FilmTime& time) {
    drawFrame(time, false);
    return frame_;
}

YuvPicture Composer::stillAt(const FilmTime& time) {
    drawFrame(time, true);
    return frame_;
}

void Composer::drawFrame(const FilmTime& time, bool isStill) {
    const View view(stage_, session_.region(), session_.areaAt(time.film));
    drawMovie(time, view);
    const double begin = processorTime();
    frame_ = base_.copy(); // an encoder may still need the one before
    if (style_.clicks.isShown)
        for (ShownClick click : session_.clicksAt(time, style_.clicks.duration)) {
            if (isHidden(click.position, time))
                continue;
            click.age = isStill ? style_.clicks.duration / 2 : click.age;
            drawClick(click, style_.clicks, stage_, view, frame_);
        }
    if (const auto cursor = session_.cursorAt(time); cursor && !isHidden(cursor->position, time))
        cursor_.draw(*cursor, stage_, view, frame_);
    backdrop_.cutCorners(frame_);
    captions_.draw(session_.captionAt(time.film), time.film, stage_, frame_);
    drawing_ += processorTime() - begin;
}

} // namespace Render
