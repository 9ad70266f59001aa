// A stream that is appended to a movie: the entries are walked, and what is whole of them is copied.

#include "Fuzz/Target.h"
#include "ZULMetaData/ZULMMetaDataParser.h"

using namespace ZULMetaData;

void runTarget(std::string_view bytes) {
    const std::string movie = Fuzz::fileOf("movie.mp4", {});
    Fuzz::documented([&] {
        MP4MetaData::appendMetaData(movie, {{uuid{}, std::string(bytes)}});
        const std::string appended = Fuzz::contentsOf(movie);
        const std::string copied = appended.size() > 32 ? appended.substr(32) : std::string();
        if (bytes.substr(0, copied.size()) != copied)
            Fuzz::fail("copied is what is not there");
        if (!Util::finalizeAtomsInFile(movie))
            Fuzz::fail("the atom does not fill the file");
    });
    const std::string again = Fuzz::fileOf("movie.mp4", {});
    Fuzz::documented([&] { MP4MetaData::appendMetaDataFiles(again, {Fuzz::fileOf("stream.dat", bytes)}); });
    if (Fuzz::hasRefusedMemory())
        Fuzz::fail("much memory");
}
