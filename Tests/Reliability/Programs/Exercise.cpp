#include "Tests/Reliability/Programs/Exercise.h"

#include "Tests/Reliability/Programs/Watch.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <concepts>
#include <ctime>
#include <fstream>
#include <list>
#include <map>
#include <new>
#include <sstream>
#include <string_view>

namespace Reliability {

using namespace ZULMetaData;

namespace {

constexpr std::size_t s_spareMemory = 16 << 20;

/// Of the processor, for each thing that is done with a file: others may keep it busy.
constexpr double s_secondsAtMost = 1;

/// Kinds whose entries say how much memory they need.
template <class Value>
constexpr bool isBelieved =
    std::same_as<Value, std::string> || std::same_as<Value, std::list<std::string>> || std::same_as<Value, CursorImage>;

std::string_view identifierOf(const uuid& type) {
    return {reinterpret_cast<const char*>(type.data), sizeof type.data};
}

template <class Value>
struct Counter final : DataStreamObserver<Value> {
    bool dataRead(double, const Value&) override { return ++count < 100'000; }
    std::uint64_t count = 0;
};

} // namespace

Exercise::Exercise(const std::string& folder, const std::string& extension, FileParsers parsers)
    : path_(folder + "/case" + extension), copy_(folder + "/copy" + extension),
      type_(MetaDataParser::streamTypeOf(path_)), parsers_(parsers) {}

void Exercise::run(const std::string& bytes) {
    ++cases_;
    bytes_ = bytes;
    hasDemanded_ = false;
    writeFile(path_, bytes_);
    validate();
    salvage();
    readAsFile();
    readAsStream();
    if (type_ == MetaDataParser::QuickTime)
        change();
    demanding_ += hasDemanded_ ? 1 : 0;
}

/// The exceptions that the library documents for any file, and no other; and the memory that it may ask for.
template <class Act>
void Exercise::guard(const char* what, Act act) {
    limitMemory(2 * bytes_.size() + s_spareMemory);
    const std::clock_t start = std::clock();
    try {
        act();
    } catch (const Broken&) {
        liftMemoryLimit();
        throw;
    } catch (const std::invalid_argument&) { // a text that is not UTF-8
    } catch (const std::out_of_range&) {     // system data of fewer than four texts
    } catch (const std::runtime_error&) {    // an entry that is cut short, or of size 0; a file that cannot be saved
    } catch (const std::bad_alloc&) {
    }
    liftMemoryLimit();
    if (static_cast<double>(std::clock() - start) > s_secondsAtMost * CLOCKS_PER_SEC)
        throw std::runtime_error(std::string(what) + " takes more than a second");
    if (hasRefusedMemory())
        throw Broken(std::string(what) + " asks for more memory than twice the file and 16 MiB");
}

/// The same for what believes the sizes of texts and images.
template <class Act>
void Exercise::guardReading(const char* what, Act act) {
    try {
        guard(what, act);
    } catch (const Broken&) {
        if (!isDamaged_)
            throw;
        hasDemanded_ = true;
    }
}

void Exercise::validate() {
    guard("the validator", [&] { isDamaged_ = validateRecording(path_).isDamaged(); });
}

void Exercise::salvage() {
    guard("salvage", [&] {
        std::ifstream file(path_, std::ios::binary);
        for (const SalvagedStream& stream : StreamSalvage(ByteSource::stream(file), type_).run().streams)
            if (stream.end() > bytes_.size())
                throw Broken("salvage gives bytes that are not there");
    });
}

void Exercise::readAsFile() {
    std::uint64_t index = 0;
    RecordedKinds::forEach([&]<class Kind>() {
        const bool isItsTurn = parsers_ == EachTime || index++ == cases_ % RecordedKinds::size;
        const bool isItsStream = type_ == MetaDataParser::RawStream && bytes_.starts_with(identifierOf(Kind::type));
        if (!isItsTurn && !isItsStream)
            return;
        const auto read = [&] { KindMetaDataParser<Kind>(path_).read(); };
        if constexpr (isBelieved<typename Kind::Value>)
            guardReading("a parser", read);
        else
            guard("a parser", read);
    });
}

void Exercise::readAsStream() {
    std::istringstream stream(bytes_);
    const auto parser = MetaDataParser::create(stream, type_);
    RecordedKinds::forEach([&]<class Kind>() {
        Counter<typename Kind::Value> counter;
        const auto read = [&] { parser->loadDataType(Kind::type, counter, -1); };
        if constexpr (isBelieved<typename Kind::Value>)
            guardReading("a reader", read);
        else
            guard("a reader", read);
    });
    std::map<uuid, std::string> streams;
    guard("copying streams out", [&] { parser->loadAllData(streams); });
    writeFile(copy_, bytes_);
    guard("an append", [&] { MP4MetaData::appendMetaData(copy_, streams); });
}

void Exercise::change() {
    guard("the scale factor", [&] { Util::recordingScaleForMP4AtPath(path_); });
    guard("an append of itself", [&] { MP4MetaData::appendMetaDataFiles(copy_, {path_}); });
    writeFile(copy_, bytes_);
    guard("the repair", [&] { Util::finalizeAtomsInFile(copy_); });
    writeFile(copy_, bytes_);
    RepairPlan::State state = RepairPlan::Whole;
    guard("the safe repair's plan", [&] { state = SafeMovieSave(copy_).plan().state; });
    if (state != RepairPlan::Repairable)
        return;
    guard("the safe repair", [&] { SafeMovieSave(copy_).repair(); });
    if (SafeMovieSave(copy_).plan().state != RepairPlan::Whole)
        throw Broken("the safe repair leaves something to repair");
}

void writeFile(const std::string& file, const std::string& bytes) {
    std::ofstream(file, std::ios::binary).write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
}

std::string contentsOf(const std::string& file) {
    std::ostringstream bytes;
    bytes << std::ifstream(file, std::ios::binary).rdbuf();
    return bytes.str();
}

} // namespace Reliability
