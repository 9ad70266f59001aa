#pragma once

// The movie as it is on the disk while a recording runs, and how it becomes an ordinary one.
//
// The pictures stay where they are: an index of all of them is appended, and the indexes of the fragments become free
// space. This takes no copy, needs a few bytes for each frame, and can be repeated if it is interrupted.

#include "Tools/record/Boxes.h"

#include <cstdint>
#include <map>
#include <string>
#include <vector>

namespace Recorder {

/// The index of a fragmented movie, read from its file up to the last whole fragment.
class FragmentedMovie {
public:
    /// Reads the file. Throws `Failure` if it has no beginning of a movie. `name` is for messages.
    FragmentedMovie(int file, const std::string& name);

    std::uint64_t wholeBytes() const { return wholeBytes_; } ///< up to the end of the last whole fragment
    std::uint64_t frames() const;                            ///< samples of the first track
    double duration() const;                                 ///< seconds of the first track

    /// Cuts the file to its whole fragments and makes it an ordinary movie. Throws `Failure`.
    void makeOrdinary(int file) const;

private:
    struct Sample {
        std::uint64_t time = 0; ///< of decoding, in units of the track
        std::uint32_t duration = 0;
        std::uint32_t size = 0;
        bool isSync = false;
    };
    struct Chunk {
        std::uint64_t offset = 0;
        std::uint32_t samples = 0;
    };
    struct Track {
        std::uint32_t id = 0;
        std::uint32_t timescale = 1;
        bool isVideo = false;
        std::uint32_t defaultDuration = 0;
        std::uint32_t defaultSize = 0;
        std::uint32_t defaultFlags = 0;
        std::vector<Sample> samples;
        std::vector<Chunk> chunks;
    };

    /// Where the bytes of a fragment's samples are in the file.
    struct Media {
        std::uint64_t begin;
        std::uint64_t end;
    };
    /// Samples of one track that follow each other in the file.
    struct SampleRun {
        Track* track = nullptr;
        Chunk chunk;
        std::uint64_t bytes = 0;
        std::vector<Sample> samples;
    };

    void readMovieBox(Bytes movie);
    bool readFragment(const Bytes& fragment, std::uint64_t offset, const Media& media);
    bool readTrackFragment(const Box& box, std::uint64_t fragmentOffset, const Media& media,
                           std::vector<SampleRun>& runs);
    static bool readRun(const Box& box, std::uint64_t base, std::uint32_t usualFlags, const Media& media, Sample& usual,
                        SampleRun& run);
    Track* trackOf(std::uint32_t id);
    std::uint64_t durationOf(const Track& track) const;
    std::uint64_t inMovieTime(const Track& track, std::uint64_t duration) const;

    Bytes ordinaryIndex() const;
    void writeTrack(BoxWriter& writer, const Box& box) const;
    void writeMedia(BoxWriter& writer, const Box& box, const Track& track) const;
    static void writeTables(BoxWriter& writer, const Box& box, const Track& track);
    static void writeDurations(BoxWriter& writer, const Track& track);
    static void writeSyncSamples(BoxWriter& writer, const Track& track);
    static void writeChunkSizes(BoxWriter& writer, const Track& track);

    std::string name_;
    Bytes movie_; ///< the atom of the index as the file has it
    std::uint32_t timescale_ = 1;
    std::vector<Track> tracks_;
    std::vector<std::uint64_t> hidden_; ///< where the atoms begin that become free space
    std::uint64_t wholeBytes_ = 0;
    std::uint64_t fileBytes_ = 0;
};

} // namespace Recorder
