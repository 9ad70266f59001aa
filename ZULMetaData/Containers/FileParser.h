#pragma once

// A parser over a file of its own.

#include "ZULMetaData/FileInputBuffer.h"
#include "ZULMetaData/ZULMMetaDataParser.h"

#include <fstream>
#include <string>

namespace ZULMetaData::detail {

/// Finds nothing before it scans.
class FileParser : public MetaDataParser {
public:
    FileParser(const std::string& path, StreamType type) : type_(type), buffer_(*file_.rdbuf()) {
        stream().rdbuf(&buffer_);
        fileOpen(file_, path.c_str(), std::ios_base::in | std::ios_base::binary);
    }

    bool isOpen() const { return file_.is_open(); }

    StreamType getStreamType() const override { return type_; }
    std::istream& getStream() override { return file_; }
    void close() override {
        file_.close();
        buffer_.forget();
    }

protected:
    void setStreamType(StreamType type) { type_ = type; }

private:
    /// Only as such can it be given another buffer.
    std::istream& stream() { return file_; }

    StreamType type_;
    std::ifstream file_;
    FileInputBuffer buffer_;
};

/// A parser over a stream of the caller.
class StreamParser : public MetaDataParser {
public:
    StreamParser(std::istream& stream, StreamType type) : stream_(stream), type_(type) {}

    StreamType getStreamType() const override { return type_; }
    std::istream& getStream() override { return stream_; }
    void close() override {}

private:
    std::istream& stream_;
    StreamType type_;
};

} // namespace ZULMetaData::detail
