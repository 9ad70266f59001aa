// Lists the streams of a recording, and when the entries of each begin and end: list_streams RECORDING

#include "ZULMetaDataSession/ZULMetaDataSession.h"

#include <iostream>

using namespace ZULMetaData;

namespace {

void list(const Recording& recording) {
    for (const StreamInfo& stream : recording.streams()) {
        std::cout << stream.name();
        const bool isKnown = RecordedKinds::visit(stream.type, [&recording]<class Kind> {
            const Track<Kind>& track = recording.track<Kind>();
            std::cout << ": " << track.size() << " entries";
            if (!track.empty())
                std::cout << " from " << track.times().front() << " s to " << track.times().back() << " s";
        });
        std::cout << (isKnown ? "\n" : ": of no kind that has entries to list\n");
    }
    for (const ZCAPHeader& info : recording.creators())
        std::cout << "made on " << info.creator.name() << ", version " << info.creator.version() << '\n';
}

} // namespace

int main(int count, char** arguments) {
    if (count != 2) {
        std::cerr << "usage: list_streams RECORDING\n";
        return 2;
    }
    try {
        list(Recording(FileLocation(arguments[1])));
    } catch (const Error& error) {
        std::cerr << error.what() << '\n';
        return 1;
    }
}
