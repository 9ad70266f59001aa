#include "Bindings/JavaScript/BlockCache.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <cstring>
#include <memory>
#include <span>
#include <utility>
#include <vector>

namespace ZULMetaData::Bindings {

namespace {

class BlockCache {
public:
    explicit BlockCache(ByteSource bytes) : bytes_(std::move(bytes)) {}

    std::size_t read(std::uint64_t position, std::span<char> to) {
        if (to.size() > s_blockSize)
            return readFully(position, to);
        std::size_t done = 0;
        while (done < to.size()) {
            const std::vector<char>& block = blockAt((position + done) / s_blockSize);
            const auto inside = static_cast<std::size_t>((position + done) % s_blockSize);
            if (inside >= block.size())
                break;
            const std::size_t size = std::min(to.size() - done, block.size() - inside);
            std::memcpy(to.data() + done, block.data() + inside, size);
            done += size;
        }
        return done;
    }

private:
    struct Block {
        std::vector<char> bytes;
        std::uint64_t number = 0;
        std::uint64_t lastUse = 0; // 0 if it holds nothing
    };

    std::size_t readFully(std::uint64_t position, std::span<char> to) {
        std::size_t done = 0;
        while (const std::size_t got = bytes_.read(position + done, to.subspan(done)))
            done += got;
        return done;
    }

    const std::vector<char>& blockAt(std::uint64_t number) {
        auto block = std::find_if(blocks_.begin(), blocks_.end(),
                                  [number](const Block& each) { return each.lastUse > 0 && each.number == number; });
        if (block == blocks_.end()) {
            block = std::min_element(blocks_.begin(), blocks_.end(), [](const Block& left, const Block& right) {
                return left.lastUse < right.lastUse;
            });
            block->lastUse = 0; // as long as it is not filled
            block->bytes.resize(s_blockSize);
            block->bytes.resize(readFully(number * s_blockSize, block->bytes));
            block->number = number;
        }
        block->lastUse = ++uses_;
        return block->bytes;
    }

    ByteSource bytes_;
    std::uint64_t uses_ = 0;
    std::array<Block, 16> blocks_;
};

} // namespace

ByteSource cachedInBlocks(const ByteSource& bytes) {
    return {bytes.size(), [cache = std::make_shared<BlockCache>(bytes)](std::uint64_t position, std::span<char> to) {
                return cache->read(position, to);
            }};
}

} // namespace ZULMetaData::Bindings
