// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <ctime>
#include <span>
#include <string>
#include <string_view>

#include "Trust/Keys.h"

namespace trust {

inline std::span<const std::uint8_t> bytesOf(std::string_view text) {
    return {reinterpret_cast<const std::uint8_t*>(text.data()), text.size()};
}

/// Verifies a detached signature: CMS SignedData (RFC 5652) in DER, with SHA-256 or a stronger digest. Of
/// several signers one that is trusted is enough. A certificate has to be valid at the time that the signer
/// has signed along (signingTime), so that images outlive it; where there is none, now.
/// @param now   seconds since 1970
/// @param path  of the signature, for the texts
/// @return the name of the key
/// @throws Refusal  SignatureWrong, KeyUnknown, CertificateNotValid
std::string verifySignature(std::span<const std::uint8_t> signature, std::span<const std::uint8_t> content,
                            std::span<const Key> keys, std::time_t now, const std::string& path);

}  // namespace trust
