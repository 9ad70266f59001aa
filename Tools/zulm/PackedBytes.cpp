#include "Tools/zulm/PackedBytes.h"

#define ZLIB_CONST // it only reads what it compresses
#include <zlib.h>

#include <algorithm>
#include <array>
#include <new>
#include <utility>

namespace Zulm {

namespace {

constexpr std::size_t s_pieceSize = std::size_t{1} << 16;

using Piece = std::array<char, s_pieceSize>;

/// Compresses piece by piece: a length may be larger than zlib can count.
class Deflater {
public:
    Deflater() {
        if (deflateInit(&stream_, Z_DEFAULT_COMPRESSION) != Z_OK)
            throw std::bad_alloc();
    }
    ~Deflater() { deflateEnd(&stream_); }
    Deflater(const Deflater&) = delete;
    Deflater& operator=(const Deflater&) = delete;

    void take(std::string_view bytes, bool isLast) {
        stream_.next_in = const_cast<Bytef*>(reinterpret_cast<const Bytef*>(bytes.data())); // zlib only reads it
        stream_.avail_in = static_cast<uInt>(bytes.size());
        do {
            stream_.next_out = reinterpret_cast<Bytef*>(piece_.data());
            stream_.avail_out = static_cast<uInt>(piece_.size());
            deflate(&stream_, isLast ? Z_FINISH : Z_NO_FLUSH);
            result_.append(piece_.data(), piece_.size() - stream_.avail_out);
        } while (stream_.avail_out == 0);
    }

    std::string result() && { return std::move(result_); }

private:
    z_stream stream_{};
    Piece piece_{};
    std::string result_;
};

} // namespace

std::string packed(std::string_view bytes) {
    Deflater deflater;
    Piece differences{};
    std::size_t start = 0;
    do {
        const std::size_t size = std::min(bytes.size() - start, differences.size());
        for (std::size_t i = 0; i < size; ++i) {
            const std::size_t place = start + i;
            const int before = place < s_packedDistance ? 0 : bytes[place - s_packedDistance];
            differences[i] = static_cast<char>(bytes[place] - before);
        }
        start += size;
        deflater.take({differences.data(), size}, start == bytes.size());
    } while (start < bytes.size());
    return std::move(deflater).result();
}

} // namespace Zulm
