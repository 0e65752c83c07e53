// SPDX-License-Identifier: Apache-2.0
#include "Trust/Verifier.h"

#include <cerrno>
#include <new>
#include <optional>
#include <system_error>

#include "Trust/Keys.h"
#include "Trust/Manifest.h"
#include "Trust/Refusal.h"
#include "Trust/Signature.h"
#include "Utils/Os/Linux/PatientReading.h"

namespace trust {

namespace {

using core::ReasonId;

/// A signature has one or two KiB, a manifest less.
constexpr std::int64_t kLargest = 64 << 10;

/// What lies beside an image. Reading it is as patient as reading the image is: both are on one file system.
class Neighbours {
  public:
    explicit Neighbours(const std::string& image) : m_image(image) {}

    /// The text of a file; nothing when there is none.
    std::optional<std::string> read(const char* ending) {
        const std::string path = m_image + ending;
        errno = 0;  // it stays so for a FIFO, which can be looked at, but is not opened
        const auto look = os::lookAtFile(path, kLargest, m_patience);
        const int error = errno;
        if (!look) refuse(ReasonId::FileSystemSilent, path, "its file system does not answer");
        if (look->kind == os::FileKind::CannotBeOpened && error == ENOENT) return std::nullopt;
        if (look->kind != os::FileKind::Regular)
            refuse(ReasonId::NotSigned, path,
                   error == 0 ? "it is not a file"
                              : "it cannot be opened: " + std::generic_category().message(error));
        if (look->size > kLargest)
            refuse(ReasonId::SignatureWrong, path,
                   "it is larger than 64 KiB; put a detached signature there");
        if (look->isWithoutMemory) throw std::bad_alloc();
        return std::string(look->bytes.get(), look->bytes.get() + look->count);
    }

    std::string path(const char* ending) const { return m_image + ending; }

  private:
    [[noreturn]] static void refuse(ReasonId reason, const std::string& path, const std::string& what) {
        throw Refusal(reason, path + ": " + what);
    }

    const std::string m_image;
    os::Patience m_patience;
};

constexpr const char* kSignature = ".p7s";
constexpr const char* kManifest = ".manifest.toml";
constexpr const char* kManifestSignature = ".manifest.p7s";

/// Which content was signed, and with what.
struct Signed {
    std::string signature;
    std::string path;                     ///< of the signature
    std::optional<std::string> manifest;  ///< nothing where the image itself is signed
};

Signed findSigned(const std::string& image) {
    Neighbours beside(image);
    std::optional<std::string> manifest = beside.read(kManifest);
    std::optional<std::string> signature = beside.read(kManifestSignature);
    if (manifest && signature) return {*signature, beside.path(kManifestSignature), std::move(manifest)};
    if (manifest)
        throw Refusal(ReasonId::NotSigned, beside.path(kManifest) + " has no signature; put it into " +
                                               beside.path(kManifestSignature));
    if (signature)
        throw Refusal(ReasonId::NotSigned, beside.path(kManifestSignature) + " signs a manifest, and " +
                                               beside.path(kManifest) + " is not there");
    signature = beside.read(kSignature);
    if (signature) return {*signature, beside.path(kSignature), std::nullopt};
    throw Refusal(ReasonId::NotSigned, image + " has no signature; put it into " + beside.path(kSignature) +
                                           ", or put a signed manifest beside the image");
}

std::span<const std::uint8_t> bytesOf(const std::string& text) {
    return {reinterpret_cast<const std::uint8_t*>(text.data()), text.size()};
}

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
    if (!found.manifest) return verdict;
    const std::string path = image.path + kManifest;
    const Manifest manifest = parseManifest(*found.manifest, path);
    requireManifestFor(manifest, image, path);
    verdict.versions = manifest.versions;
    verdict.lowest = manifest.lowest;
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
