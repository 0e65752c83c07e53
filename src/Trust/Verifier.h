// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <ctime>

#include "Framework/Requests/ImageVerifier.h"

namespace trust {

/// Trusts an image for a detached signature (CMS in DER, RFC 5652) by a pinned certificate: the signature of
/// the image (IMAGE.p7s), or that (IMAGE.manifest.p7s) of a manifest for the image (IMAGE.manifest.toml).
/// Where a manifest or its signature lies beside the image it alone counts: what it forbids is not undone by
/// a signature of the image. Keeps nothing between calls. Thread-safe.
class Verifier : public core::ImageVerifier {
  public:
    /// @param clock  what time it is, in seconds since 1970; another one is for tests
    explicit Verifier(std::time_t (*clock)() = systemClock) : m_clock(clock) {}

    core::TrustVerdict verify(const core::ImageToVerify& image) noexcept override;

  private:
    static std::time_t systemClock();
    core::TrustVerdict judge(const core::ImageToVerify& image) const;

    std::time_t (*m_clock)();
};

}  // namespace trust
