#include "ZULMetaDataBridge/Source/MovieTransaction.h"

#include "ZULMetaData/Containers/AtomFormat.h"

namespace ZULMetaData {

MovieTransaction::MovieTransaction(const FileLocation& movie) : file_(movie), kept_(file_.size()), end_(kept_) {}

void MovieTransaction::apply(const std::vector<RepairChange>& changes) {
    for (const RepairChange& change : changes) {
        applied_.push_back(change);
        if (change.after.empty()) {
            file_.truncate(change.offset);
            kept_ = end_ = change.offset;
        } else {
            file_.writeAt(change.offset, change.after);
        }
        file_.sync();
    }
}

void MovieTransaction::beginAtom(std::uint32_t type) {
    atomStart_ = end_;
    append(detail::extendedAtomHeader(type, 0));
}

void MovieTransaction::append(std::span<const char> bytes) {
    file_.writeAt(end_, bytes);
    end_ += bytes.size();
}

std::uint64_t MovieTransaction::endAtom() {
    const std::uint64_t size = end_ - atomStart_;
    file_.sync();
    file_.writeAt(atomStart_ + detail::s_extendedSizeOffset, detail::bigEndianBytes(size));
    file_.sync();
    return size;
}

void MovieTransaction::writeAppended(std::uint64_t offset, std::span<const char> bytes) {
    file_.writeAt(offset, bytes);
    file_.sync();
}

void MovieTransaction::undo() {
    file_.truncate(kept_);
    file_.sync(); // an open end put back too early would swallow what is still behind it
    for (auto change = applied_.rbegin(); change != applied_.rend(); ++change) {
        file_.writeAt(change->offset, change->before); // what was cut off comes back behind an end that is open again
        file_.sync();
    }
    applied_.clear();
    kept_ = end_ = file_.size();
}

} // namespace ZULMetaData
