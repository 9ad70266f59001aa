#include "Tools/render/Upright.h"

extern "C" {
#include <libavutil/display.h>
}

#include <array>
#include <cmath>
#include <cstring>

namespace Render {

Turn turnOf(const AVStream& stream) {
    const std::uint8_t* bytes = av_stream_get_side_data(&stream, AV_PKT_DATA_DISPLAYMATRIX, nullptr);
    if (!bytes)
        return {};
    std::array<std::int32_t, 9> matrix{};
    std::memcpy(matrix.data(), bytes, sizeof matrix);
    Turn turn;
    const double determinant = static_cast<double>(matrix[0]) * matrix[4] - static_cast<double>(matrix[1]) * matrix[3];
    turn.isMirrored = determinant < 0;
    if (turn.isMirrored)
        av_display_matrix_flip(matrix.data(), 1, 0);
    const double angle = -av_display_rotation_get(matrix.data()); // clockwise
    if (std::isfinite(angle))
        turn.quarters = ((static_cast<int>(std::lround(angle / 90)) % 4) + 4) % 4;
    return turn;
}

YuvPicture turned(const YuvPicture& picture, const Turn& turn) {
    const int width = turn.swapsSides() ? picture.height() : picture.width();
    const int height = turn.swapsSides() ? picture.width() : picture.height();
    YuvPicture result(width, height, picture.matrix());
    for (int index = 0; index < 3; ++index) {
        const Plane from = picture.plane(index);
        const Plane to = result.plane(index);
        for (int y = 0; y < from.height; ++y)
            for (int x = 0; x < from.width; ++x) {
                const int right = turn.isMirrored ? from.width - 1 - x : x;
                int toX = right;
                int toY = y;
                if (turn.quarters == 1) {
                    toX = from.height - 1 - y;
                    toY = right;
                } else if (turn.quarters == 2) {
                    toX = from.width - 1 - right;
                    toY = from.height - 1 - y;
                } else if (turn.quarters == 3) {
                    toX = y;
                    toY = from.width - 1 - right;
                }
                to.row(toY)[toX] = from.row(y)[x];
            }
    }
    return result;
}

} // namespace Render
