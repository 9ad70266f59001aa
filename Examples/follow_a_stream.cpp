// Reads a stream file while a recorder still writes it. Here the recorder is another thread; it may be another process.

#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <atomic>
#include <chrono>
#include <fstream>
#include <iostream>
#include <thread>

using namespace ZULMetaData;

namespace {

/// Delivers the positions that were written since the last call. Entries reach the file when the writer flushes. An
/// entry of which the file holds only a part is left for the next call.
class CursorFollower {
public:
    explicit CursorFollower(const FileLocation& file) : path_(file) {}

    template <class Take>
    void poll(Take&& take) {
        std::ifstream stream(path_, std::ios::binary);
        const std::int64_t size = ParserUtil::calcFileSize(stream);
        stream.seekg(position_);
        while (position_ + s_entrySize <= size) {
            double time = 0;
            Point location;
            metaDataRead(stream, &time, &location, CursorLocationKind::version);
            position_ += s_entrySize;
            take(time, location);
        }
    }

private:
    static constexpr std::int64_t s_entrySize = sizeof(double) + sizeof(Point);

    FileLocation path_;
    std::int64_t position_ = s_metaDataHeaderSize;
};

} // namespace

int main() {
    const FileLocation file = "followed.dat";
    CursorLocationMetaDataWriter writer(file); // creates the file that is followed
    std::atomic<int> seen = 0;
    std::thread recorder([&] {
        for (int entry = 0; entry <= 30; ++entry) // the 1st, 16th and 31st are flushed
            writer.write(ScreenPoint(entry * 10, 100), MediaTime(entry, 10));
        while (seen < 31)
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        writer.write(ScreenPoint(999, 100), MediaTime(31, 10)); // stays in the buffer until the file is closed
        writer.finish();
    });

    CursorFollower follower(file);
    double lastTime = 0;
    Point last;
    while (seen < 32) {
        follower.poll([&](double time, const Point& location) {
            lastTime = time;
            last = location;
            if (++seen == 31)
                std::cout << "31 positions while it was being written, the last at " << time << " s\n";
        });
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
    recorder.join();
    std::cout << seen << " in all, the last at " << lastTime << " s: " << last << '\n';
}
