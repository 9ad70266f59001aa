#include "ZULMetaDataSession/AbandonedSession.h"

#include "Platform/LockFile.h"
#include "ZULMetaDataSession/OrError.h"
#include "ZULMetaDataSession/SessionFolder.h"

#include <filesystem>
#include <system_error>

namespace ZULMetaData {

AbandonedSession::AbandonedSession(const FileLocation& folder) : folder_(folder) {
    const std::string name = utf8Path(folder);
    if (!detail::orError(name, [&] { return std::filesystem::is_directory(folder); }))
        throw Error(name, "is no folder, so it holds no session");
    if (LockFile::stateOf(detail::lockFileIn(folder)) == LockFile::State::Held)
        throw Error(name, "is still in use; finish the recording first");
    streams_ = detail::streamsIn(folder);
}

std::optional<double> AbandonedSession::lastTime() const {
    std::optional<double> last;
    for (const SessionStream& stream : streams_)
        if (stream.lastTime && !(last >= stream.lastTime))
            last = stream.lastTime;
    return last;
}

AttachResult AbandonedSession::saveInto(const FileLocation& movie, const std::string& creatorName,
                                        const std::string& creatorVersion, SafeMovieSave::FragmentIndex index) const {
    AttachResult saved = detail::saveFolder(folder_, movie, creatorName, creatorVersion, index);
    std::error_code isStillFound;
    std::filesystem::remove(detail::lockFileIn(folder_), isStillFound);
    return saved;
}

void AbandonedSession::removeFiles() const {
    detail::removeSession(folder_);
}

} // namespace ZULMetaData
