// SPDX-License-Identifier: Apache-2.0
#include <string>

#include "Fuzz/Fuzz.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Uri.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string text(data, data + size);
    utils::Uri uri(text);
    const bool hasScheme = uri.getScheme() != utils::Uri::SupportedURISchemes::Unknown;
    require(hasScheme || uri.getSourcePath().empty());
    require(!hasScheme || text.ends_with("//" + uri.getSourcePath()));
    require(!uri.IsUriAccesible() || uri.IsUriSupported());
    if (uri.IsUriAccesible()) {
        const std::string path = uri.getSourcePath();
        require(path.find('\0') == std::string::npos && !os::isThisADir(path));
    }
    // A text that cannot be parsed leaves the path as it was.
    const std::string before = uri.getSourcePath();
    uri.parseUri("no scheme");
    require(uri.getSourcePath() == before && !uri.IsUriSupported());
    return 0;
}
