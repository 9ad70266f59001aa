// Prints where an editor should zoom in: from when to when, and into which area.
// auto_zoom RECORDING

#include "ZULMetaDataSession/ZULMetaDataSession.h"

#include <iostream>

using namespace ZULMetaData;

int main(int count, char** arguments) {
    if (count != 2) {
        std::cerr << "usage: auto_zoom RECORDING\n";
        return 2;
    }
    try {
        const Insights insights = insightsOf(Recording(arguments[1]));
        for (const Zoom& zoom : insights.zooms)
            for (const ZoomPlace& place : zoom.places)
                std::cout << place.start << " s to " << zoom.end << " s: " << truncated(place.area) << '\n';
    } catch (const Error& error) {
        std::cerr << error.what() << '\n';
        return 1;
    }
}
