// SPDX-License-Identifier: Apache-2.0
#include "Trust/Verifier.h"

#include <new>
#include <system_error>

#include "Trust/Keys.h"
#include "Trust/LowestVersions.h"
#include "Trust/Manifest.h"
#include "Trust/Refusal.h"
#include "Trust/Signature.h"
#include "Trust/Signed.h"

namespace trust {

namespace {

using core::ReasonId;

core::TrustVerdict verdictOn(const Refusal& refusal) {
    return {.reason = refusal.reason(), .text = refusal.what()};
}

}  // namespace

std::time_t Verifier::systemClock() {
    return std::time(nullptr);
}

core::TrustVerdict Verifier::judge(const core::ImageToVerify& image) const try {
    const Signed found = findSigned(image.path);
    const std::vector<Key> keys = readKeys(image.keysFolder);
    if (keys.empty())
        throw Refusal(ReasonId::KeyUnknown, "no key is trusted: put the signer's certificate into " +
                                                image.keysFolder +
                                                ", with a name that ends in .pem, .crt or .der");
    const auto content = found.manifest ? bytesOf(*found.manifest) : image.bytes;
    core::TrustVerdict verdict;
    verdict.key = verifySignature(bytesOf(found.signature), content, keys, m_clock(), found.path);
    std::vector<NamedText> versions;
    if (found.manifest) {
        const std::string path = image.path + kManifest;
        const Manifest manifest = parseManifest(*found.manifest, path);
        requireManifestFor(manifest, image, path);
        versions = manifest.versions;
    }
    requireAllowedVersions(image, versions, keys, m_clock());
    return verdict;
} catch (const Refusal& refusal) {
    return verdictOn(refusal);
} catch (const std::system_error& error) {
    return verdictOn(Refusal(ReasonId::NotSigned, image.path + " cannot be verified: " + error.what()));
}

core::TrustVerdict Verifier::verify(const core::ImageToVerify& image) noexcept try {
    return judge(image);
} catch (const std::exception&) {
    return {.reason = ReasonId::NoMemory};
}

}  // namespace trust
