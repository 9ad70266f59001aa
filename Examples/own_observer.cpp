// Receives entries one by one while they are read, without a list, to measure how far the cursor moved in the first
// seconds: own_observer RECORDING

#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <cmath>
#include <iostream>
#include <optional>

using namespace ZULMetaData;

namespace {

class Odometer final : public DataStreamObserver<Point> {
public:
    explicit Odometer(double seconds) : end_(seconds) {}

    bool dataRead(double time, const Point& location) override {
        if (time > end_)
            return false; // ends the reading
        if (previous_)
            pixels_ += std::hypot(location.x - previous_->x, location.y - previous_->y);
        previous_ = location;
        ++positions_;
        return true;
    }

    double pixels() const { return pixels_; }
    int positions() const { return positions_; }

private:
    double end_;
    double pixels_ = 0;
    int positions_ = 0;
    std::optional<Point> previous_;
};

} // namespace

int main(int count, char** arguments) {
    if (count != 2) {
        std::cerr << "usage: own_observer RECORDING\n";
        return 2;
    }
    const auto parser = MetaDataParser::create(arguments[1]);
    if (!parser) {
        std::cerr << arguments[1] << ": cannot be opened\n";
        return 1;
    }
    Odometer odometer(2.0);
    try {
        parser->loadDataType<Point>(s_cursorLocationUUID, odometer, -1);
    } catch (const std::runtime_error& error) { // the last entry is torn; those before it were delivered
        std::cerr << error.what() << '\n';
    }
    std::cout << odometer.positions() << " positions, " << std::lround(odometer.pixels()) << " pixels\n";
}
