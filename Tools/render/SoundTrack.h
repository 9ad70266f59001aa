#pragma once

// The sound of a film: that of the movie, cut and sped up as the pictures are, with its pitch kept.

#include "Tools/render/SoundReader.h"
#include "ZULMetaDataSession/EditList.h"

#include <memory>
#include <span>
#include <string>
#include <vector>

namespace Render {

/// Makes sound faster or slower, and keeps its pitch.
class Tempo {
public:
    /// Throws `Zulm::Failure` if libavfilter refuses the speed.
    Tempo(double speed, int rate);

    void add(std::span<const float> samples); ///< left and right in turn
    void end();                               ///< nothing follows

    /// Moves what is ready to the end of `samples`. Returns false if nothing was.
    bool take(std::vector<float>& samples);

private:
    void feed(AVFrame* frame);

    GraphPointer graph_;
    AVFilterContext* source_ = nullptr;
    AVFilterContext* sink_ = nullptr;
    int rate_;
    std::int64_t added_ = 0;
};

class SoundTrack {
public:
    /// `edits` must outlive this.
    SoundTrack(const std::string& path, const std::string& name, const ZULMetaData::EditList& edits);

    bool hasSound() const { return reader_.hasSound(); }
    int rate() const { return reader_.rate(); }

    /// Returns the samples that follow those that were read before, up to a time of the film in seconds.
    std::vector<float> readUntil(double film);

private:
    std::int64_t endOf(std::size_t piece) const;
    void readPiece(std::span<float> samples);
    void readSped(const ZULMetaData::EditPiece& piece, std::span<float> samples);

    SoundReader reader_;
    const ZULMetaData::EditList& edits_;
    std::size_t piece_ = 0;
    std::int64_t written_ = 0; ///< samples of the film
    std::int64_t begin_ = 0;   ///< of the piece in the film
    std::unique_ptr<Tempo> tempo_;
    std::int64_t fed_ = 0;    ///< samples of the movie that the tempo has got
    std::vector<float> sped_; ///< what the tempo has made
};

} // namespace Render
