// SPDX-License-Identifier: Apache-2.0
#include "Trust/Signed.h"

#include <cerrno>
#include <cstdint>
#include <new>
#include <system_error>
#include <utility>

#include "Trust/Refusal.h"
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
constexpr const char* kManifestSignature = ".manifest.p7s";

}  // namespace

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

}  // namespace trust
