// SPDX-License-Identifier: Apache-2.0
#include <gnutls/x509.h>

#include "Fuzz/Fuzz.h"
#include "Trust/Manifest.h"
#include "Trust/Refusal.h"
#include "Trust/Signature.h"

namespace {

/// Of the key that has made the seeds and is no more.
constexpr char kCertificate[] =
    "-----BEGIN CERTIFICATE-----\n"
    "MIIBdTCCARugAwIBAgIULM6Y/mrGwLiq49kMUz+18UQRDqwwCgYIKoZIzj0EAwIw\n"
    "DzENMAsGA1UEAwwEYWNtZTAgFw0yNjExMjMwMDIyNDhaGA8yMTI2MTAzMDAwMjI0\n"
    "OFowDzENMAsGA1UEAwwEYWNtZTBZMBMGByqGSM49AgEGCCqGSM49AwEHA0IABF7B\n"
    "qj2cdhah6HS0KNOn6GcoUoj1P3yH9ytdEfYtuLV2NK6cF2e43yRQbkcw2DgfMTfC\n"
    "bi4j92sznc3iWdiGNQijUzBRMB0GA1UdDgQWBBTO6zGEzutFXPP7P4C91TfSmPDQ\n"
    "DDAfBgNVHSMEGDAWgBTO6zGEzutFXPP7P4C91TfSmPDQDDAPBgNVHRMBAf8EBTAD\n"
    "AQH/MAoGCCqGSM49BAMCA0gAMEUCIFtC4OxTWm0TboE0vY9mkZtuGWiG8T+FmTVN\n"
    "r5GIVhXqAiEAr677Wu9Zh0GNzzZXodaUFiDqwhQKNj/Ww2ibZREQqSY=\n"
    "-----END CERTIFICATE-----\n";

constexpr std::string_view kSigned = "what is written to the flash";
constexpr std::string_view kNeverSigned = "what nobody has ever signed.";

std::vector<trust::Key> trustedKeys() {
    std::string text = kCertificate;
    const gnutls_datum_t encoded{reinterpret_cast<unsigned char*>(text.data()),
                                 static_cast<unsigned int>(text.size())};
    gnutls_x509_crt_t certificate = nullptr;
    require(gnutls_x509_crt_init(&certificate) == 0);
    require(gnutls_x509_crt_import(certificate, &encoded, GNUTLS_X509_FMT_PEM) == 0);
    std::vector<trust::Key> keys;
    keys.push_back({"acme", trust::Certificate(certificate)});
    return keys;
}

bool isTrusted(const std::string& signature, std::string_view content) try {
    static const std::vector<trust::Key> keys = trustedKeys();
    constexpr std::time_t kLater = 1'800'000'000;
    return trust::verifySignature(trust::bytesOf(signature), trust::bytesOf(content), keys, kLater,
                                  "fuzz.p7s") == "acme";
} catch (const trust::Refusal& refusal) {
    require(std::string_view(refusal.what()).starts_with("fuzz.p7s") &&
            core::findReason(refusal.reason()) != nullptr);
    return false;
}

void readManifest(const std::string& text) try {
    const trust::Manifest manifest = trust::parseManifest(text, "fuzz.toml");
    require(!manifest.devices.empty() && manifest.sha256.size() == 64);
    trust::requireManifestFor(manifest, {"/port.rom", trust::bytesOf(kSigned), "", {{0x8086, 0x10fb, 0, 0}}},
                              "fuzz.toml");
    require(manifest.name == "port.rom" && manifest.size == kSigned.size());
} catch (const trust::Refusal& refusal) {
    require(std::string_view(refusal.what()).starts_with("fuzz.toml"));
}

}  // namespace

void fuzz(const std::string& bytes) {
    isTrusted(bytes, kSigned);
    require(!isTrusted(bytes, kNeverSigned));
    readManifest(bytes);
}
