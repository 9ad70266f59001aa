// What holds for streams of every value type.

#include "ZULMetaData/ZULMMetaDataReader.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaData/CursorImageSamples.h"
#include "Tests/ZULMetaData/PiecewiseBuffer.h"
#include "Tests/ZULMetaData/ReadStream.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <concepts>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <istream>
#include <limits>
#include <list>
#include <optional>
#include <ostream>
#include <sstream>
#include <string>
#include <vector>

namespace ZULMetaData::Test {

namespace {

constexpr std::int32_t s_lowest = std::numeric_limits<std::int32_t>::min();
constexpr std::int32_t s_highest = std::numeric_limits<std::int32_t>::max();
constexpr double s_greatestTime = std::numeric_limits<double>::max();
constexpr double s_tiniestTime = std::numeric_limits<double>::denorm_min();
constexpr double s_endless = std::numeric_limits<double>::infinity();
const double s_noTime = std::bit_cast<double>(0x7ff8000000000001);

/// An entry as a program writes it and as a file holds it. A list has no time of its own to be read back.
template <class T>
struct Sample {
    double time;
    T value;
    std::string bytes;

    std::string readBack() const { return asText(std::same_as<T, std::list<std::string>> ? 0.0 : time, value); }
};

std::string padded(std::string bytes, std::size_t size, char with = '\0') {
    bytes.resize(size, with);
    return bytes;
}

/// From the little-endian bytes that are there.
std::uint32_t number(const std::string& bytes, std::size_t offset) {
    std::uint32_t value = 0;
    for (std::size_t index = std::min(offset + 4, bytes.size()); index-- > offset;)
        value = value << 8 | static_cast<unsigned char>(bytes[index]);
    return value;
}

// ---- The value types ------------------------------------------------------------------------------------------
//
// Each has the first group of a kind's identifier, the version and entry size in its header, and samples. `cut`
// tells what is read of an entry of which only the first bytes are there: none where the reader must throw.

template <class T>
struct Stored;

/// Without its whole time an entry is invalid; the part of a value that is missing is zero.
template <class T>
struct StoredInFixedSize {
    static constexpr std::int32_t version = 1;

    static std::optional<std::string> cut(const std::string& entry) {
        if (entry.size() < 8)
            return std::nullopt;
        return hexDigits(entry.substr(0, 8)) + ' ' + hexDigits(padded(entry.substr(8), sizeof(T)));
    }
};

template <>
struct Stored<Point> : StoredInFixedSize<Point> {
    static constexpr const char* name = "Point";
    static constexpr const char* group = "2b7b6af2";
    static constexpr std::uint32_t fixedEntrySize = 16;
    static std::vector<Sample<Point>> samples() {
        return {
            {0.25, Point(10, -4), hex("000000000000d03f 0a000000 fcffffff")},
            {s_greatestTime, Point(s_lowest, s_highest), hex("ffffffffffffef7f 00000080 ffffff7f")},
            {s_noTime, Point(-1, 0x01020304), hex("010000000000f87f ffffffff 04030201")},
            {-0.0, Point(), hex("0000000000000080 00000000 00000000")},
        };
    }
};

template <>
struct Stored<Rect> : StoredInFixedSize<Rect> {
    static constexpr const char* name = "Rect";
    static constexpr const char* group = "2b7b6a09";
    static constexpr std::uint32_t fixedEntrySize = 24;
    static std::vector<Sample<Rect>> samples() {
        return {
            {5.0, Rect(1, -2, 300, 70000), hex("0000000000001440 01000000 feffffff 2c010000 70110100")},
            {s_endless, Rect(s_lowest, s_highest, s_highest, s_lowest),
             hex("000000000000f07f 00000080 ffffff7f ffffff7f 00000080")},
            {s_tiniestTime, Rect(-1, -1, -1, -1), hex("0100000000000000 ffffffff ffffffff ffffffff ffffffff")},
            {0.0, Rect(), hex("0000000000000000 00000000 00000000 00000000 00000000")},
        };
    }
};

template <>
struct Stored<KeyStroke> : StoredInFixedSize<KeyStroke> {
    static constexpr const char* name = "KeyStroke";
    static constexpr const char* group = "2b7b6af5";
    static constexpr std::uint32_t fixedEntrySize = 16;
    static std::vector<Sample<KeyStroke>> samples() {
        return {
            {1.5, KeyStroke(0x61, 0x00100108), hex("000000000000f83f 61000000 08011000")},
            {-1.0, KeyStroke(0xffffffff, 0x80000000), hex("000000000000f0bf ffffffff 00000080")},
            {-s_endless, KeyStroke(0x01020304, 0xffffffff), hex("000000000000f0ff 04030201 ffffffff")},
            {0.0, KeyStroke(), hex("0000000000000000 00000000 00000000")},
        };
    }
};

template <>
struct Stored<int> : StoredInFixedSize<int> {
    static constexpr const char* name = "Int";
    static constexpr const char* group = "2b7b6af0";
    static constexpr std::uint32_t fixedEntrySize = 12;
    static std::vector<Sample<int>> samples() {
        return {
            {0.25, 0x01020304, hex("000000000000d03f 04030201")},
            {s_greatestTime, s_lowest, hex("ffffffffffffef7f 00000080")},
            {-1.0, s_highest, hex("000000000000f0bf ffffff7f")},
            {s_noTime, -1, hex("010000000000f87f ffffffff")},
            {0.0, 0, hex("0000000000000000 00000000")},
        };
    }
};

template <>
struct Stored<float> : StoredInFixedSize<float> {
    static constexpr const char* name = "Float";
    static constexpr const char* group = "2b7b6a08";
    static constexpr std::uint32_t fixedEntrySize = 12;
    static std::vector<Sample<float>> samples() {
        using Limits = std::numeric_limits<float>;
        return {
            {0.25, 0.5F, hex("000000000000d03f 0000003f")},
            {5.0, Limits::max(), hex("0000000000001440 ffff7f7f")},
            {s_tiniestTime, Limits::denorm_min(), hex("0100000000000000 01000000")},
            {-1.0, -Limits::infinity(), hex("000000000000f0bf 000080ff")},
            {s_noTime, std::bit_cast<float>(0x7fc00001), hex("010000000000f87f 0100c07f")},
            {0.0, -0.0F, hex("0000000000000000 00000080")},
        };
    }
};

template <>
struct Stored<double> : StoredInFixedSize<double> {
    static constexpr const char* name = "Double";
    static constexpr const char* group = "2b7b6af3";
    static constexpr std::uint32_t fixedEntrySize = 16;
    static std::vector<Sample<double>> samples() {
        return {
            {0.25, 0.75, hex("000000000000d03f 000000000000e83f")},
            {5.0, s_greatestTime, hex("0000000000001440 ffffffffffffef7f")},
            {s_greatestTime, s_tiniestTime, hex("ffffffffffffef7f 0100000000000000")},
            {-1.0, -s_endless, hex("000000000000f0bf 000000000000f0ff")},
            {s_noTime, s_noTime, hex("010000000000f87f 010000000000f87f")},
            {0.0, -0.0, hex("0000000000000000 0000000000000080")},
        };
    }
};

/// Without its whole size an entry is invalid. Characters that are missing repeat the last one, or are zero.
template <>
struct Stored<std::string> {
    static constexpr const char* name = "String";
    static constexpr const char* group = "2b7b6a06";
    static constexpr std::int32_t version = 1;
    static constexpr std::uint32_t fixedEntrySize = 0;
    static std::vector<Sample<std::string>> samples() {
        return {
            {5.0, "Notes", hex("0d000000 0000000000001440 4e6f746573")},
            {0.25, "", hex("08000000 000000000000d03f")},
            {-1.0, "Gr\xc3\xbc\xc3\x9f e", hex("10000000 000000000000f0bf 4772c3bcc39f2065")},
            {s_noTime, std::string("\0\n\xff\0", 4), hex("0c000000 010000000000f87f 000aff00")},
            {s_greatestTime, std::string(70000, 'x'), hex("78110100 ffffffffffffef7f") + std::string(70000, 'x')},
        };
    }

    static std::string textIn(const std::string& entry) {
        const std::string text = entry.size() > 12 ? entry.substr(12) : "";
        return padded(text, number(entry, 0) - 8, text.empty() ? '\0' : text.back());
    }

    static std::optional<std::string> cut(const std::string& entry) {
        if (entry.size() < 4)
            return std::nullopt;
        return hexDigits(padded(entry.substr(4, 8), 8)) + ' ' + asText(textIn(entry));
    }
};

/// Without its whole total, or the whole size of any of its texts, an entry is invalid.
template <>
struct Stored<std::list<std::string>> {
    static constexpr const char* name = "StringList";
    static constexpr const char* group = "2b7b6afc";
    static constexpr std::int32_t version = 1;
    static constexpr std::uint32_t fixedEntrySize = 0;
    static std::vector<Sample<std::list<std::string>>> samples() {
        return {
            {5.0, {"a", "bc"}, hex("1f000000 02000000 09000000 0000000000001440 61 0a000000 0000000000001440 6263")},
            {0.25, {}, hex("04000000 00000000")},
            {-1.0,
             {"", "Notes", ""},
             hex("2d000000 03000000 08000000 000000000000f0bf 0d000000 000000000000f0bf 4e6f746573"
                 "08000000 000000000000f0bf")},
            {s_noTime,
             {std::string("\0\xff", 2), std::string(300, 'x')},
             hex("4a010000 02000000 0a000000 010000000000f87f 00ff 34010000 010000000000f87f") + std::string(300, 'x')},
        };
    }

    static std::optional<std::string> cut(const std::string& entry) {
        if (entry.size() < 4)
            return std::nullopt;
        std::list<std::string> texts;
        std::size_t start = 8;
        for (std::uint32_t left = number(entry, 4); left > 0; --left) {
            if (entry.size() < start + 4)
                return std::nullopt;
            const std::uint32_t size = number(entry, start);
            texts.push_back(Stored<std::string>::textIn(entry.substr(start, 4 + size)));
            start += 4 + size;
        }
        return asText(0.0, texts);
    }
};

/// Without its identifier an entry is invalid. Behind that every field keeps its default as far as it is missing; an
/// image keeps its size until the fields in front of it are there, and then has zeros.
template <>
struct Stored<CursorImage> {
    static constexpr const char* name = "CursorImage";
    static constexpr const char* group = "2b7b6af1";
    static constexpr std::int32_t version = 2;
    static constexpr std::uint32_t fixedEntrySize = 0;
    static std::vector<Sample<CursorImage>> samples() {
        return {
            {0.25, cursorImage(7, 3, -2, 5, 1, "PNG!"),
             hex("2c000000 000000000000d03f 0700000000000000 18000000"
                 "04000000 03000000 feffffff 504e4721 05000000 01000000")},
            {5.0, cursorImage(0xffffffffffffffff, 0, 0, -1, 0xffffffff, ""),
             hex("1c000000 0000000000001440 ffffffffffffffff 08000000 00000000 ffffffff")},
            {s_noTime,
             cursorImage(0x0102030405060708, s_lowest, s_highest, s_highest, 0x80000000, std::string(1, '\0')),
             hex("29000000 010000000000f87f 0807060504030201 15000000"
                 "01000000 00000080 ffffff7f 00 ffffff7f 00000080")},
            {-1.0, cursorImage(7, 0, 0, s_lowest, 3, std::string(70000, 'x')),
             hex("98110100 000000000000f0bf 0700000000000000 84110100 70110100 00000000 00000000") +
                 std::string(70000, 'x') + hex("00000080 03000000")},
        };
    }

    static std::optional<std::string> cut(const std::string& entry) {
        if (entry.size() < 20)
            return std::nullopt;
        const auto field = [&entry](std::size_t offset, std::string byDefault) {
            for (std::size_t index = 0; index < 4 && offset + index < entry.size(); ++index)
                byDefault[index] = entry[offset + index];
            return number(byDefault, 0);
        };
        const std::uint32_t size = field(24, le32(0));
        const std::size_t behindImage = 36 + size;
        const bool hasImage = size > 0;
        const bool imageIsLost = entry.size() >= 32 && entry.size() < 36;
        CursorImage image(0, 0, 0, nullptr, imageIsLost ? 0 : size, CursorTypeUnknown, CursorImage::DefaultFlags);
        std::memcpy(&image.uniqueId, entry.data() + 12, 8);
        if (hasImage) {
            image.hotspotOffsetX = static_cast<std::int32_t>(field(28, le32(0)));
            image.hotspotOffsetY = static_cast<std::int32_t>(field(32, le32(0)));
            image.cursorTypeId = CursorTypeID{static_cast<std::int32_t>(field(behindImage, hex("ffffffff")))};
        }
        if (hasImage && entry.size() >= 36)
            image = cursorImage(image.uniqueId, image.hotspotOffsetX, image.hotspotOffsetY, image.cursorTypeId,
                                image.flags, padded(entry.substr(36, size), size));
        image.flags = CursorImage::CursorImageFlags{field(hasImage ? behindImage + 4 : 28, le32(3))};
        return hexDigits(entry.substr(4, 8)) + ' ' + asText(image);
    }
};

// ---- What holds for all of them -------------------------------------------------------------------------------

template <class T>
class StreamOf : public testing::Test {
protected:
    TemporaryFolder folder;
    const std::string path = folder / "Stream.dat";
    const std::vector<Sample<T>> samples = Stored<T>::samples();
    const std::string header = streamHeader(Stored<T>::group, Stored<T>::version, Stored<T>::fixedEntrySize);

    void record(const std::vector<Sample<T>>& entries) const {
        MetaDataWriter<T, int, int> writer;
        writer.init(path, kind(Stored<T>::group), Stored<T>::version);
        for (const Sample<T>& sample : entries)
            writer.write(sample.time, sample.value, false);
    }

    Reading readFile() const {
        std::ifstream stream(path, std::ios_base::binary);
        return readStream<T>(stream, 0, std::filesystem::file_size(path));
    }

    static std::string joined(const std::vector<Sample<T>>& entries) {
        std::string bytes;
        for (const Sample<T>& sample : entries)
            bytes += sample.bytes;
        return bytes;
    }

    static Reading whole(const std::vector<Sample<T>>& entries) {
        Reading reading;
        for (const Sample<T>& sample : entries)
            reading.entries.push_back(sample.readBack());
        return reading;
    }

    /// What must come of the stream that holds these entries, and of them only the first `size` bytes.
    static Reading cut(const std::vector<Sample<T>>& entries, std::size_t size) {
        Reading reading;
        for (const Sample<T>& sample : entries) {
            if (size >= sample.bytes.size()) {
                reading.entries.push_back(sample.readBack());
                size -= sample.bytes.size();
            } else if (size == 0) {
                break;
            } else if (const auto partial = Stored<T>::cut(sample.bytes.substr(0, size))) {
                reading.entries.push_back(*partial);
                break;
            } else {
                reading.error = "invalid meta data entry";
                break;
            }
        }
        return reading;
    }
};

using ValueTypes =
    testing::Types<Point, Rect, KeyStroke, int, float, double, std::string, std::list<std::string>, CursorImage>;

struct ValueTypeNames {
    template <class T>
    static std::string GetName(int) {
        return Stored<T>::name;
    }
};

TYPED_TEST_SUITE(StreamOf, ValueTypes, ValueTypeNames);

TYPED_TEST(StreamOf, StoresItsEntriesBehindItsHeader) {
    this->record(this->samples);
    EXPECT_EQ(hexDigits(contentsOf(this->path)), hexDigits(this->header + this->joined(this->samples)));
}

TYPED_TEST(StreamOf, NamesTheSizeOfItsEntriesInItsHeader) {
    this->record(std::vector<Sample<TypeParam>>());
    EXPECT_EQ(hexDigits(contentsOf(this->path).substr(20)), hexDigits(le32(Stored<TypeParam>::fixedEntrySize)));
    EXPECT_EQ(metaDataFixedEntrySize<TypeParam>(), Stored<TypeParam>::fixedEntrySize);
}

TYPED_TEST(StreamOf, EncodesEachEntryOnItsOwn) {
    for (const Sample<TypeParam>& sample : this->samples) {
        std::ostringstream out;
        metaDataWrite<TypeParam>(sample.time, sample.value, out, Stored<TypeParam>::version);
        EXPECT_EQ(hexDigits(out.str()), hexDigits(sample.bytes));
    }
}

TYPED_TEST(StreamOf, IsReadFromSpelledOutBytes) {
    EXPECT_EQ(readStream<TypeParam>(this->header + this->joined(this->samples)), this->whole(this->samples));
}

TYPED_TEST(StreamOf, DecodesEachEntryOnItsOwn) {
    for (const Sample<TypeParam>& sample : this->samples) {
        std::istringstream in(sample.bytes + "rest");
        double time = 0;
        TypeParam value{};
        metaDataRead<TypeParam>(in, &time, &value, Stored<TypeParam>::version);
        EXPECT_EQ(asText(time, value), sample.readBack());
        EXPECT_EQ(in.tellg(), static_cast<std::streamoff>(sample.bytes.size()));
    }
}

TYPED_TEST(StreamOf, ComesBackFromItsFileAsItWas) {
    this->record(this->samples);
    EXPECT_EQ(this->readFile(), this->whole(this->samples));
}

TYPED_TEST(StreamOf, MayBeEmpty) {
    this->record(std::vector<Sample<TypeParam>>());
    EXPECT_EQ(hexDigits(contentsOf(this->path)), hexDigits(this->header));
    EXPECT_EQ(this->readFile(), Reading());
}

TYPED_TEST(StreamOf, MayHaveManyEntriesInARow) {
    std::vector<Sample<TypeParam>> many;
    for (std::size_t index = 0; index < 6000; ++index)
        many.push_back(this->samples[index % 3]);
    this->record(many);
    EXPECT_TRUE(contentsOf(this->path) == this->header + this->joined(many));
    EXPECT_TRUE(this->readFile() == this->whole(many));
}

TYPED_TEST(StreamOf, GivesWhatThereIsWhereverItIsCut) {
    const std::vector<Sample<TypeParam>> three(this->samples.begin(), this->samples.begin() + 3);
    const std::string bytes = this->joined(three);
    for (std::size_t size = 0; size <= bytes.size(); ++size)
        EXPECT_EQ(readStream<TypeParam>(this->header + bytes.substr(0, size)), this->cut(three, size)) << size;
}

TYPED_TEST(StreamOf, GivesTheSameInPiecesOfAnySizeWhereverItIsCut) {
    const std::vector<Sample<TypeParam>> two(this->samples.begin(), this->samples.begin() + 2);
    const std::string bytes = this->joined(two);
    for (std::size_t piece = 1; piece <= 50; ++piece)
        for (std::size_t size = 0; size <= bytes.size(); ++size) {
            PiecewiseBuffer buffer(piece, this->header + bytes.substr(0, size));
            std::istream stream(&buffer);
            EXPECT_EQ(readStream<TypeParam>(stream, 0, 24 + size), this->cut(two, size)) << size << " by " << piece;
        }
}

TYPED_TEST(StreamOf, IsStoredTheSameInPiecesOfAnySize) {
    for (std::size_t piece = 1; piece <= 50; ++piece) {
        PiecewiseBuffer buffer(piece);
        std::ostream stream(&buffer);
        for (const Sample<TypeParam>& sample : this->samples)
            metaDataWrite<TypeParam>(sample.time, sample.value, stream, Stored<TypeParam>::version);
        EXPECT_TRUE(buffer.taken() == this->joined(this->samples)) << piece;
    }
}

TYPED_TEST(StreamOf, GivesWhatThereIsWhereverItsFileIsCut) {
    const std::vector<Sample<TypeParam>> two(this->samples.begin(), this->samples.begin() + 2);
    const std::string bytes = this->joined(two);
    for (std::size_t size = 0; size <= bytes.size(); ++size) {
        writeFile(this->path, this->header + bytes.substr(0, size));
        EXPECT_EQ(this->readFile(), this->cut(two, size)) << size;
    }
}

TYPED_TEST(StreamOf, IsReadTheSameWhereMoreFollowsIt) {
    const std::string bytes = this->header + this->joined(this->samples);
    std::istringstream stream("media" + bytes + "more media");
    EXPECT_EQ(readStream<TypeParam>(stream, 5, bytes.size()), this->whole(this->samples));
}

} // namespace

} // namespace ZULMetaData::Test
