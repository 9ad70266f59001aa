#pragma once

// What a camera shows that zooms in, follows the cursor, and zooms out again.
//
//     const Camera camera(zooms, path, screen);
//     for (int frame = 0; frame < frames; ++frame)
//         showPartOfPicture(camera.at(frame / 60.0).area);

#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaDataBridge/Source/ApplicationValues.h"
#include "CursorPath.h"
#include "Zooms.h"

#include <vector>

namespace ZULMetaData {

/// How a camera moves.
struct CameraOptions {
    double settleTime = 0.6;   ///< seconds until 95 percent of the way to a new place is done; at least 0.001
    bool followsCursor = true; ///< whether the camera follows the cursor while it is zoomed in
    double deadZone = 0.25;    ///< part of the visible size; a cursor nearer to the middle is not followed
};

/// What a camera shows at one time.
struct CameraView {
    ScreenPoint centre; ///< the middle of `area`
    double zoom = 1;    ///< how many times larger the picture appears; at least 1
    ScreenRect area;    ///< what is visible, in units of the display; within the screen
};

/// A camera on a critically damped spring, which pulls it to each place without swinging over. Until the first click or
/// key of a place it looks there; then it follows the cursor. The view at a time is a formula of that time alone: it
/// does not depend on when the camera was asked before, and is the same on every machine, to the last bit.
class ZULMETADATA_API Camera {
public:
    Camera() = default; ///< creates a camera without a picture

    /// Takes the zooms as `zoomsOf` returns them, and the recorded part of the display. Without a path the camera does
    /// not follow the cursor. Takes O(n) time and memory for n corners of the path.
    Camera(const std::vector<Zoom>& zooms, const CursorPath& path, const ScreenRect& screen,
           const CameraOptions& options = {});

    /// Returns what is visible at a time in seconds: the whole screen before the first zoom. Takes O(log n) time.
    CameraView at(double time) const;

private:
    class Maker;

    /// A spring between a place and its target, which moves at a constant speed.
    struct Spring {
        double target = 0;
        double targetSpeed = 0;
        double place = 0;
        double speed = 0;
    };

    /// Where the camera is at one time, and where it is pulled from then on.
    struct Pull {
        double time = 0;
        Spring x;
        Spring y;
        Spring zoom;
    };

    Pull after(const Pull& pull, double seconds) const;

    ScreenRect screen_;
    double stiffness_ = 1; ///< the frequency of the spring in radians per second
    std::vector<Pull> pulls_;
};

} // namespace ZULMetaData
