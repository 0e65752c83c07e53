// SPDX-License-Identifier: Apache-2.0
#include <sys/stat.h>

#include <cerrno>
#include <filesystem>
#include <system_error>

#include "Cli/Display/Messages.h"
#include "Cli/Registration/Registration.h"
#include "Utils/Os/Linux/OwnFiles.h"
#include "Utils/Os/Linux/linux.h"

namespace cli {

namespace {

void requireFolder(const std::string& directory) {
    std::error_code error;
    if (std::filesystem::is_directory(directory, error)) return;
    if (error && error != std::errc::no_such_file_or_directory)
        throw CommandError(ExitStatus::WrongUse, "Cannot use " + directory + ": " + error.message() + ".",
                           "Name another folder with --output.");
    const bool isThere = std::filesystem::exists(directory, error);
    throw CommandError(
        ExitStatus::WrongUse,
        isThere ? directory + " is not a folder." : "There is no folder \"" + directory + "\".",
        isThere ? "Name a folder with --output." : "Make it, or name another one with --output.");
}

[[noreturn]] void refuseForeign(const std::string& path) {
    throw CommandError(ExitStatus::Failed,
                       path + " was not written by this program, so it is not replaced. Nothing was written.",
                       "Move it away, or name another folder with --output.");
}

/// The file's text; nothing when there is none.
std::optional<std::string> readOlder(const std::string& path) try {
    struct stat status {};
    if (::lstat(path.c_str(), &status) != 0 && errno == ENOENT) return std::nullopt;
    // A link would be replaced, and not what it leads to.
    if (!S_ISREG(status.st_mode)) refuseForeign(path);
    return os::readTextFile(path);
} catch (const os::UnusableFile&) {
    refuseForeign(path);
} catch (const std::system_error& error) {
    const Explanation why = cannotRead(path, error.code().value());
    throw CommandError(ExitStatus::Failed, why.message, why.advice);
}

}  // namespace

std::vector<std::string> writeFiles(const std::string& directory,
                                    const std::vector<RegistrationFile>& files) {
    requireFolder(directory);
    std::vector<const RegistrationFile*> different;
    for (const RegistrationFile& file : files) {
        const std::string path = (std::filesystem::path(directory) / file.name).string();
        const std::optional<std::string> older = readOlder(path);
        if (older && !file.isOlder(*older)) refuseForeign(path);
        if (older != file.text) different.push_back(&file);
    }
    std::vector<std::string> written;
    for (const RegistrationFile* file : different) {
        try {
            os::replaceFile((std::filesystem::path(directory) / file->name).string(), file->text, 0644);
        } catch (const std::system_error& error) {
            throw CommandError(ExitStatus::Failed, sentence(error.what()),
                               "Name a folder that you may write to with --output.");
        }
        written.push_back(file->name);
    }
    return written;
}

}  // namespace cli
