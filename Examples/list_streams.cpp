// Lists the streams of a recording, and the first entry of each: list_streams RECORDING

#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <iostream>
#include <variant>

using namespace ZULMetaData;

namespace {

void print(const EntryValue& value) {
    if (const auto* image = std::get_if<std::shared_ptr<const Image>>(&value))
        std::cout << (*image)->width() << " x " << (*image)->height();
    else if (const auto* text = std::get_if<std::string>(&value))
        std::cout << *text;
    else if (const auto* real = std::get_if<float>(&value))
        std::cout << *real;
    else if (const auto* id = std::get_if<std::int64_t>(&value))
        std::cout << *id;
    else
        std::cout << std::get<std::int32_t>(value);
}

template <class Kind>
void list(const FileLocation& recording) {
    KindMetaDataParser<Kind> parser(recording);
    const auto entries = parser.read();
    std::cout << findMetaDataKind(Kind::type)->name << ": " << entries->size() << " entries\n";
    if (entries->empty())
        return;
    for (const auto& [key, value] : entries->front()) {
        std::cout << "    " << key << " = ";
        print(value);
        std::cout << '\n';
    }
}

} // namespace

int main(int count, char** arguments) {
    if (count != 2) {
        std::cerr << "usage: list_streams RECORDING\n";
        return 2;
    }
    const auto parser = MetaDataParser::create(arguments[1]);
    if (!parser) {
        std::cerr << arguments[1] << ": cannot be opened\n";
        return 1;
    }
    for (const uuid& type : parser->getAvailableMetaDataUUIDs())
        if (!RecordedKinds::visit(type, [&]<class Kind> { list<Kind>(arguments[1]); }))
            std::cout << type << ": of no kind that has entries to list\n";
    for (const ZCAPHeader& info : readRecordingInfo(*parser))
        std::cout << "made on " << info.creator.name() << ", version " << info.creator.version() << '\n';
}
