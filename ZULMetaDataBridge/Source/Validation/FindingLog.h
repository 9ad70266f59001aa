#pragma once

// Findings as they are made, of which only so many are kept.

#include "ZULMetaDataBridge/Source/Validation/MetaDataValidator.h"

#include <sstream>

namespace ZULMetaData::detail {

/// Words and numbers one after the other.
template <class... Parts>
std::string sentence(const Parts&... parts) {
    std::ostringstream text;
    text.exceptions(std::ios_base::badbit); // half a sentence is worse than std::bad_alloc
    text.precision(15);
    (text << ... << parts);
    return text.str();
}

/// Counts for the whole report; the findings go to the list of the stream or the container that they are about.
class FindingLog {
public:
    /// Both must outlive the log.
    FindingLog(ValidationReport& report, const std::set<FindingCode>& ignored) : report_(report), ignored_(ignored) {}

    template <class... Parts>
    void add(std::vector<Finding>& list, FindingCode code, const std::string& place, std::uint64_t offset,
             const Parts&... parts) {
        if (ignored_.contains(code))
            return;
        std::uint64_t& count = ruleOf(code).severity == Severity::Damage ? report_.damageCount : report_.noticeCount;
        if (count++ < ValidationReport::s_maximumFindings)
            list.push_back({code, place, offset, sentence(parts...)});
    }

private:
    ValidationReport& report_;
    const std::set<FindingCode>& ignored_;
};

} // namespace ZULMetaData::detail
