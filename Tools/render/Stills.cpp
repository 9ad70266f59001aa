#include "Tools/render/Stills.h"

#include "Tools/render/Canvas.h"
#include "Tools/zulm/Failure.h"
#include "Tools/zulm/OutputFile.h"

namespace Render {

void writePng(const YuvPicture& picture, const std::string& path, const std::string& recording, bool force) {
    std::vector<std::uint32_t> pixels = rgbOf(picture);
    void* bytes = pixels.data();
    const SurfacePointer surface(cairo_image_surface_create_for_data(static_cast<unsigned char*>(bytes),
                                                                     CAIRO_FORMAT_RGB24, picture.width(),
                                                                     picture.height(), picture.width() * 4));
    std::string file;
    const auto append = [](void* to, const unsigned char* data, unsigned size) {
        for (const unsigned char* byte = data; byte != data + size; ++byte)
            static_cast<std::string*>(to)->push_back(static_cast<char>(*byte));
        return CAIRO_STATUS_SUCCESS;
    };
    if (cairo_surface_write_to_png_stream(surface.get(), append, &file) != CAIRO_STATUS_SUCCESS)
        throw Zulm::Failure(path + ": the picture cannot be encoded");
    Zulm::writeWholeFile(path, file, {recording}, force);
}

} // namespace Render
