// SPDX-License-Identifier: Apache-2.0
#include "Cli/ImageUri.h"

#include <algorithm>
#include <filesystem>

#include "Utils/Utils.h"

namespace cli {

namespace {

constexpr std::string_view AUTHORITY = "//";

bool isSchemeCharacter(char c) {
    return utils::isLetter(c) || utils::isDigit(c) || c == '+' || c == '-' || c == '.';
}

}  // namespace

std::string uriScheme(std::string_view uri) {
    const auto colon = uri.find(':');
    if (colon == std::string_view::npos || colon == 0 || !utils::isLetter(uri.front())) return {};
    const std::string scheme = utils::lowerCase(uri.substr(0, colon));
    if (!std::all_of(scheme.begin(), scheme.end(), isSchemeCharacter)) return {};
    return scheme;
}

std::string imageUri(const std::string& image) {
    const std::string scheme = uriScheme(image);
    // "file:" is a URI even when badly written; other colons without "//" are common in file names.
    const bool isUri =
        scheme == "file" || (!scheme.empty() && image.substr(scheme.size() + 1).starts_with(AUTHORITY));
    if (isUri) return image;
    return "file://" + std::filesystem::absolute(image).string();
}

std::optional<std::string> localPath(std::string_view uri) {
    const std::string scheme = uriScheme(uri);
    if (scheme != "file") return std::nullopt;
    const std::string_view rest = uri.substr(scheme.size() + 1);
    if (!rest.starts_with(AUTHORITY)) return std::nullopt;
    return std::string(rest.substr(AUTHORITY.size()));
}

}  // namespace cli
