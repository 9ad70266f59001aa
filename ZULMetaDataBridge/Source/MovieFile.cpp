#include "ZULMetaDataBridge/Source/MovieFile.h"

#include "ZULMetaData/Containers/AtomFormat.h"

namespace ZULMetaData {

MovieFile::MovieFile(const FileLocation& movie) : location_(movie), file_(movie), kept_(file_.size()), end_(kept_) {}

ByteSource MovieFile::bytes() const {
    return {file_.size(),
            [this](std::uint64_t position, std::span<char> bytes) { return file_.readAt(position, bytes); }};
}

void MovieFile::apply(const std::vector<RepairChange>& changes) {
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

void MovieFile::beginAtom(FourCC type) {
    atomStart_ = end_;
    append(detail::extendedAtomHeader(type, 0));
}

void MovieFile::append(std::span<const char> bytes) {
    file_.writeAt(end_, bytes);
    end_ += bytes.size();
}

void MovieFile::endAtom() {
    file_.sync();
    file_.writeAt(atomStart_ + detail::s_extendedSizeOffset, detail::bigEndianBytes(end_ - atomStart_));
    file_.sync();
}

void MovieFile::writeAppended(std::uint64_t offset, std::span<const char> bytes) {
    file_.writeAt(offset, bytes);
    file_.sync();
}

void MovieFile::undo() {
    file_.truncate(kept_);
    file_.sync(); // an open end put back too early would swallow what is still after it
    for (auto change = applied_.rbegin(); change != applied_.rend(); ++change) {
        file_.writeAt(change->offset, change->before); // what was cut off comes back after an end that is open again
        file_.sync();
    }
    applied_.clear();
    kept_ = end_ = file_.size();
}

} // namespace ZULMetaData
