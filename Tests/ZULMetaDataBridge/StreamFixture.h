#pragma once

// A folder with a stream file in it, for tests of the classes that write or read it.

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaDataBridge/EntriesAsText.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <gtest/gtest.h>

#include <cstddef>
#include <filesystem>
#include <string>
#include <vector>

namespace ZULMetaData::Test {

class StreamFixture : public testing::Test {
protected:
    static constexpr std::size_t headerSize = 24;

    TemporaryFolder folder;
    FileLocation file = FileLocation(folder / "Stream.dat");

    /// What stands behind the header, as another program sees it at this moment.
    std::string storedEntries() const { return contentsOf(file).substr(headerSize); }

    std::size_t storedBytes() const { return static_cast<std::size_t>(file_size(file)) - headerSize; }

    /// What a parser makes of a file that holds these bytes.
    template <class Parser>
    std::vector<std::string> read(const std::string& stream) const {
        writeFile(file, stream);
        return asTexts(*Parser(file).read());
    }
};

} // namespace ZULMetaData::Test
