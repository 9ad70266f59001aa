#pragma once

// Animated GIF files with one palette for all frames.

#include "Tools/render/YuvPicture.h"

#include <memory>
#include <string>

namespace Render {

/// Collects the colours of a film from some of its frames.
class GifPalette {
public:
    GifPalette(int width, int height);
    ~GifPalette();
    GifPalette(const GifPalette&) = delete;
    GifPalette& operator=(const GifPalette&) = delete;

    void add(const YuvPicture& picture);

    /// Returns the palette. Once only.
    FramePointer take();

private:
    struct Graph;
    std::unique_ptr<Graph> graph_;
};

class GifWriter {
public:
    /// Writes to `path`; errors call it `name`. Throws `Zulm::Failure`.
    GifWriter(const std::string& path, std::string name, int width, int height, double fps, FramePointer palette);
    ~GifWriter();
    GifWriter(const GifWriter&) = delete;
    GifWriter& operator=(const GifWriter&) = delete;

    void writePicture(const YuvPicture& picture); ///< of the next frame
    void finish();                                ///< makes the file whole

private:
    struct Output;

    void drain();
    void encode(const AVFrame* frame);
    [[noreturn]] void fail(const char* what, int error) const;

    std::string name_;
    double fps_;
    std::unique_ptr<Output> output_;
};

} // namespace Render
