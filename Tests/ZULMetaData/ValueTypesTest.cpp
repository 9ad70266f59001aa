// What holds for every value that a stream can carry.

#include "ZULMetaData/ZULMMetaDataReader.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <limits>
#include <sstream>
#include <stdexcept>

namespace ZULMetaData {

namespace {

using namespace Test;

constexpr auto s_min = std::numeric_limits<std::int32_t>::min();
constexpr auto s_max = std::numeric_limits<std::int32_t>::max();

template <class T>
struct Golden {
    T value;
    std::string bytes; ///< of an entry at 1.5 s
};

template <class T>
struct Samples;

template <>
struct Samples<Point> {
    static constexpr std::uint32_t fixedEntrySize = 16;
    static constexpr std::size_t leadingBytes = 8; // without which there is no entry
    static std::vector<Golden<Point>> entries() {
        return {{{1, -2}, f64(1.5) + hex("01000000 feffffff")}, {{s_min, s_max}, f64(1.5) + hex("00000080 ffffff7f")}};
    }
};

template <>
struct Samples<Rect> {
    static constexpr std::uint32_t fixedEntrySize = 24;
    static constexpr std::size_t leadingBytes = 8;
    static std::vector<Golden<Rect>> entries() {
        return {{{1, -2, 3, 4}, f64(1.5) + hex("01000000 feffffff 03000000 04000000")},
                {{s_min, s_max, 0, -1}, f64(1.5) + hex("00000080 ffffff7f 00000000 ffffffff")}};
    }
};

template <>
struct Samples<KeyStroke> {
    static constexpr std::uint32_t fixedEntrySize = 16;
    static constexpr std::size_t leadingBytes = 8;
    static std::vector<Golden<KeyStroke>> entries() {
        return {{{65, 0x20000}, f64(1.5) + hex("41000000 00000200")},
                {{0xffffffff, 0x80000000}, f64(1.5) + hex("ffffffff 00000080")}};
    }
};

template <>
struct Samples<int> {
    static constexpr std::uint32_t fixedEntrySize = 12;
    static constexpr std::size_t leadingBytes = 8;
    static std::vector<Golden<int>> entries() {
        return {{256, f64(1.5) + hex("00010000")}, {s_min, f64(1.5) + hex("00000080")}};
    }
};

template <>
struct Samples<float> {
    static constexpr std::uint32_t fixedEntrySize = 12;
    static constexpr std::size_t leadingBytes = 8;
    static std::vector<Golden<float>> entries() {
        return {{0.5F, f64(1.5) + hex("0000003f")},
                {std::numeric_limits<float>::infinity(), f64(1.5) + hex("0000807f")}};
    }
};

template <>
struct Samples<double> {
    static constexpr std::uint32_t fixedEntrySize = 16;
    static constexpr std::size_t leadingBytes = 8;
    static std::vector<Golden<double>> entries() {
        return {{0.5, f64(1.5) + hex("000000000000e03f")},
                {-std::numeric_limits<double>::infinity(), f64(1.5) + hex("000000000000f0ff")}};
    }
};

template <>
struct Samples<std::string> {
    static constexpr std::uint32_t fixedEntrySize = 0;
    static constexpr std::size_t leadingBytes = 4;
    static std::vector<Golden<std::string>> entries() {
        return {{"abc", hex("0b000000") + f64(1.5) + "abc"},
                {"", hex("08000000") + f64(1.5)},
                {std::string(5000, 'x'), hex("90130000") + f64(1.5) + std::string(5000, 'x')}};
    }
};

template <>
struct Samples<std::list<std::string>> {
    static constexpr std::uint32_t fixedEntrySize = 0;
    static constexpr std::size_t leadingBytes = 4;
    static std::vector<Golden<std::list<std::string>>> entries() {
        return {{{"a", "bc"}, hex("1f000000 02000000 09000000") + f64(1.5) + "a" + hex("0a000000") + f64(1.5) + "bc"},
                {{}, hex("04000000 00000000")}};
    }
};

template <>
struct Samples<CursorImage> {
    static constexpr std::uint32_t fixedEntrySize = 0;
    static constexpr std::size_t leadingBytes = 20;
    static std::vector<Golden<CursorImage>> entries() {
        CursorImage number;
        number.uniqueId = 7;
        CursorImage image(std::numeric_limits<std::uint64_t>::max(), s_min, s_max,
                          static_cast<unsigned char*>(std::calloc(2, 1)), 2, static_cast<CursorTypeID>(s_min),
                          static_cast<CursorImage::CursorImageFlags>(0xffffffff));
        return {{number, hex("1c000000") + f64(1.5) + hex("0700000000000000 08000000 00000000 03000000")},
                {image, hex("2a000000") + f64(1.5) +
                            hex("ffffffffffffffff 16000000 02000000 00000080 ffffff7f 0000 00000080 ffffffff")}};
    }
};

template <class T>
struct Delivered : DataStreamObserver<T> {
    std::vector<std::pair<double, T>> entries;

    bool dataRead(double time, const T& value) override {
        entries.emplace_back(time, value);
        return true;
    }
};

template <class T>
class ValueTypes : public testing::Test {
protected:
    static constexpr int version = std::is_same_v<T, CursorImage> ? 2 : 1;
    static constexpr uuid type = s_cursorImageUUID; // whose versions are 1 and 2; no reader asks for the kind

    static std::string header() { return streamHeader("2b7b6af1", version, Samples<T>::fixedEntrySize); }

    static double timeOf(double time) { return std::is_same_v<T, std::list<std::string>> ? 0 : time; }

    static std::string goldenStream() {
        std::string stream = header();
        for (const auto& golden : Samples<T>::entries())
            stream += golden.bytes;
        return stream;
    }

    static void parse(const std::string& bytes, Delivered<T>& delivered) {
        std::istringstream stream(bytes);
        MetaDataReader<T>::parseStream(delivered, stream, 0, bytes.size(), -1);
    }
};

using EveryValue =
    testing::Types<Point, Rect, KeyStroke, int, float, double, std::string, std::list<std::string>, CursorImage>;
TYPED_TEST_SUITE(ValueTypes, EveryValue);

TYPED_TEST(ValueTypes, AreWrittenByteForByte) {
    for (const auto& golden : Samples<TypeParam>::entries()) {
        std::ostringstream stream;
        metaDataWrite<TypeParam>(1.5, golden.value, stream, this->version);
        EXPECT_EQ(stream.str(), golden.bytes);
    }
}

TYPED_TEST(ValueTypes, AreReadByteForByte) {
    for (const auto& golden : Samples<TypeParam>::entries()) {
        std::istringstream stream(golden.bytes);
        double time = 0;
        TypeParam value{};
        metaDataRead<TypeParam>(stream, &time, &value, this->version);
        EXPECT_EQ(value, golden.value);
        EXPECT_EQ(time, this->timeOf(1.5));
        EXPECT_EQ(stream.tellg(), std::streampos(static_cast<std::streamoff>(golden.bytes.size())));
    }
}

TYPED_TEST(ValueTypes, AStreamFileIsItsHeaderAndEntries) {
    const TemporaryFolder folder;
    MetaDataWriter<TypeParam, int, int> writer;
    writer.init(folder / "Stream.dat", this->type, this->version);
    for (const auto& golden : Samples<TypeParam>::entries())
        writer.write(1.5, golden.value, false);
    writer.close();
    EXPECT_EQ(contentsOf(folder / "Stream.dat"), this->goldenStream());
}

TYPED_TEST(ValueTypes, AnEmptyStreamDeliversNothing) {
    Delivered<TypeParam> delivered;
    this->parse(this->header(), delivered);
    EXPECT_TRUE(delivered.entries.empty());
}

TYPED_TEST(ValueTypes, AStreamDeliversEveryEntry) {
    Delivered<TypeParam> delivered;
    this->parse(this->goldenStream(), delivered);
    const auto samples = Samples<TypeParam>::entries();
    ASSERT_EQ(delivered.entries.size(), samples.size());
    for (std::size_t i = 0; i < samples.size(); ++i)
        EXPECT_EQ(delivered.entries[i], std::pair(this->timeOf(1.5), samples[i].value));
}

TYPED_TEST(ValueTypes, ManyEntriesInARowComeBack) {
    const auto sample = Samples<TypeParam>::entries().front();
    std::string stream = this->header();
    for (int i = 0; i < 3000; ++i)
        stream += sample.bytes;
    Delivered<TypeParam> delivered;
    this->parse(stream, delivered);
    EXPECT_EQ(delivered.entries.size(), 3000U);
    EXPECT_EQ(delivered.entries.back().second, sample.value);
}

/// Whole entries in front of the cut, and how many bytes of the next one are left.
struct Cut {
    std::size_t whole = 0;
    std::size_t rest = 0;
};

template <class T>
Cut cutAt(std::size_t size) {
    Cut cut{0, size - 24};
    for (const auto& golden : Samples<T>::entries()) {
        if (cut.rest < golden.bytes.size())
            break;
        cut.rest -= golden.bytes.size();
        ++cut.whole;
    }
    return cut;
}

TYPED_TEST(ValueTypes, AStreamCutAnywhereDeliversTheEntriesInFrontOfTheCut) {
    const std::string whole = this->goldenStream();
    const auto samples = Samples<TypeParam>::entries();
    for (std::size_t size = 24; size < whole.size(); ++size) {
        const Cut cut = cutAt<TypeParam>(size);
        Delivered<TypeParam> delivered;
        bool threw = false;
        try {
            this->parse(whole.substr(0, size), delivered);
        } catch (const std::runtime_error&) {
            threw = true;
        }
        if (cut.rest > 0 && cut.rest < Samples<TypeParam>::leadingBytes) {
            EXPECT_TRUE(threw) << size;
        }
        ASSERT_GE(delivered.entries.size(), cut.whole) << size;
        EXPECT_LE(delivered.entries.size(), cut.whole + (cut.rest > 0)) << size;
        for (std::size_t i = 0; i < cut.whole; ++i)
            EXPECT_EQ(delivered.entries[i].second, samples[i].value) << size;
    }
}

TYPED_TEST(ValueTypes, TheSizeInTheHeaderIsThatOfAnEntry) {
    EXPECT_EQ(metaDataFixedEntrySize<TypeParam>(), Samples<TypeParam>::fixedEntrySize);
}

} // namespace

} // namespace ZULMetaData
