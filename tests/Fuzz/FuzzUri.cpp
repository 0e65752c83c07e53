// SPDX-License-Identifier: Apache-2.0
#include "Fuzz/Fuzz.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Uri.h"

void fuzz(const std::string& text) {
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
}
