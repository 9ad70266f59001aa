#include "Bindings/JavaScript/EntryColumns.h"

#include "Reports/Number.h"
#include "Reports/Text.h"

#include <array>
#include <cmath>
#include <cstring>

namespace ZULMetaData::Bindings {

void EntryColumn::add(float value) {
    add(std::isfinite(value) ? Zulm::shortestNumber(value) : static_cast<double>(value));
}

void EntryColumn::add(const std::string& text) {
    addDistinct(Zulm::validText(text));
}

void EntryColumn::add(const CursorImage& cursor) {
    if (cursor.imageData && cursor.imageDataSize > 0)
        addDistinct({reinterpret_cast<const char*>(cursor.imageData), cursor.imageDataSize});
    else
        add(std::uint32_t{ZulmNothing});
}

void EntryColumn::add(const Text& text) {
    if (text)
        add(*text);
    else
        add(std::uint32_t{ZulmNothing});
}

void EntryColumn::add(const Blob& bytes) {
    if (!bytes) {
        add(std::uint32_t{ZulmNothing});
    } else if (bytes == lastBlob_) { // a cursor keeps its picture for a while
        add(lastPlace_);
    } else {
        addDistinct({reinterpret_cast<const char*>(bytes->data()), bytes->size()});
        lastBlob_ = bytes;
        std::memcpy(&lastPlace_, values_.data() + values_.size() - sizeof lastPlace_, sizeof lastPlace_);
    }
}

EntryColumn EntryColumn::of(const TableColumn& column) {
    constexpr std::array types{ZulmReal, ZulmInt32, ZulmUInt64, ZulmTexts, ZulmBytes}; // as in `TableColumn`
    EntryColumn entries(column.name, types.at(column.values.index()));
    std::visit(
        [&entries](const auto& values) {
            for (const auto& value : values)
                entries.add(value);
        },
        column.values);
    return entries;
}

void EntryColumn::addDistinct(std::string_view value) {
    const auto [found, isNew] = places_.try_emplace(std::string(value), static_cast<std::uint32_t>(ends_.size()));
    if (isNew) {
        pool_ += value;
        ends_.push_back(pool_.size());
    }
    add(found->second);
}

} // namespace ZULMetaData::Bindings
