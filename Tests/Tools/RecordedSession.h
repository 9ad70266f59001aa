#pragma once

// The demo's session as files: a stream file for every kind that is recorded, and a movie that holds them all.

#include "Tests/Support/Files.h"

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

namespace ZULMetaData::Test {

/// `ftyp`, `mdat` and a `moov` whose only child `mvhd` says that the movie lasts `duration` units of 1/`timescale`
/// seconds. Nothing more, spelled out byte by byte.
std::string tinyMovie(std::uint32_t duration = 12000, std::uint32_t timescale = 600);

/// A `ZULR` atom: version 1, made by `name` in `version` on `platformVersion`.
std::string recordingInfo(const std::string& name, const std::string& version, const std::string& platformVersion);

/// Records once for all tests of the suite. The files are shared: a test that changes one takes a copy. What depends
/// on the machine (the system data, the recording info) is replaced by what does not.
class RecordedSession : public testing::Test {
protected:
    static void SetUpTestSuite();
    static void TearDownTestSuite();

    /// In the order of the registry.
    static const std::vector<std::string>& streamFiles() { return files_->streams; }

    /// The file of a kind, such as "cursorLocation".
    static std::string streamFile(const std::string& kind) { return files_->folder / (kind + ".dat"); }

    /// A tiny movie with the streams and a recording-info atom behind it.
    static const std::string& movie() { return files_->movie; }

    /// A folder of this test alone.
    TemporaryFolder folder;

    /// A copy in it of a file, under the name `as` or its own.
    std::string copyOf(const std::string& file, const std::string& as = {}) const;

private:
    struct Files {
        TemporaryFolder folder;
        std::vector<std::string> streams;
        std::string movie;
    };

    static std::unique_ptr<Files> files_;
};

} // namespace ZULMetaData::Test
