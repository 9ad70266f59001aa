// An application in which the library's names are taken: by the macros of Xlib, by global types, and by headers in
// folders of its own. Every installed header is compiled here after all of those.

#include <X11/Xlib.h>
#include <X11/Xutil.h>

// The application's own, not the library's: the application's folder is searched first.
#include "Platform/FileLocation.h"
#include "Platform/Image.h"
#include "Platform/ProcessInfo.h"
#include "SharedDependencies/Callback.h"
#include "SharedDependencies/CreatorAttributes.h"
#include "SharedDependencies/EndianFile.h"
#include "SharedDependencies/Export.h"
#include "SharedDependencies/ZCAPHeader.h"

#if !defined(APPLICATION_HAS_FILE_LOCATION) || !defined(APPLICATION_HAS_IMAGE) ||                                      \
    !defined(APPLICATION_HAS_PROCESS_INFO) || !defined(APPLICATION_HAS_CALLBACK) ||                                    \
    !defined(APPLICATION_HAS_CREATOR_ATTRIBUTES) || !defined(APPLICATION_HAS_ENDIAN_FILE) ||                           \
    !defined(APPLICATION_HAS_EXPORT) || !defined(APPLICATION_HAS_ZCAPHEADER)
#error "the application does not get its own headers"
#endif

struct Point {
    double x, y;
};
struct Rect {
    Point origin;
    struct {
        double width, height;
    } size;
};
struct Image {
    int name;
};
struct Record {
    int number;
};

#include "ZULMetaDataBridge/ZULMetaDataForward.h"

#include "installed_headers.h" // after the declarations, which must agree with it

#include <cstdio>
#include <string>

namespace {

/// Returns whether two positions that the application holds in its own type come back as they were written.
bool recordsAndReads(const std::string& file) {
    ZULMetaData::CursorLocationMetaDataWriter writer(file);
    writer.write(Point{640.5, 360}, ZULMetaData::MediaTime(0, 600));
    writer.write(Point{652, 371}, ZULMetaData::MediaTime(300, 600));
    writer.finish();
    ZULMetaData::CursorLocationMetaDataParser parser(file);
    const auto entries = parser.read();
    return writer.isHealthy() && entries->size() == 2 && entries->at(0).get<std::int32_t>("x") == 640 &&
           entries->at(1).get<float>("timestamp") == 0.5f;
}

} // namespace

int main() {
    using namespace ZULMetaData;
    const ::Record record{1};
    const ::Image image{2};
    const ScreenRect rect(::Rect{{1, 2}, {3, 4}});
    const std::string file = "crowded_application.dat";
    const bool fine = recordsAndReads(file) && record.number + image.name == 3 && truncated(rect).height == 4 &&
                      validateRecording(file).damageCount == 0;
    std::remove(file.c_str());
    return fine ? 0 : 1;
}
