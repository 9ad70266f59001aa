#pragma once

// The mechanism of the parser family. A class of the family adds the name of its list.

#include "../../../SharedDependencies/Export.h"
#include "../../../ZULMetaData/ZULMMetaDataParser.h"
#include "../EntryBuilding.h"
#include "../MetaDataKinds.h"
#include "BaseMetaDataParser.h"
#include "MetaDataObserver.h"

#include <cstddef>
#include <memory>
#include <stdexcept>
#include <utility>

namespace ZULMetaData {

/// Reads the entries of one kind.
template <class Kind>
class ZULMETADATA_API KindMetaDataParser : public BaseMetaDataParser {
public:
    KindMetaDataParser() = default; ///< has no file before `initWithMetaDataFile` gives it one
    explicit KindMetaDataParser(const FileLocation& file) { this->initWithMetaDataFile(file); } ///< opens nothing

    /// Reads the file as it is now into a new list, which the parser keeps too; earlier lists stay as they are.
    /// Empty where the file has no such stream. A damaged entry ends the list.
    ///
    /// Throws `std::invalid_argument` for a text that is not UTF-8 and `std::out_of_range` for system data with
    /// fewer than four texts; the kept list then holds the entries in front of it.
    std::shared_ptr<EntryList> read() {
        entries_ = std::make_shared<EntryList>();
        MetaDataObserver<typename Kind::Value> observer;
        load(observer);
        entries_->reserve(observer.values.size());
        for (std::size_t i = 0; i < observer.values.size(); ++i)
            entries_->push_back(makeEntry<Kind>(observer.times.at(i), observer.values.at(i)));
        return entries_;
    }

protected:
    /// Null before the first `read`.
    const std::shared_ptr<EntryList>& entries() const { return entries_; }
    void setEntries(std::shared_ptr<EntryList> entries) { entries_ = std::move(entries); } ///< until the next `read`

private:
    void load(MetaDataObserver<typename Kind::Value>& observer) const {
        const auto bytes = getMetaDataStream(Kind::type);
        const auto stream = MetaDataParser::create(*bytes, MetaDataParser::RawStream);
        if (!stream)
            return;
        try {
            stream->loadDataType(Kind::type, observer, Kind::version);
        } catch (const std::runtime_error&) {
            // An entry is cut short. Those in front of it have been collected.
        }
    }

    std::shared_ptr<EntryList> entries_;
};

} // namespace ZULMetaData
