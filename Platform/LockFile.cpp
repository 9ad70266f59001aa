#include "Platform/LockFile.h"

#include "Platform/FileSystem.h"

#include <cstdlib>
#include <fcntl.h>
#include <string>
#include <sys/file.h>
#include <sys/stat.h>
#include <system_error>

namespace ZULMetaData {

namespace {

/// Returns false if another process has the lock, and if the file system knows no locks.
bool isLockable(int descriptor, int kind) {
    return uninterrupted([=] { return flock(descriptor, kind | LOCK_NB); }) == 0;
}

/// Returns the descriptor of a new file, whose name it completes.
int createdFile(std::string& name) {
    const int descriptor = uninterrupted([&] { return mkostemp(name.data(), O_CLOEXEC); });
    if (descriptor < 0)
        throwSystemError(errno, "cannot be created");
    return descriptor;
}

} // namespace

LockFile::LockFile(const FileLocation& file, std::string_view note) : LockFile(file, note, file.native() + ".XXXXXX") {}

/// Nothing may fail between the creation of the file and `try`: the temporary name would stay.
LockFile::LockFile(const FileLocation& file, std::string_view note, std::string&& temporary)
    : file_(file), descriptor_(createdFile(temporary)) {
    try {
        if (isLockable(descriptor_.number(), LOCK_EX)) // an empty file counts as held
            descriptor_.writeAt(0, {note.data(), note.size()});
        renameWithoutReplacing(temporary, file);
    } catch (...) {
        unlink(temporary.c_str());
        throw;
    }
}

LockFile::State LockFile::stateOf(const FileLocation& file) {
    const Descriptor found(uninterrupted([&] { return open(file.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK); }));
    if (!found.isOpen())
        return errno == ENOENT || errno == ENOTDIR ? State::Absent : State::Held;
    struct stat status {};
    if (fstat(found.number(), &status) != 0 || !S_ISREG(status.st_mode) || status.st_size == 0)
        return State::Held; // an empty one could not be locked, or is about to be replaced
    return isLockable(found.number(), LOCK_SH) ? State::Left : State::Held;
}

void LockFile::remove() {
    unlink(file_.c_str());
}

} // namespace ZULMetaData
