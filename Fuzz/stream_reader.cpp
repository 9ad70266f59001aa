// A stream of one value type, with its header. The first byte chooses the version that is asked for.

#include "Fuzz/Target.h"
#include "ZULMetaData/StreamEntries.h"

#include <cstring>
#include <list>
#include <span>
#include <sstream>

using namespace ZULMetaData;

namespace {

using Value = ZULM_FUZZ_VALUE;

constexpr int s_mostEntries = 10'000;

struct Observer final : DataStreamObserver<Value> {
    bool dataRead(double, const Value&) override { return ++count < s_mostEntries; }
    int count = 0;
};

/// The walk that believes nothing must get through whatever the reader gets through.
void walkCarefully(std::string_view bytes) {
    StreamEntries entries(ByteSource::memory(bytes));
    std::uint64_t end = s_metaDataHeaderSize;
    while (const auto entry = entries.next()) {
        if (entry->offset != end || entry->end() > bytes.size())
            Fuzz::fail("an entry that is not there");
        end = entry->end();
        decodeEntry<Value>(entries.bytesOf(*entry), entries.header()->version);
    }
    if (Fuzz::hasRefusedMemory())
        Fuzz::fail("much memory for a careful walk");
}

} // namespace

void runTarget(std::string_view bytes) {
    const int version = static_cast<int>(Fuzz::takeByte(bytes) % 4) - 1;
    walkCarefully(bytes);
    Fuzz::documented([&] {
        std::istringstream stream{std::string(bytes)};
        Observer observer;
        MetaDataReader<Value>::parseStream(observer, stream, 0, bytes.size(), version);
    });
}
