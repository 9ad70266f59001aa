// Calls one entry point of the library with a path, and prints what became of it.
//
//     library ENTRY PATH [STREAM|MOVIE]
//
// What the library itself prints goes to the standard error or comes in front.

#include "Tests/Reliability/Programs/Observations.h"

#include "ZULMetaDataBridge/Source/SafeMovieSave.h"
#include "ZULMetaDataBridge/Source/Validation/MetaDataValidator.h"

#include <functional>
#include <iostream>
#include <map>
#include <memory>
#include <stdexcept>
#include <string>

using namespace ZULMetaData;
using namespace ZULMetaData::Reliability;

namespace {

std::string truthOf(bool result) {
    return result ? "true" : "false";
}

/// How many of the writers of all kinds could write an entry.
std::string write(const std::string& path) {
    int healthy = 0;
    forEachRecorded([&]<class R>() {
        typename R::Writer writer(path);
        record<R>(writer, 0);
        if constexpr (requires { writer.finish(); })
            writer.finish();
        healthy += writer.isHealthy() && writer.entriesWritten() == 1;
    });
    return std::to_string(healthy) + " writers wrote";
}

std::string read(const std::string& path) {
    std::uint32_t entries = 0;
    forEachRecorded([&]<class R>() { entries += rightEntries<R>(path); });
    entries += static_cast<std::uint32_t>(CursorLocationMetaDataParser(path).read()->size());
    return std::to_string(entries) + " entries";
}

std::string parse(const std::string& path) {
    const auto parser = MetaDataParser::create(path);
    return parser ? std::to_string(parser->getAvailableMetaDataUUIDs().size()) + " streams" : "null";
}

std::string appendMemory(const std::string& path) {
    MP4MetaData::appendMetaData(path, {});
    return "done";
}

std::string validate(const std::string& path) {
    return validateRecording(path).isDamaged() ? "damaged" : "sound";
}

std::string plan(const std::string& path) {
    return SafeMovieSave(path).plan().state == RepairPlan::Whole ? "whole" : "not whole";
}

std::string stamp(const std::string& path) {
    ZULRAtomWriter().writeZULRtoFile(path, "Recorder", "1.0");
    return "done";
}

std::string attachTo(const std::string& movie, const std::string& stream) {
    return std::to_string(SafeMovieSave(movie).attach({StreamSource::file(stream)}).streams.size()) + " attached";
}

using Entry = std::function<std::string(const std::string& path, const std::string& other)>;

const std::map<std::string, Entry> s_entries{
    {"write", [](auto& path, auto&) { return write(path); }},
    {"read", [](auto& path, auto&) { return read(path); }},
    {"parse", [](auto& path, auto&) { return parse(path); }},
    {"append", [](auto& path, auto& stream) { return truthOf(MP4MetaData::appendMetaDataFiles(path, {stream})); }},
    {"append-from", [](auto& path, auto& movie) { return truthOf(MP4MetaData::appendMetaDataFiles(movie, {path})); }},
    {"append-memory", [](auto& path, auto&) { return appendMemory(path); }},
    {"finalize", [](auto& path, auto&) { return truthOf(Util::finalizeAtomsInFile(path)); }},
    {"scale", [](auto& path, auto&) { return std::to_string(Util::recordingScaleForMP4AtPath(path)); }},
    {"stamp", [](auto& path, auto&) { return stamp(path); }},
    {"validate", [](auto& path, auto&) { return validate(path); }},
    {"plan", [](auto& path, auto&) { return plan(path); }},
    {"attach", [](auto& path, auto& stream) { return attachTo(path, stream); }},
    {"attach-from", [](auto& path, auto& movie) { return attachTo(movie, path); }},
};

} // namespace

int main(int argc, char** argv) {
    const auto entry = s_entries.find(argc > 2 ? argv[1] : "");
    if (entry == s_entries.end())
        return 2;
    try {
        std::cout << entry->second(argv[2], argc > 3 ? argv[3] : "") << '\n';
    } catch (const std::exception& error) {
        std::cout << "throws: " << error.what() << '\n';
    }
    return 0;
}
