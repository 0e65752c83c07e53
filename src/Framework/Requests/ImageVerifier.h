// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <cstdint>
#include <mutex>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "Framework/Requests/Reasons.h"
#include "Utils/Export.h"

/// How providers ask whether an image can be trusted. They need nothing but this interface: with which
/// library signatures are verified, is the front's affair.
namespace core {

/// What is to be written, and to what.
struct ImageToVerify {
    std::string path;                     ///< of the file; its signature and manifest lie beside it
    std::span<const std::uint8_t> bytes;  ///< that were read from it, and will be written
    std::string keysFolder;               ///< with the certificates that are trusted
    /// Vendor, device, and those of the subsystem; nothing where the adapter does not tell.
    std::optional<std::array<std::uint16_t, 4>> pciIds;
    /// Where further images lie, whose manifests may tell the lowest version that is allowed; beside the
    /// image's own folder.
    std::vector<std::string> folders = {};
};

/// What came of it.
struct TrustVerdict {
    ReasonId reason = ReasonId::None;  ///< None for an image that is trusted
    std::string text = {};             ///< of one that is not: why, for the log and for users
    std::string key = {};              ///< by which it is trusted: the name of its file, without the ending

    bool isTrusted() const { return reason == ReasonId::None; }
};

/// Judges images by their signatures. Thread-safe.
class QUENX_EXPORT ImageVerifier {
  public:
    ImageVerifier() = default;
    ImageVerifier(const ImageVerifier&) = delete;
    ImageVerifier& operator=(const ImageVerifier&) = delete;
    virtual ~ImageVerifier();

    /// Reads keys, signature and manifest anew. Lets no failure out: it is a verdict, too.
    virtual TrustVerdict verify(const ImageToVerify& image) noexcept = 0;

    /// The verifier of this process; null where no front has installed one. It outlives the providers'
    /// requests.
    static ImageVerifier* installed() noexcept;
};

/// Makes a verifier the one of this process, as long as this lives.
class QUENX_EXPORT InstalledVerifier {
  public:
    explicit InstalledVerifier(ImageVerifier& verifier);
    ~InstalledVerifier();
    InstalledVerifier(const InstalledVerifier&) = delete;
    InstalledVerifier& operator=(const InstalledVerifier&) = delete;
};

/// The verifier of the library for it, trust/libQuenx_Trust.so beside the framework's own, which is loaded
/// when a signature is first asked for.
class QUENX_EXPORT LoadedVerifier : public ImageVerifier {
  public:
    TrustVerdict verify(const ImageToVerify& image) noexcept override;
    /// Loads the library now, so that nothing has to be loaded later. Without it nothing can be verified:
    /// verify() says so.
    void load() noexcept;

  private:
    std::once_flag m_once;
    ImageVerifier* m_verifier = nullptr;  ///< the library's, which is never unloaded
    std::string m_problem;                ///< why there is none
};

}  // namespace core
