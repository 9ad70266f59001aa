#pragma once

// What the tests of the renderer's parts share.

#include "Tools/render/YuvPicture.h"
#include "Tools/zulm/Failure.h"

#include <string>

namespace Render::Test {

/// Runs `work` and returns what its `Zulm::Failure` says.
template <class Work>
std::string failureOf(Work work) {
    try {
        work();
    } catch (const Zulm::Failure& failure) {
        return failure.what();
    }
    return "nothing was thrown";
}

/// A picture of one brightness without colour.
inline YuvPicture grey(int width, int height, double brightness) {
    YuvPicture picture(width, height, ColourMatrix::BT709);
    picture.fill({0, 0, width, height}, {brightness, brightness, brightness, 1});
    return picture;
}

inline int luma(const YuvPicture& picture, int x, int y) {
    return picture.plane(0).row(y)[x];
}

} // namespace Render::Test
