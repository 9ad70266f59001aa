#include "Tools/zulm/SoundCut.h"

#include "Tools/zulm/Failure.h"
#include "Tools/zulm/SoundTempo.h"

#include <fmt/core.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <fstream>

namespace Zulm {

using namespace ZULMetaData;

namespace {

int rateOf(const SoundStream& sound) {
    return soundRateFor(sound.sampleRate);
}

std::uint64_t bytesOfASample(const SoundStream& sound) {
    return static_cast<std::uint64_t>(sound.channels) * sizeof(std::int16_t);
}

/// Decodes a piece. Decoding begins a little before what is heard.
void decode(const FFmpeg& ffmpeg, const CutSource& source, const SoundStream& sound, const EditPiece& piece,
            const std::function<void(std::string_view)>& take) {
    Words words = source.openedAt(piece.start - 1);
    const std::string filter = fmt::format(
        "atrim=start={}:end={},asetpts=PTS-{}/TB,aresample={}:async=1:first_pts=0,{}", secondsFor(piece.start),
        secondsFor(piece.end), numberFor(piece.start), rateOf(sound), tempoFilters(piece.speed.nearest()));
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
        if (!piece.isHeld() && isHeardAt(piece.speed.nearest()))
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
