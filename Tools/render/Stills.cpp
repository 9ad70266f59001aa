#include "Tools/render/Stills.h"

#include "Tools/render/Canvas.h"
#include "Tools/zulm/Failure.h"
#include "Tools/zulm/FileAccess.h"
#include "Tools/zulm/OutputFile.h"

#include <fmt/core.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <system_error>

namespace Render {

void writeNew(const std::string& path, const std::string& contents, const std::vector<std::string>& inputs) {
    const Zulm::FileAccess access(path, inputs);
    std::ofstream file = Zulm::openOutput(path, path);
    file.write(contents.data(), static_cast<std::streamsize>(contents.size()));
    file.close();
    if (!file)
        throw Zulm::Failure(fmt::format("{}: cannot be written: {}; is the disk full?", path, std::strerror(errno)));
    access.applyTo(path);
}

void writePng(const YuvPicture& picture, const std::string& path, const std::vector<std::string>& inputs) {
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
        throw Zulm::Failure(path + ": the picture cannot be encoded; try a smaller --size");
    writeNew(path, file, inputs);
}

std::string countText(std::uint64_t count) {
    return fmt::format("{}", count);
}

NewFiles::NewFiles(const std::string& folder) : folder_(folder), isNewFolder_(!std::filesystem::exists(folder)) {
    Zulm::createFolder(folder);
    std::string name = (std::filesystem::path(folder) / ".unfinished.XXXXXX").string();
    if (!mkdtemp(name.data()))
        throw Zulm::Failure(fmt::format("{}: no folder can be created in it: {}", folder, std::strerror(errno)));
    temporary_ = name;
}

NewFiles::~NewFiles() {
    std::error_code ignored;
    std::filesystem::remove_all(temporary_, ignored);
    if (isNewFolder_)
        std::filesystem::remove(folder_, ignored); // does nothing if there are files in it
}

std::string NewFiles::add(const std::string& name) {
    names_.push_back(name);
    return (std::filesystem::path(temporary_) / name).string();
}

void NewFiles::keep() {
    for (const std::string& name : names_) {
        const std::filesystem::path place = std::filesystem::path(folder_) / name;
        std::error_code error;
        std::filesystem::rename(std::filesystem::path(temporary_) / name, place, error);
        if (error)
            throw Zulm::Failure(fmt::format("{}: cannot be put in place: {}", place.string(), error.message()));
    }
}

} // namespace Render
