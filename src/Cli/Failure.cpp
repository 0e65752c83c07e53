// SPDX-License-Identifier: Apache-2.0
#include "Cli/Failure.h"

#include <cerrno>
#include <system_error>

namespace cli {

Explanation cannotRead(const std::string& file, int error) {
    Explanation result;
    result.message = "Cannot read " + file + ": " + std::generic_category().message(error) + ".";
    switch (error) {
        case ENOENT:
        case ENOTDIR:
        case ENAMETOOLONG:
            result.advice = "Check the path.";
            result.status = ExitStatus::NotFound;
            break;
        case EACCES:
        case EPERM:
            result.advice = "Check its permissions.";
            break;
        default:
            result.advice = "Check the file and the disk that it is on.";
    }
    return result;
}

}  // namespace cli
