#include "Tools/zulm/SoundCut.h"

#include "Tools/zulm/Failure.h"

#include <fmt/core.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdint>
#include <fstream>

namespace Zulm {

using namespace ZULMetaData;

namespace {

/// The rate of the samples: that of the source if encoders take it.
int rateOf(const SoundStream& sound) {
    constexpr std::array rates{8000, 11025, 12000, 16000, 22050, 24000, 32000, 44100, 48000};
    constexpr int usual = 48000;
    return std::find(rates.begin(), rates.end(), sound.sampleRate) == rates.end() ? usual : sound.sampleRate;
}

std::uint64_t bytesOfASample(const SoundStream& sound) {
    return static_cast<std::uint64_t>(sound.channels) * sizeof(std::int16_t);
}

/// One filter changes the tempo by a limited factor.
std::string tempoFilter(double speed) {
    constexpr double most = 100;
    constexpr double least = 0.5;
    std::string filter;
    while (speed != 1) {
        const double factor = std::clamp(speed, least, most);
        filter += fmt::format(",atempo={:.17g}", factor);
        speed /= factor;
    }
    return filter;
}

/// Decodes a piece. Decoding begins a little before what is heard.
void decode(const FFmpeg& ffmpeg, const CutSource& source, const SoundStream& sound, const EditPiece& piece,
            const std::function<void(std::string_view)>& take) {
    Words words = source.openedAt(piece.start - 1);
    const std::string filter = fmt::format("atrim=start={}:end={},asetpts=PTS-{}/TB,aresample={}:async=1:first_pts=0{}",
                                           secondsFor(piece.start), secondsFor(piece.end), numberFor(piece.start),
                                           rateOf(sound), tempoFilter(piece.speed.nearest()));
    for (const std::string& word :
         {std::string("-map"), fmt::format("0:{}", sound.index), std::string("-af"), filter, std::string("-ac"),
          std::to_string(sound.channels), std::string("-f"), std::string("s16le"), std::string("pipe:1")})
        words.push_back(word);
    ffmpeg.run(words, fmt::format("cut the sound of {} from {} s on", source.name, secondsFor(piece.start)), take);
}

} // namespace

void writeSound(const FFmpeg& ffmpeg, const CutSource& source, const SoundStream& sound,
                const std::vector<EditPiece>& pieces, const std::string& file) {
    std::ofstream output(file, std::ios::binary);
    const std::string silence(std::size_t{1} << 16, '\0');
    Rational base;
    std::uint64_t written = 0; // samples
    for (const EditPiece& piece : pieces) {
        base = base + piece.duration;
        const auto end = static_cast<std::uint64_t>(std::llround((base * rateOf(sound)).nearest()));
        std::uint64_t left = (end - written) * bytesOfASample(sound);
        const auto take = [&output, &left](std::string_view bytes) {
            const auto taken = std::min<std::uint64_t>(bytes.size(), left);
            output.write(bytes.data(), static_cast<std::streamsize>(taken));
            left -= taken;
        };
        if (!piece.isHeld())
            decode(ffmpeg, source, sound, piece, take);
        while (left > 0 && output)
            take(silence);
        written = end;
    }
    output.close();
    if (!output)
        throw Failure(fmt::format("{}: the sound cannot be written; is the disk full?", file));
}

Words soundInput(const SoundStream& sound, const std::string& file) {
    return {"-f", "s16le",           "-ar", std::to_string(rateOf(sound)), "-ac", std::to_string(sound.channels),
            "-i", mediaAddress(file)};
}

} // namespace Zulm
