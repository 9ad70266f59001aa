// Records with every writer as fast as it can until it is killed, or says what such a recording holds.
//
//     recorder record FOLDER DESCRIPTOR flushed|buffered
//     recorder count FILE|FOLDER
//     recorder session FOLDER ENTRIES
//
// `record` writes to the descriptor, after each flush of a stream has returned, the stream's place among the kinds and
// how many of its entries are on the disk: two 32-bit numbers. `buffered` leaves flushing to the file buffer but for
// every 500th entry, so that a stream is often torn in the middle of an entry. `count` prints, for every kind, how
// many entries from the first on are what was recorded. `session` records so many entries of every kind, repairs the
// folder's Movie.mp4, appends the streams to it and reads them there. It prints for every kind whether its writer was
// healthy in the end, how many entries it says that it wrote, and how many are right in the stream file and the movie.

#include "Tests/Reliability/Programs/Observations.h"

#include "ZULMetaDataBridge/Source/Validation/MetaDataValidator.h"

#include <array>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <functional>
#include <memory>
#include <stdexcept>
#include <unistd.h>
#include <vector>

using namespace ZULMetaData;
using namespace ZULMetaData::Reliability;

namespace {

constexpr std::uint32_t s_seldom = 500;

class Reporter {
public:
    explicit Reporter(int descriptor) : descriptor_(descriptor) {}

    void tell(std::uint32_t stream, std::uint32_t entries) const {
        const std::array<std::uint32_t, 2> message{stream, entries};
        if (write(descriptor_, message.data(), sizeof message) != sizeof message)
            std::exit(1);
    }

private:
    int descriptor_;
};

/// Writes entry `number` of a stream. True where it was flushed with all before it.
using RecordOne = std::function<bool(std::uint32_t number)>;

template <class R>
RecordOne recorderOf(const std::string& folder, bool isBuffered) {
    auto writer = std::make_shared<typename R::Writer>(folder + "/" + fileName<R>());
    return [writer, isBuffered](std::uint32_t number) {
        bool isFlushed = isOneShot<R>() && number == 0;
        if constexpr (requires { writer->setFlushEveryWrite(true); }) {
            isFlushed = !isBuffered || number % s_seldom == 0;
            writer->setFlushEveryWrite(isFlushed);
        } else if constexpr (!isOneShot<R>()) {
            isFlushed = number % s_flushInterval == 0;
        }
        record<R>(*writer, number);
        return isFlushed;
    };
}

[[noreturn]] void recordForever(const std::string& folder, const Reporter& reporter, bool isBuffered) {
    std::vector<RecordOne> recorders;
    forEachRecorded([&]<class R>() { recorders.push_back(recorderOf<R>(folder, isBuffered)); });
    for (std::uint32_t number = 0;; ++number)
        for (std::uint32_t stream = 0; stream < recorders.size(); ++stream)
            if (recorders[stream](number))
                reporter.tell(stream, number + 1);
}

void count(const std::string& path) {
    const bool isFolder = std::filesystem::is_directory(path);
    forEachRecorded([&]<class R>() {
        const std::string file = isFolder ? path + "/" + fileName<R>() : path;
        const bool isThere = std::filesystem::exists(file);
        std::printf("%s %u\n", fileName<R>().c_str(), isThere ? rightEntries<R>(file) : 0);
    });
}

struct Outcome {
    bool isHealthy;
    std::uint64_t written;
};

template <class R>
Outcome recordEntries(const std::string& folder, std::uint32_t entries) {
    typename R::Writer writer(folder + "/" + fileName<R>());
    for (std::uint32_t number = 0; number < entries; ++number)
        record<R>(writer, number);
    if constexpr (requires { writer.finish(); })
        writer.finish();
    return {writer.isHealthy(), writer.entriesWritten()};
}

/// An append of torn streams is read only by those who have looked at it first.
bool isSound(const std::string& movie) {
    try {
        return !validateRecording(movie).isDamaged();
    } catch (const std::runtime_error&) { // it cannot be read
        return false;
    }
}

void session(const std::string& folder, std::uint32_t entries) {
    const std::string movie = folder + "/Movie.mp4";
    std::vector<Outcome> outcomes;
    std::vector<FileLocation> files;
    forEachRecorded([&]<class R>() {
        outcomes.push_back(recordEntries<R>(folder, entries));
        files.emplace_back(folder + "/" + fileName<R>());
    });
    ZULMAtomRepair::finalizeAtomsInFile(movie);
    try {
        ZULMAtomWriter().writeMetaDataFiles(files, movie);
    } catch (const std::runtime_error& error) { // of an entry of size 0 alone
        std::printf("append: %s\n", error.what());
    }
    const bool isReadable = isSound(movie);
    auto outcome = outcomes.begin();
    forEachRecorded([&]<class R>() {
        std::printf("%s %d %lu %u %u\n", fileName<R>().c_str(), outcome->isHealthy,
                    static_cast<unsigned long>(outcome->written), rightEntries<R>(folder + "/" + fileName<R>()),
                    isReadable ? rightEntries<R>(movie) : 0);
        ++outcome;
    });
}

} // namespace

int main(int argc, char** argv) {
    const std::string command = argc > 2 ? argv[1] : "";
    if (command == "record" && argc == 5)
        recordForever(argv[2], Reporter(std::atoi(argv[3])), std::string(argv[4]) == "buffered");
    if (command == "count" && argc == 3)
        count(argv[2]);
    else if (command == "session" && argc == 4)
        session(argv[2], static_cast<std::uint32_t>(std::atoi(argv[3])));
    else
        return 2;
    return 0;
}
