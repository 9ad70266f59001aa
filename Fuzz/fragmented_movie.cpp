// What a recorder that was killed leaves of its movie: it becomes an ordinary movie, and the same one when it is read
// again.

#include "Fuzz/Target.h"
#include "Tools/record/Failure.h"
#include "Tools/record/FileHandle.h"
#include "Tools/record/FragmentedMovie.h"

#include <fcntl.h>

using namespace Recorder;

namespace {

void makeOrdinary(int file) {
    const FragmentedMovie movie(file, "movie");
    movie.makeOrdinary(file);
    const std::string once = Fuzz::contentsOf(Fuzz::folder() + "/movie.mp4");
    const FragmentedMovie again(file, "movie");
    if (again.frames() != movie.frames() || again.duration() != movie.duration())
        Fuzz::fail("another movie the second time");
    again.makeOrdinary(file);
    if (Fuzz::contentsOf(Fuzz::folder() + "/movie.mp4") != once)
        Fuzz::fail("other bytes the second time");
}

} // namespace

void runTarget(std::string_view bytes) {
    const FileHandle file(open(Fuzz::fileOf("movie.mp4", bytes).c_str(), O_RDWR | O_CLOEXEC));
    try {
        makeOrdinary(file.get());
    } catch (const Failure&) { // the sentence for the user
    }
    if (Fuzz::hasRefusedMemory())
        Fuzz::fail("much memory");
}
