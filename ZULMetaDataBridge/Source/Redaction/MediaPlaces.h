#pragma once

// The places of a movie or RIFF file, apart from the recording's metadata, that hold texts or unused bytes: chapters,
// titles, tags and captions, and space that nobody uses. Sample data is read only where tracks of texts lead to it.

#include "ZULMetaData/Containers/ContainerLayout.h"

#include <cstdint>
#include <string>
#include <vector>

namespace ZULMetaData::detail {

/// Bytes of a container that become `head` and zeros, so that everything around them keeps its place.
struct Blank {
    std::uint64_t offset = 0;
    std::uint64_t size = 0;
    std::string head; ///< not longer than `size`

    std::uint64_t end() const { return offset + size; }
    bool covers(std::uint64_t position) const { return offset <= position && position < end(); }
};

/// Returns the file as it is with the blanks. A blank inside of an earlier, larger one has no effect.
ByteSource withBlanks(const ByteSource& file, std::vector<Blank> blanks);

/// A part of the container that can be blanked as a whole.
struct MediaPlace {
    enum class Use {
        Text,   ///< chapters, titles, tags, names
        Unused, ///< free space, and atoms or chunks of unknown types
    };

    Use use = Use::Text;
    std::string path;         ///< the types of the atoms that lead to it, such as "moov/udta"
    std::uint64_t offset = 0; ///< of its header
    std::uint64_t size = 0;   ///< header included
    std::vector<Blank> blanks;
};

/// Texts that stand in one place.
struct MediaText {
    enum class Role {
        Title,     ///< chapters, titles and tags: people wrote it for people
        Caption,   ///< shown over the pictures
        Technical, ///< names of handlers and programs
    };

    Role role = Role::Title;
    std::string path;
    std::uint64_t offset = 0;
    std::vector<std::string> texts; ///< in UTF-8
};

/// A place whose texts cannot be read or removed.
struct MediaObstacle {
    std::string path;
    std::uint64_t offset = 0;
    std::string reason; ///< the rest of a sentence that begins with the place
};

struct MediaPlaces {
    std::vector<MediaPlace> places;
    std::vector<MediaText> texts;
    std::vector<MediaObstacle> obstacles;
};

/// Throws `std::system_error` if the input cannot be read. A damaged container yields what was found up to the damage.
///@{
MediaPlaces findPlacesInMovie(const ByteSource& movie);
MediaPlaces findPlacesInRIFF(const ByteSource& file);
///@}

} // namespace ZULMetaData::detail
