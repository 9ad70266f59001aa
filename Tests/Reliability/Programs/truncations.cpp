// truncations FOLDER FILE...: cuts each file after every number of bytes and checks what the library makes of it.
// Prints "CASES LOST REPAIRED"; on standard error what does not hold.
//
// What decodes must be an exact prefix of what was recorded: every entry that is whole, and behind those at most the
// one that the cut went through, which readers deliver with what is there of it.

#include "Tests/Reliability/Programs/Exercise.h"
#include "Tests/Reliability/Programs/Watch.h"
#include "ZULMetaData/Containers/ContainerLayout.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <set>
#include <sstream>
#include <string>
#include <unistd.h>
#include <vector>

using namespace Reliability;
using namespace ZULMetaData;

namespace {

enum Verdict { Fine = 0, Damaged = 3, WithoutMetaData = 4 };

/// Also where `read` ends with an exception: its list then holds what came before it.
template <class Kind>
class Parser : public KindMetaDataParser<Kind> {
public:
    using KindMetaDataParser<Kind>::KindMetaDataParser;
    EntryList readAll() {
        try {
            return *this->read();
        } catch (const std::invalid_argument&) { // a text that was cut inside a character
        } catch (const std::out_of_range&) {     // system data that was cut
        }
        return *this->entries();
    }
};

bool isSame(const EntryValue& left, const EntryValue& right) {
    const auto* leftImage = std::get_if<std::shared_ptr<const Image>>(&left);
    const auto* rightImage = std::get_if<std::shared_ptr<const Image>>(&right);
    if (leftImage && rightImage && *leftImage && *rightImage) {
        const auto leftPixels = (*leftImage)->rgba();
        const auto rightPixels = (*rightImage)->rgba();
        return std::equal(leftPixels.begin(), leftPixels.end(), rightPixels.begin(), rightPixels.end());
    }
    return left == right;
}

bool isSame(const EntryDictionary& left, const EntryDictionary& right) {
    return std::equal(left.begin(), left.end(), right.begin(), right.end(),
                      [](const auto& a, const auto& b) { return a.first == b.first && isSame(a.second, b.second); });
}

/// One kind's stream in the whole file.
struct Recorded {
    uuid type{};
    std::vector<std::uint64_t> entryEnds; ///< in the file
    EntryList entries;

    std::size_t wholeIn(std::uint64_t size) const {
        return static_cast<std::size_t>(std::upper_bound(entryEnds.begin(), entryEnds.end(), size) - entryEnds.begin());
    }
};

class Cutter {
public:
    Cutter(std::string folder, const std::string& file)
        : name_(std::filesystem::path(file).filename().string()), original_(contentsOf(file)) {
        const std::string extension = std::filesystem::path(file).extension().string();
        path_ = folder + "/case" + extension;
        copy_ = folder + "/copy" + extension;
        type_ = MetaDataParser::streamTypeOf(path_);
        writeFile(path_, original_);
        learnStreams();
        learnEnds();
    }

    void cutEverywhere() {
        for (std::size_t size = original_.size() + 1; size-- > 0;) {
            beginCase(name_ + " cut after " + std::to_string(size) + " bytes");
            std::filesystem::resize_file(path_, size);
            cut_ = original_.substr(0, size);
            ++cases;
            try {
                check();
            } catch (const std::exception& error) {
                complain(error.what());
            }
        }
    }

    std::uint64_t cases = 0;
    std::uint64_t lost = 0;
    std::uint64_t repaired = 0; ///< movies, by the safe repair

private:
    void check() {
        checkReading(path_, 1, metaDataEnd_ != s_never);
        checkVerdict();
        checkSalvage();
        if (type_ == MetaDataParser::QuickTime)
            checkRepairs();
    }

    void learnStreams() {
        std::ifstream file(path_, std::ios::binary);
        // Also those that only a repair makes reachable.
        for (const SalvagedStream& stream : StreamSalvage(ByteSource::stream(file), type_).run().streams) {
            Recorded recorded{stream.header.uuid, {}, {}};
            StreamEntries entries(ByteSource::stream(file).part(stream.offset, stream.bytes));
            while (const auto entry = entries.next())
                recorded.entryEnds.push_back(stream.offset + entry->end());
            const std::string alone = copy_ + ".dat";
            writeFile(alone, original_.substr(stream.offset, stream.bytes));
            RecordedKinds::visit(recorded.type,
                                 [&]<class Kind>() { recorded.entries = Parser<Kind>(alone).readAll(); });
            recorded_.push_back(std::move(recorded));
        }
    }

    /// Where a cut cannot be told from a file that was never longer.
    void learnEnds() {
        ends_.insert(0);
        std::istringstream file(original_);
        const auto items = topLevelItems(ByteSource::stream(file), type_);
        for (const ContainerItem& item : items) {
            if (type_ == MetaDataParser::QuickTime && (item.sizeField == 0 || item.size == 0))
                break; // an open end
            ends_.insert(item.end());
            if (type_ == MetaDataParser::Riff)
                ends_.insert(item.end() + item.size % 2);
            if (item.holdsMetaData())
                metaDataEnd_ = item.end();
        }
        if (type_ == MetaDataParser::RawStream) {
            ends_ = {s_headerSize};
            ends_.insert(recorded_.at(0).entryEnds.begin(), recorded_.at(0).entryEnds.end());
            metaDataEnd_ = s_headerSize;
        }
    }

    Verdict expected() const {
        if (!ends_.contains(cut_.size()))
            return Damaged;
        return cut_.size() >= metaDataEnd_ ? Fine : WithoutMetaData;
    }

    void complain(const std::string& what) {
        tell(name_ + " cut after " + std::to_string(cut_.size()) + " bytes: " + what);
    }

    /// Where streams are out of reach, as before a repair, what is found must be right all the same.
    void checkReading(const std::string& path, std::size_t tornEntries, bool isReachable) {
        const auto parser = MetaDataParser::create(path);
        for (const Recorded& recorded : recorded_) {
            EntryList read;
            RecordedKinds::visit(recorded.type, [&]<class Kind>() { read = Parser<Kind>(path).readAll(); });
            const bool isFound = isReachable || parser->fileDataForUUID(recorded.type).length != 0;
            const std::size_t whole = isFound ? recorded.wholeIn(cut_.size()) : 0;
            if (read.size() < whole)
                ++lost;
            if (read.size() < whole || read.size() > whole + tornEntries)
                complain(std::to_string(read.size()) + " entries are read, " + std::to_string(whole) + " are whole");
            if (!std::equal(read.begin(), read.begin() + static_cast<std::ptrdiff_t>(std::min(whole, read.size())),
                            recorded.entries.begin(), [](const auto& a, const auto& b) { return isSame(a, b); }))
                complain("an entry is not what was recorded");
        }
    }

    void checkVerdict() {
        const ValidationReport report = validateRecording(path_);
        const Verdict verdict = report.isDamaged() ? Damaged : report.hasMetaData() ? Fine : WithoutMetaData;
        if (verdict != expected())
            complain("the verdict is " + std::to_string(verdict) + ", not " + std::to_string(expected()));
        for (const StreamReport& stream : report.streams)
            for (const Recorded& recorded : recorded_)
                if (recorded.type == stream.type && stream.wholeEntries != recorded.wholeIn(cut_.size()))
                    complain("the validator counts " + std::to_string(stream.wholeEntries) + " whole entries of " +
                             stream.name());
    }

    void checkSalvage() {
        std::istringstream file(cut_);
        const auto streams = StreamSalvage(ByteSource::stream(file), type_).run().streams;
        for (const Recorded& recorded : recorded_) {
            std::uint64_t salvaged = 0;
            for (const SalvagedStream& stream : streams)
                salvaged += stream.header.uuid == recorded.type ? stream.entries : 0;
            if (salvaged == recorded.wholeIn(cut_.size()))
                continue;
            ++lost;
            complain(std::to_string(salvaged) + " entries are salvaged, " +
                     std::to_string(recorded.wholeIn(cut_.size())) + " are whole");
        }
    }

    void checkRepairs() {
        writeFile(copy_, cut_);
        const bool isConsistent = Util::finalizeAtomsInFile(copy_);
        checkReading(copy_, 1, true);
        const std::string once = contentsOf(copy_);
        if (Util::finalizeAtomsInFile(copy_) != isConsistent || contentsOf(copy_) != once)
            complain("a second repair does something else");
        writeFile(copy_, cut_);
        if (SafeMovieSave(copy_).plan().state != RepairPlan::Repairable)
            return;
        ++repaired;
        checkSafeRepair();
    }

    void checkSafeRepair() {
        SafeMovieSave(copy_).repair();
        const std::string once = contentsOf(copy_);
        checkReading(copy_, 0, true);
        if (SafeMovieSave(copy_).repair().state != RepairPlan::Whole || contentsOf(copy_) != once)
            complain("a second safe repair does something");
        if (validateRecording(copy_).isDamaged())
            complain("the safe repair leaves damage");
    }

    static constexpr std::uint64_t s_headerSize = s_metaDataHeaderSize;
    static constexpr std::uint64_t s_never = ~std::uint64_t{0};

    std::string name_;
    std::string original_;
    std::string path_;
    std::string copy_;
    MetaDataParser::StreamType type_;
    std::string cut_;
    std::vector<Recorded> recorded_;
    std::set<std::uint64_t> ends_;
    std::uint64_t metaDataEnd_ = s_never;
};

} // namespace

int main(int argc, char** argv) {
    std::FILE* const results = fdopen(dup(STDOUT_FILENO), "w");
    silence();
    unsigned long long cases = 0;
    unsigned long long lost = 0;
    unsigned long long repaired = 0;
    for (int i = 2; i < argc; ++i) {
        Cutter cutter(argv[1], argv[i]);
        cutter.cutEverywhere();
        cases += cutter.cases;
        lost += cutter.lost;
        repaired += cutter.repaired;
    }
    std::fprintf(results, "%llu %llu %llu\n", cases, lost, repaired);
    std::fclose(results);
}
