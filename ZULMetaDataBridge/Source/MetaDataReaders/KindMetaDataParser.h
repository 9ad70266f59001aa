#pragma once

// How parsers read. The parser of each kind adds the name of its list.

#include "../../../SharedDependencies/Export.h"
#include "../../../ZULMetaData/InvalidEntry.h"
#include "../../../ZULMetaData/ZULMMetaDataParser.h"
#include "../EntryBuilding.h"
#include "../MetaDataKinds.h"
#include "BaseMetaDataParser.h"
#include "MetaDataObserver.h"

#include <cstddef>
#include <memory>
#include <utility>

namespace ZULMetaData {

/// Reads the entries of one kind into a list.
template <class Kind>
class ZULMETADATA_API KindMetaDataParser : public BaseMetaDataParser {
public:
    KindMetaDataParser() = default; ///< creates a parser without a file; call `initWithMetaDataFile`

    /// Stores the location. Does not open the file.
    explicit KindMetaDataParser(const FileLocation& file) { this->initWithMetaDataFile(file); }

    /// Reads the file as it is now and returns a new list of its entries. The parser keeps this list too; earlier lists
    /// do not change. The list is empty if the file has no such stream. It ends before the first damaged entry.
    ///
    /// Throws `std::invalid_argument` for a text that is not UTF-8, and `std::out_of_range` for system data with fewer
    /// than four texts. The list that the parser keeps then has the entries before the faulty one.
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
    /// Returns the list that is kept, or null before the first `read`.
    const std::shared_ptr<EntryList>& entries() const { return entries_; }
    /// Replaces the list until the next `read`.
    void setEntries(std::shared_ptr<EntryList> entries) { entries_ = std::move(entries); }

private:
    void load(MetaDataObserver<typename Kind::Value>& observer) const {
        const auto bytes = getMetaDataStream(Kind::type);
        const auto stream = MetaDataParser::create(*bytes, Container::RawStream);
        if (!stream)
            return;
        try {
            stream->loadDataType(Kind::type, observer, Kind::version);
        } catch (const InvalidEntry&) {
            // An entry is cut short. The entries before it have been collected.
        }
    }

    std::shared_ptr<EntryList> entries_;
};

} // namespace ZULMetaData
