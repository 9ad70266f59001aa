#include "Tools/render/Composer.h"

#include <utility>

namespace Render {

namespace {

using Clock = std::chrono::steady_clock;

} // namespace

Composer::Composer(FilmSession& session, PictureReader& pictures, const Stage& stage, const Style& style,
                   Retouch retouch)
    : session_(session), pictures_(pictures), stage_(stage), style_(style), retouch_(std::move(retouch)),
      backdrop_(stage, style, pictures.at(session.times().at(0).source).matrix()), cursor_(style.cursor),
      captions_(style.keys), base_(backdrop_.picture().copy()) {}

void Composer::drawMovie(const FilmTime& time, const View& view) {
    const YuvPicture& decoded = pictures_.at(time.source);
    const Clock::time_point begin = Clock::now();
    YuvPicture picture = decoded;
    const bool isRetouched = retouch_ && retouch_(picture, time.source);
    const PicturePart part = view.partOf(picture.width(), picture.height());
    if (isRetouched || shownPicture_ != pictures_.pictureNumber() || part != shownPart_) {
        resample(picture, part, base_, stage_.frame());
        shownPart_ = part;
        shownPicture_ = isRetouched ? 0 : pictures_.pictureNumber();
    }
    drawing_ += Clock::now() - begin;
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
    const Clock::time_point begin = Clock::now();
    frame_ = base_.copy(); // an encoder may still need the one before
    if (style_.clicks.isShown)
        for (ShownClick click : session_.clicksAt(time, style_.clicks.duration)) {
            click.age = isStill ? style_.clicks.duration / 2 : click.age;
            drawClick(click, style_.clicks, stage_, view, frame_);
        }
    if (const auto cursor = session_.cursorAt(time))
        cursor_.draw(*cursor, stage_, view, frame_);
    backdrop_.cutCorners(frame_);
    captions_.draw(session_.captionAt(time.film), time.film, stage_, frame_);
    drawing_ += Clock::now() - begin;
}

} // namespace Render
