#pragma once

// All that an application can do with a file that nobody vouches for, in one process.

#include "ZULMetaData/ZULMMetaDataParser.h"

#include <cstdint>
#include <stdexcept>
#include <string>

namespace Reliability {

/// A case that does not hold, in one sentence.
class Broken : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

class Exercise {
public:
    /// The parsers that open a file: all of them read each case, or each case is read by the next of them, and a bare
    /// stream by its own.
    enum FileParsers { EachTime, InTurn };

    /// `folder` is for the files of the cases; `extension` tells the container.
    Exercise(const std::string& folder, const std::string& extension, FileParsers parsers = EachTime);

    /// Validates, salvages and reads everything, as a file and as a stream; repairs and appends where the file is a
    /// movie. Throws for any end but the documented ones, for what takes more than a second, and where more memory is
    /// asked for than twice the file and 16 MiB, by anything but the declared size of a text or an image in a file that
    /// the validator warns of.
    void run(const std::string& bytes);

    /// How often a declared size asked for more.
    std::uint64_t demanding() const { return demanding_; }

private:
    template <class Act>
    void guard(const char* what, Act act);
    template <class Act>
    void guardReading(const char* what, Act act);
    void validate();
    void salvage();
    void readAsFile();
    void readAsStream();
    void change();

    std::string path_;
    std::string copy_;
    ZULMetaData::MetaDataParser::StreamType type_;
    FileParsers parsers_;
    std::uint64_t cases_ = 0;
    std::string bytes_;
    bool isDamaged_ = false;
    bool hasDemanded_ = false;
    std::uint64_t demanding_ = 0;
};

/// Replaces what `file` holds.
void writeFile(const std::string& file, const std::string& bytes);
std::string contentsOf(const std::string& file);

} // namespace Reliability
