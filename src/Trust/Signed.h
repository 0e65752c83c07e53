// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <string>

namespace trust {

/// The file beside an image that says what is known of it.
inline constexpr const char* kManifest = ".manifest.toml";

/// Which content was signed, and with what.
struct Signed {
    std::string signature;
    std::string path;                     ///< of the signature
    std::optional<std::string> manifest;  ///< nothing where the image itself is signed
};

/// Looks for what lies beside an image: a signed manifest, or else a signature.
/// @throws Refusal  NotSigned where there is neither, or one half of it; SignatureWrong for one that is too
///                  large; FileSystemSilent
Signed findSigned(const std::string& image);

}  // namespace trust
