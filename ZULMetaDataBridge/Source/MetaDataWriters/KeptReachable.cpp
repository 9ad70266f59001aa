#include "ZULMetaDataBridge/Source/MetaDataWriters/KeptReachable.h"

#include <atomic>

namespace ZULMetaData {

namespace {

struct Kept {
    const void* object;
    Kept* next;
};

std::atomic<Kept*> s_kept = nullptr;

} // namespace

void keepReachable(const void* object) {
    auto* kept = new Kept{object, s_kept.load()};
    while (!s_kept.compare_exchange_weak(kept->next, kept)) {
    }
}

} // namespace ZULMetaData
