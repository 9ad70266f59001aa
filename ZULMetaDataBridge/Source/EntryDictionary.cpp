#include "ZULMetaDataBridge/Source/EntryDictionary.h"

#include <algorithm>
#include <stdexcept>

namespace ZULMetaData {

const EntryValue& EntryDictionary::at(std::string_view key) const {
    const const_iterator found = find(key);
    if (found == end())
        throw std::out_of_range("no value for key " + std::string(key));
    return (*found).second;
}

EntryDictionary::const_iterator EntryDictionary::find(std::string_view key) const {
    const auto found = std::find(keys_->begin(), keys_->end(), key);
    return {*this, static_cast<std::size_t>(found - keys_->begin())};
}

bool EntryDictionary::contains(std::string_view key) const {
    return find(key) != end();
}

EntryDictionary::const_iterator EntryDictionary::begin() const {
    return {*this, 0};
}

EntryDictionary::const_iterator EntryDictionary::end() const {
    return {*this, size()};
}

} // namespace ZULMetaData
