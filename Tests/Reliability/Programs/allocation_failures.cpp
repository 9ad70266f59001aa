// Lets every allocation of the library's operations fail: one after the other alone, then each with all behind it.
//
//     allocation_failures FOLDER
//
// Prints, for every operation, its name, how many cases there were, and how many ended with std::bad_alloc; on standard
// error a sentence for each case that went wrong. What is right: std::bad_alloc or the documented result, no block
// kept, and files that are what they were or can be gone on with.

#include "Tests/Reliability/Programs/FailingAllocations.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "Tests/ZULMetaDataBridge/EntriesAsText.h"
#include "Tests/ZULMetaDataBridge/KindSamples.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"
#include "ZULMetaDataSession/ZULMetaDataSession.h"

#include <cstdio>
#include <fcntl.h>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iterator>
#include <map>
#include <memory>
#include <new>
#include <optional>
#include <sstream>
#include <string>
#include <system_error>
#include <unistd.h>
#include <utility>
#include <vector>

using namespace ZULMetaData;
using namespace ZULMetaData::Test;
using Reliability::blocksHeld;
using Reliability::failAllocation;
using Reliability::stopFailing;

namespace {

/// What this program says itself. Messages of the library lead nowhere.
std::FILE* s_results = nullptr;
std::FILE* s_complaints = nullptr;

void silenceLibrary() {
    s_results = fdopen(dup(STDOUT_FILENO), "w");
    s_complaints = fdopen(dup(STDERR_FILENO), "w");
    const int nowhere = open("/dev/null", O_WRONLY);
    dup2(nowhere, STDOUT_FILENO);
    dup2(nowhere, STDERR_FILENO);
    std::puts("for a message, standard output needs a buffer, which it keeps");
}

/// A stream writer that is never released, and what keeps it reachable.
constexpr long s_blocksOfAKeptWriter = 2;

struct Operation {
    std::string name;
    std::function<void()> prepare = [] {};
    std::function<void()> run = {}; ///< while allocations fail
    /// About what it has left behind; empty where that is right.
    std::function<std::string(bool hasThrown)> complaint = {};
    std::function<void()> clear = [] {};
    bool keepsStreamWriter = false;
};

std::string contentsOf(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

void writeFile(const std::string& path, const std::string& contents) {
    std::ofstream(path, std::ios::binary) << contents;
}

class Exercise {
public:
    explicit Exercise(Operation operation) : operation_(std::move(operation)) {}

    /// True where nothing went wrong.
    bool run() {
        failAt(0, false); // what is allocated once and stays is allocated here
        for (const bool andAllBehind : {false, true})
            for (long number = 1; failAt(number, andAllBehind); ++number)
                ++cases_;
        std::fprintf(s_results, "%s: %ld cases, %ld ended with std::bad_alloc\n", operation_.name.c_str(), cases_,
                     thrown_);
        return isRight_;
    }

private:
    /// False where the operation needs fewer allocations.
    bool failAt(long number, bool andAllBehind) {
        operation_.prepare();
        const long before = blocksHeld();
        std::string complaint;
        const bool hasThrown = runFailing(number, andAllBehind, complaint);
        const bool hasFailed = number != 0 && stopFailing() >= number;
        if (complaint.empty())
            complaint = operation_.complaint(hasThrown);
        if (complaint.empty() && hasThrown && !hasFailed)
            complaint = "threw std::bad_alloc, though memory was there";
        operation_.clear();
        if (complaint.empty() && number != 0)
            complaint = complaintAboutBlocks(blocksHeld() - before);
        if (!complaint.empty())
            complain(number, andAllBehind, complaint);
        thrown_ += hasThrown;
        return hasFailed;
    }

    bool runFailing(long number, bool andAllBehind, std::string& complaint) {
        failAllocation(number, andAllBehind);
        try {
            operation_.run();
            stopFailing();
        } catch (const std::bad_alloc&) {
            stopFailing();
            return true;
        } catch (const std::exception& other) {
            stopFailing();
            complaint = std::string("threw ") + other.what();
        }
        return false;
    }

    std::string complaintAboutBlocks(long kept) const {
        if (kept == 0 || (operation_.keepsStreamWriter && kept >= s_blocksOfAKeptWriter))
            return {};
        return "kept " + std::to_string(kept) + " blocks";
    }

    void complain(long number, bool andAllBehind, const std::string& complaint) {
        isRight_ = false;
        std::fprintf(s_complaints, "%s, allocation %ld%s: %s\n", operation_.name.c_str(), number,
                     andAllBehind ? " and all behind it" : "", complaint.c_str());
    }

    Operation operation_;
    long cases_ = 0;
    long thrown_ = 0;
    bool isRight_ = true;
};

// ---- writers and parsers ----------------------------------------------------------------------------------------

template <class S>
Operation recording(const std::string& folder) {
    const std::string file = folder + "/Stream.dat";
    const auto samples = std::make_shared<typename S::Samples>(S::samples());
    const auto isHealthy = std::make_shared<bool>();
    Operation operation{.name = "record " + std::string(S::name)};
    operation.prepare = [=] {
        std::filesystem::remove(file);
        *isHealthy = false;
    };
    operation.run = [=] {
        typename S::Writer writer(file);
        for (const auto& sample : *samples)
            sample.record(writer);
        finish(writer);
        *isHealthy = writer.isHealthy();
    };
    operation.complaint = [=](bool) -> std::string {
        const std::string stream = contentsOf(file);
        if (!recordedStream<S>().starts_with(stream))
            return "left a stream that is no beginning of what was recorded";
        return *isHealthy && stream != recordedStream<S>() ? "lost entries and stayed healthy" : "";
    };
    operation.keepsStreamWriter = !S::releasesStreamWriter;
    return operation;
}

/// Entries without their images: "nil" stands for one that there was no memory for.
std::vector<std::string> withoutImages(std::vector<std::string> entries) {
    for (std::string& entry : entries)
        if (entry.starts_with("image = "))
            entry.erase(0, entry.find(", id = "));
    return entries;
}

template <class S>
Operation parsing(const std::string& file) {
    const auto entries = std::make_shared<std::shared_ptr<EntryList>>();
    Operation operation{.name = "parse " + std::string(S::name) + " in " +
                                std::filesystem::path(file).extension().string()};
    operation.run = [=] { *entries = typename S::Parser(file).read(); };
    operation.complaint = [=](bool hasThrown) -> std::string {
        if (hasThrown || (*entries)->empty()) // the file could not be opened
            return {};
        const auto found = asTexts(**entries);
        return withoutImages(found) == withoutImages(goldenEntries<S>()) ? "" : "gave wrong entries";
    };
    operation.clear = [=] { entries->reset(); };
    return operation;
}

template <class S>
void addKind(std::vector<Operation>& operations, const std::string& folder, const std::string& movie) {
    const std::string file = folder + "/" + std::string(S::name) + ".dat";
    writeFile(file, goldenStream<S>());
    operations.push_back(recording<S>(folder));
    operations.push_back(parsing<S>(file));
    operations.push_back(parsing<S>(movie));
}

Operation recordingPixels(const std::string& folder) {
    const std::string file = folder + "/Pixels.dat";
    Operation operation{.name = "record a picture"};
    operation.prepare = [=] { std::filesystem::remove(file); };
    operation.run = [=] {
        CursorImageMetaDataWriter writer(file);
        writer.writeCursorImage(Image(2, 1, {255, 0, 0, 255, 0, 255, 0, 128}), 7, 5, 1, {3, -2}, {1, 4});
        writer.finish();
    };
    operation.complaint = [=](bool hasThrown) -> std::string {
        const auto entries = std::filesystem::exists(file) ? asTexts(*CursorImageMetaDataParser(file).read())
                                                           : std::vector<std::string>();
        if (entries.empty())
            return {}; // the file could not be created, or the picture was still being encoded
        const std::string id = "id = int64 7, ";
        const bool isWhole = entries[0].starts_with("image = image 2x1 ff0000ff 00ff0080, " + id);
        return !hasThrown && (isWhole || entries[0].starts_with("image = text 'nil', " + id)) ? ""
                                                                                              : "wrote " + entries[0];
    };
    return operation;
}

/// `run` returns its result as a text. This must be what it is with all the memory there is, or else `without`.
Operation reporting(const std::string& name, std::function<std::string()> run,
                    const std::optional<std::string>& without = {}) {
    const auto expected = std::make_shared<std::string>(run());
    const auto found = std::make_shared<std::string>();
    Operation operation{.name = name};
    operation.run = [=] { *found = run(); };
    operation.complaint = [=](bool hasThrown) -> std::string {
        return hasThrown || *found == *expected || *found == without ? "" : "told something else: " + *found;
    };
    operation.clear = [=] { *found = std::string(); };
    return operation;
}

std::string pixelsIn(const std::optional<Image>& image) {
    return image ? std::string(image->rgba().begin(), image->rgba().end()) : "no image";
}

template <class Bytes>
std::string asText(const Bytes& bytes) {
    return {bytes.begin(), bytes.end()};
}

/// What there is no memory for must not pass for a damaged picture, except for a TIFF file that is read: libtiff does
/// not say why it failed.
void addPictures(std::vector<Operation>& operations) {
    const Image picture(2, 1, {255, 0, 0, 255, 0, 255, 0, 128});
    const auto tiff = picture.tiffRepresentation();
    const auto bitmap = BitmapImageRep::fromTIFF(tiff);
    const auto png = bitmap->pngRepresentation();
    operations.push_back(reporting("encode a TIFF", [=] { return asText(picture.tiffRepresentation()); }));
    operations.push_back(reporting("encode a PNG", [=] { return asText(bitmap->pngRepresentation()); }));
    const auto pixels = [](const auto& encoded) { return pixelsIn(Image::fromEncodedBytes(encoded)); };
    const auto size = [](const auto& encoded) {
        const auto info = Image::infoOfEncodedBytes(encoded);
        return info ? std::to_string(info->decodingMemory) : "no image";
    };
    const auto check = [](const auto& encoded) {
        const bool isImage = Image::checkEncodedBytes(encoded).state == EncodedImageCheck::Decodable;
        return std::string(isImage ? "an image" : "no image");
    };
    for (const auto& [encoded, without] : {std::pair(tiff, std::optional<std::string>("no image")), {png, {}}}) {
        operations.push_back(reporting("decode a picture", std::bind(pixels, encoded), without));
        operations.push_back(reporting("look at a picture", std::bind(size, encoded), without));
        operations.push_back(reporting("check a picture", std::bind(check, encoded), without));
    }
}

// ---- movies -----------------------------------------------------------------------------------------------------

/// The media of a movie, open-ended as a recorder leaves it, and closed by a repair.
std::string openMedia() {
    return atom("ftyp", "mp42") + be32(0) + "mdat" + "0123456789";
}
std::string closedMedia() {
    return atom("ftyp", "mp42") + atom("mdat", "0123456789");
}

class Movie {
public:
    explicit Movie(const std::string& folder)
        : path(folder + "/Recording.mp4"), locations(folder + "/Locations.dat"), names(folder + "/Names.dat"),
          scale(folder + "/Scale.dat") {
        writeFile(locations, locationStream());
        writeFile(names, appNameStream());
        writeFile(scale, scaleStream(2));
    }

    static std::string whole() { return closedMedia() + zulmAtom({locationStream(), appNameStream()}); }

    std::map<uuid, std::string> streams() const {
        std::map<uuid, std::string> found;
        if (const auto parser = MetaDataParser::create(path))
            parser->loadAllData(found);
        return found;
    }

    /// Whether the movie is open-ended or closed, with the beginning of what was appended.
    bool holdsItsMedia() const {
        const std::string bytes = contentsOf(path);
        return bytes == openMedia() || bytes.starts_with(closedMedia());
    }

    /// Repairs the movie, and appends a stream: it must be found, and what is found beside it must be right.
    std::string complaintAboutGoingOn() const {
        if (!holdsItsMedia())
            return "damaged the media";
        Util::finalizeAtomsInFile(path);
        if (!MP4MetaData::appendMetaDataFiles(path, {scale}))
            return "left a movie that nothing can be appended to";
        auto found = streams();
        if (found.erase(kind(s_scaleFactors)) == 0)
            return "left a movie in which what is appended is not found";
        for (const auto& [type, bytes] : found)
            if (!(type == kind(s_appNames) ? appNameStream() : locationStream()).starts_with(bytes))
                return "left a stream that is not what was appended";
        return {};
    }

    const std::string path;
    const std::string locations;
    const std::string names;
    const std::string scale;
};

Operation onMovie(const std::string& name, const Movie& movie, std::function<bool()> run, const std::string& expected,
                  const std::string& before = openMedia()) {
    const auto result = std::make_shared<bool>();
    Operation operation{.name = name};
    operation.prepare = [=, &movie] {
        writeFile(movie.path, before);
        *result = false;
    };
    operation.run = [=] { *result = run(); };
    operation.complaint = [=, &movie](bool) -> std::string {
        if (*result && contentsOf(movie.path) != expected) {
            Util::finalizeAtomsInFile(movie.path); // its size could not be written, which nobody is told
            if (contentsOf(movie.path) != expected)
                return "said that all was written, which it was not";
        }
        return movie.complaintAboutGoingOn();
    };
    return operation;
}

/// Nobody is told where the repair in front of the append could not open the movie; its media stay what they are.
Operation appendingByTheWriterOfAtoms(const Movie& movie) {
    const std::vector<FileLocation> files{movie.locations, movie.names};
    Operation operation{.name = "append by the writer of atoms"};
    operation.prepare = [&movie] { writeFile(movie.path, openMedia()); };
    operation.run = [&movie, files] { ZULMAtomWriter().writeMetaDataFiles(files, movie.path); };
    operation.complaint = [&movie](bool) -> std::string {
        const bool isUnrepaired = contentsOf(movie.path).starts_with(openMedia());
        return isUnrepaired ? "" : movie.complaintAboutGoingOn();
    };
    return operation;
}

/// One that leaves the movie as it was where it fails.
Operation safely(const std::string& name, const Movie& movie, std::function<void()> run,
                 std::function<bool(const std::string&)> isExpected) {
    const auto hasFailed = std::make_shared<bool>();
    Operation operation{.name = name};
    operation.prepare = [=, &movie] { writeFile(movie.path, openMedia()); };
    operation.run = [=] {
        *hasFailed = false;
        try {
            run();
        } catch (const SaveError&) { // a file could not be opened
            *hasFailed = true;
        }
    };
    operation.complaint = [=, &movie](bool hasThrown) -> std::string {
        const std::string bytes = contentsOf(movie.path);
        if (hasThrown || *hasFailed)
            return bytes == openMedia() ? "" : "failed, and left a movie that is not what it was";
        return isExpected(bytes) ? "" : "left a wrong movie";
    };
    return operation;
}

bool isStamped(const std::string& bytes) {
    return bytes.size() == closedMedia().size() + 80 && bytes.starts_with(closedMedia() + be32(1) + "ZULR" + be64(80));
}

void addMovies(std::vector<Operation>& operations, const Movie& movie) {
    const std::string path = movie.path;
    const std::vector<std::string> files{movie.locations, movie.names};
    const std::map<uuid, std::string> streams{{kind(s_cursorLocations), locationStream()}};
    operations.push_back(onMovie(
        "append files", movie, [=] { return MP4MetaData::appendMetaDataFiles(path, files); }, Movie::whole(),
        closedMedia()));
    operations.push_back(onMovie(
        "append streams", movie,
        [=] {
            MP4MetaData::appendMetaData(path, streams);
            return false;
        },
        {}, closedMedia()));
    operations.push_back(onMovie(
        "repair", movie, [=] { return Util::finalizeAtomsInFile(path); }, closedMedia()));
    operations.push_back(appendingByTheWriterOfAtoms(movie));
    const std::vector<StreamSource> sources{StreamSource::file(movie.locations), StreamSource::file(movie.names)};
    operations.push_back(safely(
        "attach safely", movie, [=] { SafeMovieSave(path).attach(sources); },
        [](const std::string& bytes) { return bytes == Movie::whole(); }));
    operations.push_back(safely(
        "repair safely", movie, [=] { SafeMovieSave(path).repair(); },
        [](const std::string& bytes) { return bytes == closedMedia(); }));
    operations.push_back(safely(
        "stamp safely", movie, [=] { SafeMovieSave(path).stamp("Recorder", "1.2.3"); }, isStamped));
}

// ---- damaged files ----------------------------------------------------------------------------------------------

std::string findingsIn(const std::string& file) {
    std::string text;
    try {
        for (const Finding& finding : validateRecording(file).allFindings())
            text += finding.sentence + '\n';
    } catch (const std::system_error& error) {
        if (error.code() == std::errc::not_enough_memory)
            throw std::bad_alloc();
        throw;
    }
    return text;
}

std::string salvagedFrom(const std::string& bytes) {
    std::istringstream file(bytes);
    std::string text;
    for (const SalvagedStream& stream :
         StreamSalvage(ByteSource::stream(file), MetaDataParser::QuickTime).run().streams)
        text += std::to_string(stream.offset) + ' ' + std::to_string(stream.bytes) + '\n';
    return text;
}

void addDamaged(std::vector<Operation>& operations, const std::string& folder) {
    const std::string damaged = folder + "/Damaged.mp4";
    const std::string bytes =
        closedMedia() + zulmAtom({locationStream() + "torn", appNameStream() + "torn"}) + be32(500) + "mdat";
    writeFile(damaged, bytes);
    operations.push_back(reporting("verify", [=] { return findingsIn(damaged); }));
    operations.push_back(reporting("salvage", [=] { return salvagedFrom(bytes); }));
}

// ---- sessions ---------------------------------------------------------------------------------------------------

/// Runs `work`. If there is no memory for opening a file, the error says so.
template <class Work>
void orBadAlloc(Work work) {
    try {
        work();
    } catch (const Error& error) {
        if (error.sentence().find("Cannot allocate memory") != std::string::npos)
            throw std::bad_alloc();
        throw;
    }
}

std::string stateIn(const std::string& file) {
    std::string text;
    orBadAlloc([&] {
        const Recording recording{FileLocation(file)};
        const Snapshot state = recording.at(100);
        text = std::string(state.title.value_or("")) + std::string(state.application.value_or("")) +
               std::to_string(state.cursor ? state.cursor->x : 0) + std::to_string(state.keys.size()) +
               std::to_string(recording.hiddenStreams().size());
    });
    return text;
}

std::string insightsIn(const std::string& file) {
    std::string text;
    orBadAlloc([&] {
        const Insights insights = insightsOf(Recording(FileLocation(file)));
        text = std::to_string(insights.clicks.size()) + ' ' + std::to_string(insights.path.times().size());
        for (const KeyCaption& caption : insights.captions)
            text += caption.text;
        for (const Chapter& chapter : insights.chapters)
            text += chapter.title;
    });
    return text;
}

std::string retimedStreamsOf(const std::string& file, const std::string& edits) {
    std::string all;
    orBadAlloc([&] {
        const Recording recording{FileLocation(file)};
        for (const EditedStream& stream : retimed(recording, EditList::read(edits, "edits.json")).streams) {
            std::string bytes(static_cast<std::size_t>(stream.bytes.size()), '\0');
            stream.bytes.read(0, bytes);
            all += bytes;
        }
    });
    return all;
}

/// Returns whether all was recorded.
bool recordSession(const std::string& folder, const std::function<void(SessionWriter&)>& end) {
    bool isHealthy = false;
    orBadAlloc([&] {
        CursorAppearance arrow;
        arrow.id = 7;
        arrow.picture = std::make_shared<const CursorPicture>(CursorPicture{{1, 2, 3}, {4, 5}, CursorTypeUnknown});
        SessionWriter session{FileLocation(folder)};
        for (int i = 0; i < 3; ++i) {
            session.write<CursorLocationKind>(i, Point(i, -i));
            session.write<CursorImageKind>(i, arrow);
            session.write<TopmostAppNameKind>(i, "an application with a long name, for which memory is needed");
        }
        end(session);
        isHealthy = session.isHealthy();
    });
    return isHealthy;
}

std::map<std::string, std::string> filesIn(const std::string& folder) {
    std::map<std::string, std::string> files;
    std::error_code isMissing;
    for (const auto& entry : std::filesystem::directory_iterator(folder, isMissing))
        files[entry.path().filename().string()] = contentsOf(entry.path().string());
    files.erase("session.lock");
    return files;
}

Operation recordingASession(const std::string& folder) {
    const std::string place = folder + "/Session";
    const auto finish = [](SessionWriter& session) { session.finish(); };
    recordSession(place, finish);
    const auto whole = std::make_shared<std::map<std::string, std::string>>(filesIn(place));
    const auto isHealthy = std::make_shared<bool>();
    Operation operation{.name = "record a session"};
    operation.prepare = [=] {
        std::filesystem::remove_all(place);
        *isHealthy = false;
    };
    operation.run = [=] { *isHealthy = recordSession(place, finish); };
    operation.complaint = [=](bool) -> std::string {
        const auto files = filesIn(place);
        for (const auto& [name, contents] : files)
            if (!whole->at(name).starts_with(contents))
                return "left " + name + ", which is no beginning of what was recorded";
        return *isHealthy && files != *whole ? "lost entries and stayed healthy" : "";
    };
    return operation;
}

/// Lost entries leave a movie without them.
Operation savingASession(const Movie& movie, const std::string& folder) {
    const std::string place = folder + "/Session";
    const std::string path = movie.path;
    Operation operation = safely(
        "save a session", movie,
        [=] { recordSession(place, [&](SessionWriter& session) { session.saveInto(FileLocation(path)); }); },
        [](const std::string& bytes) { return bytes.starts_with(closedMedia()); });
    operation.prepare = [=, writeMovie = operation.prepare] {
        writeMovie();
        std::filesystem::remove_all(place);
    };
    return operation;
}

void addSessions(std::vector<Operation>& operations, const Movie& movie, const std::string& folder,
                 const std::string& recording) {
    const std::string edits = R"({"schema": "zulm.edits", "schema_version": 1, "pieces": [
        {"start": 1, "end": "7/3", "speed": "1000000007/3000000019"}, {"at": "1.5", "duration": 2},
        {"start": "0", "end": "1000000"}]})";
    operations.push_back(reporting("read an edit list", [=] { return EditList::read(edits, "edits.json").json(); }));
    operations.push_back(reporting("tell a state", [=] { return stateIn(recording); }));
    operations.push_back(reporting("find insights", [=] { return insightsIn(recording); }));
    operations.push_back(reporting("retime", [=] { return retimedStreamsOf(recording, edits); }));
    operations.push_back(recordingASession(folder));
    operations.push_back(savingASession(movie, folder));
}

// -----------------------------------------------------------------------------------------------------------------

template <class... S>
std::string movieOf(std::tuple<S...>*) {
    return closedMedia() + zulmAtom({goldenStream<S>()...});
}

template <class... S>
void addKinds(std::vector<Operation>& operations, const std::string& folder, const std::string& movie,
              std::tuple<S...>*) {
    (addKind<S>(operations, folder, movie), ...);
}

} // namespace

int main(int argc, char** argv) {
    if (argc != 2)
        return 2;
    silenceLibrary();
    const std::string folder = argv[1];
    const std::string recording = folder + "/Kinds.mp4";
    EveryKind* const everyKind = nullptr;
    writeFile(recording, movieOf(everyKind));
    const Movie movie(folder);
    std::vector<Operation> operations;
    addKinds(operations, folder, recording, everyKind);
    operations.push_back(recordingPixels(folder));
    addPictures(operations);
    addMovies(operations, movie);
    addDamaged(operations, folder);
    addSessions(operations, movie, folder, recording);
    bool isRight = true;
    for (Operation& operation : operations)
        isRight &= Exercise(std::move(operation)).run();
    return isRight ? 0 : 1;
}
