#include "Tools/render/Stills.h"

#include "Tools/render/Canvas.h"
#include "Tools/zulm/Failure.h"
#include "Tools/zulm/FileAccess.h"
#include "Tools/zulm/OutputFile.h"

#include <filesystem>
#include <system_error>

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

WrittenFiles::WrittenFiles(const std::string& folder)
    : folder_(folder), isNewFolder_(!std::filesystem::exists(folder)) {
    Zulm::createFolder(folder);
}

WrittenFiles::~WrittenFiles() {
    if (isKept_)
        return;
    std::error_code ignored;
    for (const std::string& path : paths_)
        std::filesystem::remove(path, ignored);
    if (isNewFolder_)
        std::filesystem::remove(folder_, ignored); // does nothing if somebody put a file into it
}

} // namespace Render
