#pragma once

// Failures of files as the errors of this layer.

#include "ZULMetaDataBridge/Source/FileError.h"
#include "ZULMetaDataBridge/Source/SafeMovieSave.h"
#include "ZULMetaDataSession/Error.h"

#include <filesystem>
#include <string>
#include <system_error>

namespace ZULMetaData::detail {

/// Runs `work` and returns what it returns. What it throws about files becomes an `Error` about `name`, unless it names
/// a file itself.
template <class Work>
auto orError(const std::string& name, Work work) {
    try {
        return work();
    } catch (const SaveError& error) {
        throw Error(error.file(), error.sentence());
    } catch (const FileError& error) {
        throw Error(error.file(), error.sentence(), error.code());
    } catch (const std::filesystem::filesystem_error& error) { // whose text repeats the names of files
        throw Error(name, error.code().message(), error.code());
    } catch (const std::system_error& error) {
        throw Error(name, error.what(), error.code());
    }
}

} // namespace ZULMetaData::detail
