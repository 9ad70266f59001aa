#include "Tools/zulm/Command.h"
#include "Tools/zulm/EntryFormat.h"
#include "Tools/zulm/Recording.h"

#include <fmt/core.h>

#include <filesystem>
#include <fstream>
#include <map>

namespace Zulm {

using namespace ZULMetaData;

namespace {

struct DumpOptions {
    std::string file;
    std::vector<std::string> kinds;
    EntryFormat format = EntryFormat::Text;
    std::string imageFolder;
};

/// Prints every entry of one stream as it is read.
template <class Kind>
class EntryPrinter final : public DataStreamObserver<typename Kind::Value> {
public:
    EntryPrinter(const DumpOptions& options, std::string kind) : options_(options), kind_(std::move(kind)) {}

    bool dataRead(double time, const typename Kind::Value& value) override {
        auto entry = entryDocument<Kind>(time, value);
        if (options_.format == EntryFormat::NDJSON)
            entry["stream"] = kind_;
        if (options_.format == EntryFormat::CSV && printed_ == 0)
            fmt::print("{}\n", csvHeader(entry));
        fmt::print("{}\n", formatted(entry, options_.format));
        if constexpr (std::same_as<typename Kind::Value, CursorImage>)
            writeImage(value);
        ++printed_;
        return true;
    }

    std::uint64_t printed() const { return printed_; }

private:
    void writeImage(const CursorImage& cursor) const {
        if (options_.imageFolder.empty() || !cursor.imageData)
            return;
        const auto file = std::filesystem::path(options_.imageFolder) /
                          fmt::format("cursor-{}-entry-{}.png", cursor.uniqueId, printed_);
        std::ofstream stream(file, std::ios::binary);
        stream.write(reinterpret_cast<const char*>(cursor.imageData), cursor.imageDataSize);
        stream.close();
        if (!stream)
            throw Failure(fmt::format("{}: cannot be written", file.string()));
    }

    const DumpOptions& options_;
    std::string kind_;
    std::uint64_t printed_ = 0;
};

template <class Kind>
ExitCode dumpStream(Recording& recording, const DumpOptions& options) {
    const std::string kind(findMetaDataKind(Kind::type)->name);
    EntryPrinter<Kind> printer(options, kind);
    try {
        recording.parser().loadDataType(Kind::type, printer, -1);
        return ExitFine;
    } catch (const Failure&) {
        throw;
    } catch (const std::exception&) { // an entry cut short, or system data that lacks texts
        complain(fmt::format("{}: {} is damaged behind entry {}", recording.path(), kind, printer.printed()));
        return ExitDamaged;
    }
}

const MetaDataKind& kindNamed(const std::string& name) {
    for (const MetaDataKind& kind : s_metaDataKinds)
        if (kind.name == name)
            return kind;
    throw Failure(fmt::format("no kind of stream is called {}", name));
}

std::vector<uuid> chosenTypes(const Recording& recording, const std::vector<uuid>& available,
                              const DumpOptions& options) {
    if (options.kinds.empty())
        return available;
    std::vector<uuid> types;
    for (const std::string& name : options.kinds) {
        const MetaDataKind& kind = kindNamed(name);
        if (std::ranges::find(available, kind.type) == available.end())
            throw Failure(fmt::format("{}: has no stream {}", recording.path(), name));
        types.push_back(kind.type);
    }
    return types;
}

ExitCode runDump(const DumpOptions& options) {
    Recording recording(options.file);
    const std::vector<uuid> available = recording.parser().getAvailableMetaDataUUIDs();
    if (available.empty()) {
        complain(fmt::format("{}: has no recording metadata", options.file));
        return ExitNoMetaData;
    }
    if (!options.imageFolder.empty())
        std::filesystem::create_directories(options.imageFolder);
    const std::vector<uuid> types = chosenTypes(recording, available, options);
    ExitCode worst = ExitFine;
    for (const uuid& type : types) {
        if (options.format == EntryFormat::Text && types.size() > 1)
            fmt::print("{}\n", nameOf(type));
        const bool isKnown = RecordedKinds::visit(
            type, [&]<class Kind>() { worst = worseOf(worst, dumpStream<Kind>(recording, options)); });
        if (!isKnown)
            complain(fmt::format("{}: entries of {} cannot be decoded", options.file, nameOf(type)));
    }
    return worst;
}

} // namespace

void addDumpCommand(CLI::App& app, Action& chosen) {
    static const std::map<std::string, EntryFormat> formats{
        {"text", EntryFormat::Text}, {"ndjson", EntryFormat::NDJSON}, {"csv", EntryFormat::CSV}};
    auto options = std::make_shared<DumpOptions>();
    CLI::App* command = app.add_subcommand("dump", "Print the entries of a file's streams");
    command->add_option("FILE", options->file, "A movie, RIFF file or stream file")->required();
    command->add_option("--stream", options->kinds, "Only this kind, such as cursorLocation (repeatable)")
        ->type_name("KIND");
    command->add_option("--format", options->format, "text, ndjson or csv")
        ->type_name("FORMAT")
        ->transform(CLI::CheckedTransformer(formats, CLI::ignore_case).description(""));
    command
        ->add_option("--images", options->imageFolder, "Write cursor images as they are stored (PNG) into this folder")
        ->type_name("DIR");
    command->callback([options, &chosen] { chosen = [options] { return runDump(*options); }; });
}

} // namespace Zulm
