#include "Tools/render/Resampler.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <vector>

namespace Render {

namespace {

constexpr int s_weightBits = 14;
constexpr int s_rowBits = 6; ///< that a row between the two steps has after its point

/// Where the samples of a line come from: the same number of neighbours for each, and their weights.
struct LineFilter {
    int taps = 0;
    std::vector<int> first;            ///< for each sample
    std::vector<std::int16_t> weights; ///< `taps` for each sample
};

/// The cubic of Catmull and Rom.
double kernel(double distance) {
    const double d = std::abs(distance);
    if (d < 1)
        return (1.5 * d - 2.5) * d * d + 1;
    if (d < 2)
        return ((-0.5 * d + 2.5) * d - 4) * d + 2;
    return 0;
}

/// Sample i is at `begin + i * step` of a line of `length` samples, the first of which is at 0.
LineFilter filterOf(double begin, double step, int count, int length) {
    const double stretch = std::max(1.0, step);
    LineFilter filter;
    filter.taps = std::min(length, 2 * static_cast<int>(std::ceil(2 * stretch)));
    const auto taps = static_cast<std::size_t>(filter.taps);
    filter.first.resize(static_cast<std::size_t>(count));
    filter.weights.resize(static_cast<std::size_t>(count) * taps);
    std::vector<double> weights(taps);
    for (int i = 0; i < count; ++i) {
        const double place = std::clamp(begin + i * step, -1.0, static_cast<double>(length));
        const int low = static_cast<int>(std::floor(place - 2 * stretch)) + 1;
        const int first = std::clamp(low, 0, length - filter.taps);
        std::fill(weights.begin(), weights.end(), 0);
        double sum = 0;
        for (int at = low; at < place + 2 * stretch; ++at) {
            const double weight = kernel((at - place) / stretch);
            weights[static_cast<std::size_t>(std::clamp(at - first, 0, filter.taps - 1))] += weight;
            sum += weight;
        }
        int left = 1 << s_weightBits;
        std::size_t largest = 0;
        for (std::size_t tap = 0; tap < taps; ++tap) {
            const auto weight = static_cast<int>(std::lround(weights[tap] / sum * (1 << s_weightBits)));
            filter.weights[static_cast<std::size_t>(i) * taps + tap] = static_cast<std::int16_t>(weight);
            left -= weight;
            largest = weights[tap] > weights[largest] ? tap : largest;
        }
        auto& rounded = filter.weights[static_cast<std::size_t>(i) * taps + largest];
        rounded = static_cast<std::int16_t>(rounded + left); // so that a plain area keeps its colour
        filter.first[static_cast<std::size_t>(i)] = first;
    }
    return filter;
}

/// The usual number of neighbours is known to the compiler.
template <int knownTaps>
void filterRow(const std::uint8_t* source, const LineFilter& filter, std::int16_t* target) {
    const int taps = knownTaps > 0 ? knownTaps : filter.taps;
    const std::int16_t* weight = filter.weights.data();
    for (std::size_t i = 0; i < filter.first.size(); ++i, weight += taps) {
        const std::uint8_t* sample = source + filter.first[i];
        int sum = 0;
        for (int tap = 0; tap < taps; ++tap)
            sum += weight[tap] * sample[tap];
        target[i] = static_cast<std::int16_t>(sum >> (s_weightBits - s_rowBits));
    }
}

void addRow(const std::int16_t* row, int weight, int* sums, std::size_t count) {
    for (std::size_t i = 0; i < count; ++i)
        sums[i] += weight * row[i];
}

void storeRow(const int* sums, std::uint8_t* target, std::size_t count) {
    constexpr int bits = s_weightBits + s_rowBits;
    for (std::size_t i = 0; i < count; ++i)
        target[i] = static_cast<std::uint8_t>(std::clamp((sums[i] + (1 << (bits - 1))) >> bits, 0, 255));
}

void resamplePlane(const Plane& source, const LineFilter& columns, const LineFilter& rows, const Plane& target, int x,
                   int y) {
    const std::size_t count = columns.first.size();
    const auto kept = static_cast<std::size_t>(rows.taps);
    std::vector<std::int16_t> ring(kept * count); // the last rows, each at its number modulo `kept`
    std::vector<int> numbers(kept, -1);
    std::vector<int> sums(count);
    for (std::size_t i = 0; i < rows.first.size(); ++i) {
        std::fill(sums.begin(), sums.end(), 0);
        for (std::size_t tap = 0; tap < kept; ++tap) {
            const int weight = rows.weights[i * kept + tap];
            const int number = rows.first[i] + static_cast<int>(tap);
            if (weight == 0)
                continue;
            const std::size_t slot = static_cast<std::size_t>(number) % kept;
            std::int16_t* row = ring.data() + slot * count;
            if (numbers[slot] != number) {
                if (columns.taps == 4)
                    filterRow<4>(source.row(number), columns, row);
                else
                    filterRow<0>(source.row(number), columns, row);
                numbers[slot] = number;
            }
            addRow(row, weight, sums.data(), count);
        }
        storeRow(sums.data(), target.row(y + static_cast<int>(i)) + x, count);
    }
}

} // namespace

void resample(const YuvPicture& source, const PicturePart& part, const YuvPicture& target, const PixelRect& place) {
    const double stepX = part.width / place.width;
    const double stepY = part.height / place.height;
    resamplePlane(source.plane(0), filterOf(part.x + 0.5 * stepX - 0.5, stepX, place.width, source.width()),
                  filterOf(part.y + 0.5 * stepY - 0.5, stepY, place.height, source.height()), target.plane(0), place.x,
                  place.y);
    // A sample of colour is at the left one of two columns, and between two rows.
    const Plane colour = source.plane(1);
    const LineFilter columns = filterOf((part.x + 0.5 * stepX - 0.5) / 2, stepX, (place.width + 1) / 2, colour.width);
    const LineFilter rows = filterOf((part.y + stepY) / 2 - 0.5, stepY, (place.height + 1) / 2, colour.height);
    for (const int plane : {1, 2})
        resamplePlane(source.plane(plane), columns, rows, target.plane(plane), place.x / 2, place.y / 2);
}

} // namespace Render
