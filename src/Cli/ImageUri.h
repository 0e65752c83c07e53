// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace cli {

/// An image as a user names it, made a URI: a text with a scheme ("file:///x", "http://x") stays as it is,
/// all else is the path of a file, relative to the working directory, and becomes a file URI. Nothing is
/// percent-encoded: the service does not decode.
std::string imageUri(const std::string& image);

/// The path in a file URI; nothing for any other scheme.
std::optional<std::string> localPath(std::string_view uri);

/// The scheme of a URI in lower case; empty when there is none.
std::string uriScheme(std::string_view uri);

}  // namespace cli
