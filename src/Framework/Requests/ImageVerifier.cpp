// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/ImageVerifier.h"

#include <dlfcn.h>

#include <atomic>
#include <exception>

#include "Framework/Requests/ProviderSession.h"

namespace core {

namespace {

std::atomic<ImageVerifier*> installedVerifier{nullptr};

}  // namespace

ImageVerifier::~ImageVerifier() = default;

ImageVerifier* ImageVerifier::installed() noexcept {
    return installedVerifier.load(std::memory_order_acquire);
}

InstalledVerifier::InstalledVerifier(ImageVerifier& verifier) {
    installedVerifier.store(&verifier, std::memory_order_release);
}

InstalledVerifier::~InstalledVerifier() {
    installedVerifier.store(nullptr, std::memory_order_release);
}

void LoadedVerifier::load() noexcept try {
    std::call_once(m_once, [this] {
        const LibraryEntry entry("trust/libQuenx_Trust.so", "quenx_imageVerifier");
        m_problem = entry.problem();
        using Verifier = ImageVerifier* (*)();
        if (entry.address() != nullptr) m_verifier = reinterpret_cast<Verifier>(entry.address())();
    });
} catch (const std::exception&) {
    // Without memory it is tried again at the next image.
}

TrustVerdict LoadedVerifier::verify(const ImageToVerify& image) noexcept {
    load();
    if (m_verifier != nullptr) return m_verifier->verify(image);
    try {
        return {ReasonId::NoVerifier, "signatures cannot be verified here: " +
                                          (m_problem.empty() ? "there is no memory" : m_problem)};
    } catch (const std::exception&) {
        return {ReasonId::NoVerifier};
    }
}

}  // namespace core
