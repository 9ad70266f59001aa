#pragma once

// A file to read that was named on the command line, where "-" is standard input.

#include "ZULMetaDataBridge/Source/RecordingFile.h"
#include "ZULMetaDataSession/Recording.h"

#include <memory>
#include <string>

namespace Zulm {

class TemporaryFile;

/// Standard input is copied into a temporary file first, whose extension tells what it is by its first bytes.
class InputFile {
public:
    /// Throws `Failure` where there is no such regular file, or where standard input cannot be read or is nothing
    /// that can hold a recording's metadata.
    explicit InputFile(const std::string& argument);
    ~InputFile();
    InputFile(InputFile&&) noexcept;
    InputFile& operator=(InputFile&&) = delete;

    /// What to open.
    const std::string& path() const { return path_; }

    /// What to call it towards a person or in a report: as it was named.
    const std::string& name() const { return name_; }

    /// Opens it as `openRecording` does. This must outlive the recording.
    ZULMetaData::RecordingFile open() const;

    /// The same for a command that works on tracks.
    ZULMetaData::Recording openSession() const;

private:
    void spool();

    std::string name_;
    std::string path_;
    std::unique_ptr<TemporaryFile> temporary_;
};

/// Opens a recording, and warns if its name tells another container than its contents do. Throws `Failure` unless it is
/// a regular file, and what `RecordingFile` throws. Messages call it `name`, or by its path if `name` is empty.
ZULMetaData::RecordingFile openRecording(const std::string& path, const std::string& name = {});

/// Whether a file's name tells another container than its contents do, so that programs that go by the name fail.
bool isNamedOtherwise(const std::string& path, ZULMetaData::Container::Type type);

} // namespace Zulm
