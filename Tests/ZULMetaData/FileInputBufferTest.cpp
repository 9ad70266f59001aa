// Reading a file in blocks that grow.

#include "ZULMetaData/FileInputBuffer.h"

#include "Tests/Support/Files.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <fstream>
#include <istream>
#include <random>
#include <string>
#include <vector>

namespace ZULMetaData::Test {

namespace {

std::string randomBytes(std::size_t size) {
    std::string bytes(size, '\0');
    std::mt19937 random(3);
    for (char& byte : bytes)
        byte = static_cast<char>(random());
    return bytes;
}

/// A file read through the buffer.
class BufferedFile {
    std::filebuf file_;
    detail::FileInputBuffer buffer_;

public:
    explicit BufferedFile(const std::string& path) : buffer_(file_) {
        file_.open(path, std::ios_base::in | std::ios_base::binary);
    }

    std::istream stream{&buffer_};

    void close() {
        file_.close();
        buffer_.forget();
    }
};

class FileInputBuffer : public testing::Test {
protected:
    std::string file(const std::string& contents) {
        writeFile(folder_ / "file", contents);
        return folder_ / "file";
    }

    std::string path() const { return folder_ / "file"; }

private:
    TemporaryFolder folder_;
};

std::string readAll(std::istream& stream, std::size_t pieceSize) {
    std::string all;
    std::string piece(pieceSize, '\0');
    while (stream.read(piece.data(), static_cast<std::streamsize>(pieceSize)) || stream.gcount() > 0)
        all.append(piece, 0, static_cast<std::size_t>(stream.gcount()));
    return all;
}

TEST_F(FileInputBuffer, GivesTheBytesOfFilesOfEverySize) {
    for (const std::size_t size : {0U, 1U, 2047U, 2048U, 2049U, 10239U, 10240U, 65536U, 65537U, 300000U}) {
        const std::string bytes = randomBytes(size);
        for (const std::size_t pieceSize : {1U, 7U, 2048U, 65535U, 65536U, 70000U, 400000U}) {
            BufferedFile buffered(file(bytes));
            EXPECT_EQ(readAll(buffered.stream, pieceSize), bytes) << size << " in pieces of " << pieceSize;
            EXPECT_TRUE(buffered.stream.eof());
        }
    }
}

/// What an operation gives, the state behind it, and where the stream then stands.
struct Outcome {
    std::string result;
    std::ios_base::iostate state;
    std::int64_t position;

    friend bool operator==(const Outcome&, const Outcome&) = default;
};

struct Operation {
    std::int64_t kind;
    std::int64_t number;
};

Outcome outcomeOf(std::istream& stream, const Operation& operation) {
    std::string result;
    switch (operation.kind) {
    case 0: stream.seekg(operation.number); break;
    case 1: stream.seekg(-operation.number, std::ios_base::end); break;
    case 2: stream.seekg(operation.number / 2 - 100, std::ios_base::cur); break;
    case 3: result = std::to_string(stream.peek()); break;
    case 4: stream.ignore(operation.number); break;
    case 5: stream.clear(); break;
    default:
        result.resize(static_cast<std::size_t>(operation.number));
        stream.read(result.data(), operation.number);
        result.resize(static_cast<std::size_t>(stream.gcount()));
    }
    const std::ios_base::iostate state = stream.rdstate();
    stream.clear();
    const std::int64_t position = stream.tellg();
    stream.clear(state);
    return {result, state, position};
}

TEST_F(FileInputBuffer, CannotBeToldFromTheBufferOfAFile) {
    std::mt19937 random(11);
    const auto number = [&](std::int64_t below) { return static_cast<std::int64_t>(random()) % below; };
    for (const std::int64_t size : {0, 100, 3000, 200000}) {
        const std::string path = file(randomBytes(static_cast<std::size_t>(size)));
        std::ifstream plain(path, std::ios_base::binary);
        BufferedFile buffered(path);
        for (int i = 0; i < 5000; ++i) {
            const std::int64_t reach = number(3) == 0 ? size + 50 : 3000;
            const Operation operation{number(9), number(reach + 1)};
            const Outcome expected = outcomeOf(plain, operation);
            ASSERT_EQ(outcomeOf(buffered.stream, operation), expected)
                << "operation " << operation.kind << " with " << operation.number << " in a file of " << size;
        }
    }
}

TEST_F(FileInputBuffer, MovesByASingleByte) {
    BufferedFile buffered(file("0123456789"));
    EXPECT_EQ(buffered.stream.get(), '0');
    buffered.stream.seekg(1, std::ios_base::cur);
    EXPECT_EQ(buffered.stream.get(), '2');
    buffered.stream.seekg(-1, std::ios_base::cur);
    EXPECT_EQ(buffered.stream.get(), '2');
}

TEST_F(FileInputBuffer, RefusesPositionsThatNoFileHas) {
    BufferedFile buffered(file("0123456789"));
    EXPECT_FALSE(buffered.stream.seekg(-1));
    buffered.stream.clear();
    EXPECT_FALSE(buffered.stream.seekg(-11, std::ios_base::end));
    buffered.stream.clear();
    EXPECT_TRUE(buffered.stream.seekg(4));
    EXPECT_FALSE(buffered.stream.seekg(INT64_MAX, std::ios_base::cur));
    buffered.stream.clear();
    EXPECT_EQ(buffered.stream.get(), '4');
}

TEST_F(FileInputBuffer, SeesWhatIsWrittenWhileItIsOpen) {
    BufferedFile buffered(file("0123456789"));
    EXPECT_EQ(readAll(buffered.stream, 4), "0123456789");
    std::ofstream(path(), std::ios_base::app | std::ios_base::binary) << "abc";
    buffered.stream.clear();
    EXPECT_EQ(readAll(buffered.stream, 4), "abc");
    std::fstream(path(), std::ios_base::in | std::ios_base::out | std::ios_base::binary) << "XY";
    buffered.stream.clear();
    buffered.stream.seekg(0);
    EXPECT_EQ(readAll(buffered.stream, 4), "XY23456789abc");
}

TEST_F(FileInputBuffer, HasNothingLeftOfAClosedFile) {
    BufferedFile buffered(file("0123456789"));
    EXPECT_EQ(buffered.stream.get(), '0');
    buffered.close();
    EXPECT_EQ(buffered.stream.peek(), std::istream::traits_type::eof());
    buffered.stream.clear();
    EXPECT_FALSE(buffered.stream.seekg(2));
}

TEST_F(FileInputBuffer, TellsASeekThatFailsLateFromTheEndOfTheFile) {
    struct BrokenFile final : std::filebuf {
        bool isBroken = false;
        pos_type seekpos(pos_type position, std::ios_base::openmode mode) override {
            return isBroken ? pos_type(off_type(-1)) : std::filebuf::seekpos(position, mode);
        }
    } broken;
    detail::FileInputBuffer buffer(broken);
    broken.open(file("0123456789"), std::ios_base::in | std::ios_base::binary);
    std::istream stream(&buffer);
    stream.seekg(0, std::ios_base::end);
    stream.seekg(4);
    broken.isBroken = true;
    EXPECT_EQ(stream.get(), std::istream::traits_type::eof());
    EXPECT_TRUE(stream.bad());
}

TEST_F(FileInputBuffer, TellsThatAFolderCannotBeRead) {
    const TemporaryFolder folder;
    BufferedFile buffered(folder.path().string());
    std::ifstream plain(folder.path(), std::ios_base::binary);
    EXPECT_EQ(buffered.stream.get(), plain.get());
    EXPECT_EQ(buffered.stream.rdstate(), plain.rdstate());
}

} // namespace

} // namespace ZULMetaData::Test
