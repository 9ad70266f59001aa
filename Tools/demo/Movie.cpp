#include "Tools/demo/Movie.h"

#include "Platform/Image.h"
#include "Tools/demo/Session.h"

#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <string>
#include <string_view>
#include <vector>

namespace ZULMetaData::Demo {

namespace {

constexpr std::uint32_t s_width = 320;
constexpr std::uint32_t s_height = 180;
constexpr std::uint32_t s_length = s_timescale * s_duration;
constexpr std::size_t s_atomHeaderSize = 8;

/// As movies store numbers.
std::string number(std::uint32_t value) {
    std::string bytes;
    for (int shift = 24; shift >= 0; shift -= 8)
        bytes += static_cast<char>(value >> shift & 0xff);
    return bytes;
}

std::string number16(std::uint32_t value) {
    return number(value).substr(2);
}

std::string zeros(std::size_t count) {
    return std::string(count, '\0');
}

std::string atom(std::string_view type, std::initializer_list<std::string> parts) {
    std::string payload;
    for (const std::string& part : parts)
        payload += part;
    return number(static_cast<std::uint32_t>(s_atomHeaderSize + payload.size())).append(type) + payload;
}

/// Evening sky over a dark ground.
std::string picture() {
    std::vector<std::uint8_t> pixels;
    for (std::uint32_t y = 0; y < s_height; ++y)
        for (std::uint32_t x = 0; x < s_width; ++x) {
            const bool isGround = y > 130 + x % 160 * x % 160 / 800;
            const auto fade = static_cast<std::uint8_t>(255 * y / s_height);
            for (const int channel :
                 {isGround ? 32 : fade, isGround ? 40 : fade / 2 + 60, isGround ? 48 : 200 - fade / 2, 255})
                pixels.push_back(static_cast<std::uint8_t>(channel));
        }
    const auto bitmap = BitmapImageRep::fromTIFF(Image(s_width, s_height, std::move(pixels)).tiffRepresentation());
    const std::vector<std::uint8_t> png = bitmap ? bitmap->pngRepresentation() : std::vector<std::uint8_t>();
    return {png.begin(), png.end()};
}

std::string identityMatrix() {
    const std::string zero = number(0);
    const std::string one = number(0x10000);
    return one + zero + zero + zero + one + zero + zero + zero + number(0x40000000);
}

std::string sampleTable(std::uint32_t sampleOffset, std::size_t sampleSize) {
    const std::string one = number(1);
    const std::string description = zeros(6) + number16(1) + zeros(16) + number16(s_width) + number16(s_height) +
                                    number(72 << 16) + number(72 << 16) + zeros(4) + number16(1) + zeros(32) +
                                    number16(32) + number16(0xffff);
    return atom("stbl",
                {atom("stsd", {zeros(4), one, atom("png ", {description})}),
                 atom("stts", {zeros(4), one, one, number(s_length)}), atom("stsc", {zeros(4), one, one, one, one}),
                 atom("stsz", {zeros(4), number(static_cast<std::uint32_t>(sampleSize)), one}),
                 atom("stco", {zeros(4), one, number(sampleOffset)})});
}

std::string movieAtom(std::uint32_t sampleOffset, std::size_t sampleSize) {
    const std::string header = atom("mvhd", {zeros(12), number(s_timescale), number(s_length), number(0x10000),
                                             number16(0x100), zeros(10), identityMatrix(), zeros(24), number(2)});
    const std::string trackHeader = atom("tkhd", {number(7), zeros(8), number(1), zeros(4), number(s_length), zeros(16),
                                                  identityMatrix(), number(s_width << 16), number(s_height << 16)});
    const std::string mediaHeader =
        atom("mdhd", {zeros(12), number(s_timescale), number(s_length), number16(0x55c4), zeros(2)});
    const std::string handler = atom("hdlr", {zeros(8), "vide", zeros(12), "still picture", zeros(1)});
    const std::string dataInfo = atom("dinf", {atom("dref", {zeros(4), number(1), atom("url ", {number(1)})})});
    const std::string mediaInfo =
        atom("minf", {atom("vmhd", {number(1), zeros(8)}), dataInfo, sampleTable(sampleOffset, sampleSize)});
    return atom("moov", {header, atom("trak", {trackHeader, atom("mdia", {mediaHeader, handler, mediaInfo})})});
}

} // namespace

std::string stillMovie() {
    const std::string type = atom("ftyp", {"qt  ", number(0x200), "qt  "});
    const std::string sample = picture();
    const auto sampleOffset = static_cast<std::uint32_t>(type.size() + s_atomHeaderSize);
    return type + atom("mdat", {sample}) + movieAtom(sampleOffset, sample.size());
}

} // namespace ZULMetaData::Demo
