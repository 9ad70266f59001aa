// A movie that is repaired: both repairs change nothing the second time, and the safe one keeps what its plan says.

#include "Fuzz/Target.h"
#include "ZULMetaData/ZULMMetaDataParser.h"
#include "ZULMetaDataBridge/Source/SafeMovieSave.h"

#include <cstring>

using namespace ZULMetaData;

namespace {

RepairPlan planFor(const std::string& movie) {
    return planRepair(ByteSource::memory(movie));
}

std::string carriedOut(std::string movie, const RepairPlan& plan) {
    for (const RepairChange& change : plan.changes) {
        if (movie.substr(change.offset, change.before.size()) != change.before)
            Fuzz::fail("a plan for other bytes");
        movie.replace(change.offset, change.before.size(), change.after);
    }
    return movie;
}

void repairSafely(const std::string& movie) {
    const RepairPlan plan = planFor(movie);
    const std::string once = carriedOut(movie, plan);
    if (plan.state == RepairPlan::Repairable && planFor(once).state != RepairPlan::Whole)
        Fuzz::fail("the safe repair leaves something to repair");
    if (plan.state != RepairPlan::Repairable && once != movie)
        Fuzz::fail("changes without need");
}

template <class Number>
Number numberAt(std::string_view movie, std::uint64_t position) {
    Number stored{};
    std::memcpy(&stored, movie.data() + position, sizeof stored);
    return swapInt(stored);
}

/// Whether every atom reaches beyond its own header. Where one does not, the size of the next is part of it, and to
/// write that changes where it ends.
bool isTidy(std::string_view movie) {
    for (std::uint64_t position = 0; movie.size() >= 16 && position <= movie.size() - 16;) {
        const std::uint64_t shortSize = numberAt<std::uint32_t>(movie, position);
        const std::uint64_t size = shortSize == 1 ? numberAt<std::uint64_t>(movie, position + 8) : shortSize;
        if (size == 0 || size > movie.size() - position)
            return true;
        if (size < (shortSize == 1 ? 16U : 8U))
            return false;
        position += size;
    }
    return true;
}

void repairInPlace(std::string_view movie) {
    const std::string path = Fuzz::fileOf("movie.mp4", movie);
    const bool isConsistent = Util::finalizeAtomsInFile(path);
    const std::string once = Fuzz::contentsOf(path);
    if (once.size() != movie.size() || (!isConsistent && once != movie))
        Fuzz::fail("more than a size was written");
    if (!isTidy(movie))
        return;
    if (Util::finalizeAtomsInFile(path) != isConsistent || Fuzz::contentsOf(path) != once)
        Fuzz::fail("a second repair does something else");
}

} // namespace

void runTarget(std::string_view bytes) {
    repairSafely(std::string(bytes));
    repairInPlace(bytes);
    if (Fuzz::hasRefusedMemory())
        Fuzz::fail("much memory");
}
