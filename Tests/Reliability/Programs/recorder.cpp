// Records with every writer as fast as it can until it is killed, or says what such a recording holds.
//
//     recorder record FOLDER DESCRIPTOR flushed|buffered|session
//     recorder count FILE|FOLDER
//     recorder session FOLDER ENTRIES
//     recorder one-session FOLDER ENTRIES
//     recorder abandoned FOLDER
//
// `record` writes to the descriptor, after each flush of a stream has returned, the stream's place among the kinds and
// how many of its entries are on the disk: two 32-bit numbers. `buffered` leaves flushing to the file buffer but for
// every 500th entry, so that a stream is often torn in the middle of an entry. `session` writes one session that
// flushes every 5 ms, and tells of entries that are older than this. `count` prints, for every kind, how many entries
// from the first on are what was recorded. `session` records so many entries of every kind, repairs the folder's
// Movie.mp4, appends the streams to it and reads them there. It prints for every kind whether its writer was healthy in
// the end, how many entries it says that it wrote, and how many are right in the stream file and the movie.
// `one-session` does the same with one session that saves itself. `abandoned` prints for every stream of the session in
// the folder how many whole entries it has, and how many bytes follow them.

#include "Tests/Reliability/Programs/Observations.h"

#include "ZULMetaDataBridge/Source/Validation/MetaDataValidator.h"
#include "ZULMetaDataSession/SessionWriter.h"

#include <array>
#include <chrono>
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

template <class R>
void recordInto(SessionWriter& session, std::uint32_t number) {
    using Kind = typename R::Kind;
    if constexpr (std::same_as<Kind, SystemDataKind>)
        session.write<Kind>(ProcessInfo::current());
    else
        session.write<Kind>(timeOf(number).seconds(), valueOf<Kind>(number));
}

/// An entry is on the disk once any entry is written the interval after it: all of a round are when the next one is
/// written whose start is so much later than the round's end.
[[noreturn]] void recordSessionForever(const std::string& folder, const Reporter& reporter) {
    constexpr auto interval = std::chrono::milliseconds(5);
    using Clock = std::chrono::steady_clock;
    SessionOptions options;
    options.flushInterval = interval;
    SessionWriter session(folder, options);
    std::vector<Clock::time_point> ends;
    std::uint32_t safe = 0;
    for (std::uint32_t number = 0;; ++number) {
        const auto start = Clock::now();
        forEachRecorded([&]<class R>() { recordInto<R>(session, number); });
        ends.push_back(Clock::now());
        const std::uint32_t before = safe;
        while (ends[safe] + interval <= start)
            ++safe;
        std::uint32_t stream = 0;
        forEachRecorded([&]<class R>() {
            if (safe > before)
                reporter.tell(stream, isOneShot<R>() ? 1 : safe);
            ++stream;
        });
    }
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
    bool isHealthy = false;
    std::uint64_t written = 0;
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

/// Prints what became of the streams, in the order of `AllRecorded`.
void printOutcomes(const std::string& folder, const std::vector<Outcome>& outcomes) {
    const std::string movie = folder + "/Movie.mp4";
    const bool isReadable = isSound(movie);
    auto outcome = outcomes.begin();
    forEachRecorded([&]<class R>() {
        std::printf("%s %d %lu %u %u\n", fileName<R>().c_str(), outcome->isHealthy,
                    static_cast<unsigned long>(outcome->written), rightEntries<R>(folder + "/" + fileName<R>()),
                    isReadable ? rightEntries<R>(movie) : 0);
        ++outcome;
    });
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
    printOutcomes(folder, outcomes);
}

void oneSession(const std::string& folder, std::uint32_t entries) {
    const std::string movie = folder + "/Movie.mp4";
    std::vector<Outcome> outcomes(RecordedKinds::size);
    try {
        SessionWriter session(folder);
        std::size_t stream = 0;
        forEachRecorded([&]<class R>() {
            for (std::uint32_t number = 0; number < entries; ++number)
                recordInto<R>(session, number);
        });
        session.finish();
        forEachRecorded([&]<class R>() {
            outcomes[stream++] = {session.isHealthy(), session.entriesWritten(R::Kind::type)};
        });
        session.saveInto(movie, "Recorder", "1.0");
    } catch (const Error&) { // the folder or the movie cannot be used
    }
    printOutcomes(folder, outcomes);
}

void abandoned(const std::string& folder) {
    for (const AbandonedSession& session : SessionWriter::abandoned(folder))
        for (const SessionStream& stream : session.streams())
            std::printf("%s %lu %lu\n", stream.file.filename().c_str(), static_cast<unsigned long>(stream.entries),
                        static_cast<unsigned long>(stream.tornBytes));
}

} // namespace

int main(int argc, char** argv) {
    const std::string command = argc > 2 ? argv[1] : "";
    if (command == "record" && argc == 5 && std::string(argv[4]) == "session")
        recordSessionForever(argv[2], Reporter(std::atoi(argv[3])));
    if (command == "record" && argc == 5)
        recordForever(argv[2], Reporter(std::atoi(argv[3])), std::string(argv[4]) == "buffered");
    if (command == "count" && argc == 3)
        count(argv[2]);
    else if (command == "session" && argc == 4)
        session(argv[2], static_cast<std::uint32_t>(std::atoi(argv[3])));
    else if (command == "one-session" && argc == 4)
        oneSession(argv[2], static_cast<std::uint32_t>(std::atoi(argv[3])));
    else if (command == "abandoned" && argc == 3)
        abandoned(argv[2]);
    else
        return 2;
    return 0;
}
