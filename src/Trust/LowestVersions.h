// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <ctime>
#include <span>
#include <vector>

#include "Framework/Requests/ImageVerifier.h"
#include "Trust/Keys.h"
#include "Trust/Manifest.h"

namespace trust {

/// Whoever mends a hole says in the manifest of the mended image below which versions nothing may be
/// installed any more. Such a manifest counts as long as it lies in one of the image's folders with its
/// signature, and is for the same device; one that is not trusted says nothing.
/// @param versions  of the image, by its own manifest; what is not named there counts as below
/// @param now       seconds since 1970
/// @throws Refusal  BelowLowestVersion
void requireAllowedVersions(const core::ImageToVerify& image, const std::vector<NamedText>& versions,
                            std::span<const Key> keys, std::time_t now);

}  // namespace trust
