#pragma once

// Tells what a file is by its first bytes, and by its name only if those say nothing.
//
//     const ByteSource file = ByteSource::file("Recording.m4v");
//     const RecognizedContainer recognized = recognizeContainer(file, "Recording.m4v");
//     if (recognized.type == Container::Unknown)
//         std::cerr << "Recording.m4v: " << recognized.refusal() << '\n';

#include "../../SharedDependencies/Export.h"
#include "../ByteSource.h"
#include "../ZULMMetaDataParser.h"

#include <cstddef>
#include <cstdint>
#include <istream>
#include <memory>
#include <string>
#include <string_view>

namespace ZULMetaData {

/// So many bytes from the beginning of a file are enough to tell what it is.
inline constexpr std::size_t s_recognitionBytes = 512;

/// The container that begins like this; 24 bytes are enough to tell. `RawStream` for an identifier of the registry's
/// family, known or not, `Riff` for the signatures `RIFF`, `RF64` and `BW64`, `QuickTime` for an atom whose size covers
/// its header and whose type is printable.
ZULMETADATA_API Container::Type streamTypeOfContents(std::string_view firstBytes);

/// The extension, with its dot, under which `MetaDataParser::create` takes a file for a container of this type; empty
/// for `Unknown`.
ZULMETADATA_API std::string_view extensionFor(Container::Type type);

/// What a file is.
struct ZULMETADATA_API RecognizedContainer {
    Container::Type type = Container::Unknown; ///< `Unknown` for a file that can hold no metadata
    std::string_view foreignName; ///< what a file of unknown type is instead, such as "a Matroska file"; may be empty
    bool contradictsName = false; ///< whether the extension tells another container, or one for a file that is none

    /// Why a file of unknown type is refused, as a clause about the file.
    std::string refusal() const;
};

/// The contents win. The name counts for bytes that say nothing: a file that ends before its first atom or chunk, and
/// a stream file of a kind that is not of the registry's family.
ZULMETADATA_API RecognizedContainer recognizeContainer(std::string_view firstBytes, std::uint64_t fileSize,
                                                       const std::string& name);

/// Throws `std::system_error` if reading fails.
ZULMETADATA_API RecognizedContainer recognizeContainer(const ByteSource& file, const std::string& name);

/// Opens a file as `MetaDataParser::create` does, but takes it for what `recognizeContainer` says, and finds the
/// streams after a RIFF chunk of 64-bit or unknown size as well. Throws `std::system_error` if the file cannot be
/// opened or read, and `std::runtime_error` with the refusal if it can hold no metadata. The stream of the parser
/// throws `std::system_error` too if reading fails later.
ZULMETADATA_API std::unique_ptr<MetaDataParser> openContainer(const std::string& path);

/// The same for a stream of the caller, which must outlive the parser. Throws `std::system_error` if reading fails.
ZULMETADATA_API std::unique_ptr<MetaDataParser> openContainer(std::istream& stream, Container::Type type,
                                                              ScanMessages messages = ScanMessages::Printed);

} // namespace ZULMetaData
