#include "Bindings/JavaScript/EntryColumns.h"

#include "Reports/Number.h"
#include "Reports/Text.h"

#include <cmath>

namespace ZULMetaData::Bindings {

void DistinctValues::add(std::string_view value) {
    const auto [found, isNew] = numbers_.try_emplace(std::string(value), static_cast<std::uint32_t>(ends_.size()));
    if (isNew) {
        pool_ += value;
        ends_.push_back(pool_.size());
    }
    indices_.push_back(found->second);
}

void EntryColumn::add(float value) {
    reals_.push_back(std::isfinite(value) ? Zulm::shortestNumber(value) : static_cast<double>(value));
}

void EntryColumn::add(const std::string& text) {
    values_.add(Zulm::validText(text));
}

void EntryColumn::add(const CursorImage& cursor) {
    if (cursor.imageData && cursor.imageDataSize > 0)
        values_.add({reinterpret_cast<const char*>(cursor.imageData), cursor.imageDataSize});
    else
        values_.addNothing();
}

ZulmColumn EntryColumn::view() const {
    ZulmColumn column{name_, type_, nullptr, values_.pool().data(), values_.ends().data(), values_.ends().size()};
    switch (type_) {
    case ZulmInt32: column.values = numbers_.data(); break;
    case ZulmUInt32: column.values = unsignedNumbers_.data(); break;
    case ZulmUInt64: column.values = identifiers_.data(); break;
    case ZulmReal: column.values = reals_.data(); break;
    case ZulmTexts:
    case ZulmBytes: column.values = values_.indices().data(); break;
    }
    return column;
}

} // namespace ZULMetaData::Bindings
