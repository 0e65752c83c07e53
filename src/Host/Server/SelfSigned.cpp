// SPDX-License-Identifier: Apache-2.0
// Making a key and a self-signed certificate.
#include <fcntl.h>
#include <gnutls/crypto.h>
#include <gnutls/x509.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <ctime>
#include <filesystem>
#include <stdexcept>

#include "Host/Server/ServerCertificate.h"
#include "Utils/Os/Linux/linux.h"

namespace host {

namespace {

namespace fs = std::filesystem;

constexpr std::time_t kDay = std::time_t{24} * 60 * 60;
constexpr std::time_t kLifetime = 3650 * kDay;
/// 2025: before there was this program.
constexpr std::time_t kTooEarly = 1735689600;

void check(int status) {
    if (status < 0)
        throw std::runtime_error(std::string("Cannot make a certificate: ") + ::gnutls_strerror(status));
}

template <auto Close>
struct Closer {
    template <class Handle>
    void operator()(Handle handle) const {
        Close(handle);
    }
};
using Key =
    std::unique_ptr<std::remove_pointer_t<gnutls_x509_privkey_t>, Closer<::gnutls_x509_privkey_deinit>>;
using Certificate =
    std::unique_ptr<std::remove_pointer_t<gnutls_x509_crt_t>, Closer<::gnutls_x509_crt_deinit>>;

Key makeKey() {
    gnutls_x509_privkey_t raw = nullptr;
    check(::gnutls_x509_privkey_init(&raw));
    Key key(raw);
    // Made in a moment, unlike a key of RSA, and known to every client of TLS 1.2.
    check(::gnutls_x509_privkey_generate(raw, GNUTLS_PK_ECDSA,
                                         GNUTLS_CURVE_TO_BITS(GNUTLS_ECC_CURVE_SECP256R1), 0));
    return key;
}

void addName(gnutls_x509_crt_t certificate, gnutls_x509_subject_alt_name_t type, std::string_view name) {
    check(::gnutls_x509_crt_set_subject_alt_name(certificate, type, name.data(),
                                                 static_cast<unsigned int>(name.size()), GNUTLS_FSAN_APPEND));
}

void addNames(gnutls_x509_crt_t certificate) {
    const std::string host = os::getHostname();
    check(::gnutls_x509_crt_set_dn_by_oid(certificate, GNUTLS_OID_X520_COMMON_NAME, 0, host.data(),
                                          static_cast<unsigned int>(host.size())));
    addName(certificate, GNUTLS_SAN_DNSNAME, host);
    addName(certificate, GNUTLS_SAN_DNSNAME, "localhost");
    addName(certificate, GNUTLS_SAN_IPADDRESS, std::string_view("\x7F\0\0\1", 4));
    addName(certificate, GNUTLS_SAN_IPADDRESS, std::string_view("\0\0\0\0\0\0\0\0\0\0\0\0\0\0\0\1", 16));
}

void addSerial(gnutls_x509_crt_t certificate) {
    std::array<unsigned char, 16> serial{};
    check(::gnutls_rnd(GNUTLS_RND_NONCE, serial.data(), serial.size()));
    serial[0] &= 0x7FU;  // a positive number (RFC 5280 4.1.2.2)
    check(::gnutls_x509_crt_set_serial(certificate, serial.data(), serial.size()));
}

Certificate makeCertificate(gnutls_x509_privkey_t key) {
    gnutls_x509_crt_t raw = nullptr;
    check(::gnutls_x509_crt_init(&raw));
    Certificate certificate(raw);
    check(::gnutls_x509_crt_set_version(raw, 3));
    addSerial(raw);
    addNames(raw);
    // A day back: a client whose clock is a little behind takes it, too.
    const std::time_t now = std::time(nullptr);
    check(::gnutls_x509_crt_set_activation_time(raw, now - kDay));
    // On a machine that does not know the time yet, it must outlive the day on which it learns that.
    check(::gnutls_x509_crt_set_expiration_time(raw, std::max(now, kTooEarly) + kLifetime));
    check(::gnutls_x509_crt_set_key(raw, key));
    check(::gnutls_x509_crt_set_ca_status(raw, 0));
    check(::gnutls_x509_crt_set_key_usage(raw, GNUTLS_KEY_DIGITAL_SIGNATURE));
    check(::gnutls_x509_crt_set_key_purpose_oid(raw, GNUTLS_KP_TLS_WWW_SERVER, 0));
    check(::gnutls_x509_crt_sign2(raw, raw, key, GNUTLS_DIG_SHA256, 0));
    return certificate;
}

[[noreturn]] void failToWrite(const std::string& path, const std::string& why) {
    throw std::runtime_error("Cannot write " + path + ": " + why +
                             ". Run as root, or set tls.certificate and tls.key to files that exist.");
}

void writeFile(const std::string& path, const gnutls_datum_t& content, mode_t mode) {
    // The mode from the start, so that nobody can open a key while it is being written.
    const os::Descriptor file(::open(path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, mode));
    if (!file.isOpen()) failToWrite(path, std::strerror(errno));
    const ssize_t written = ::write(file.number(), content.data, content.size);
    const int error = errno;
    if (written != static_cast<ssize_t>(content.size)) {
        ::unlink(path.c_str());
        failToWrite(path, std::strerror(error));
    }
}

template <class Object, class Export>
void writePem(const std::string& path, const Object& object, Export&& exporter, mode_t mode) {
    gnutls_datum_t pem{nullptr, 0};
    check(exporter(object, GNUTLS_X509_FMT_PEM, &pem));
    const std::unique_ptr<unsigned char, void (*)(void*)> holder(pem.data, ::gnutls_free);
    writeFile(path, pem, mode);
}

/// Nothing for a file that cannot be read or is no certificate, which is not ours then.
Certificate readCertificate(const std::string& file) {
    gnutls_datum_t pem{nullptr, 0};
    gnutls_x509_crt_t raw = nullptr;
    if (::gnutls_load_file(file.c_str(), &pem) != 0 || ::gnutls_x509_crt_init(&raw) != 0) return nullptr;
    const std::unique_ptr<unsigned char, void (*)(void*)> holder(pem.data, ::gnutls_free);
    Certificate certificate(raw);
    return ::gnutls_x509_crt_import(raw, &pem, GNUTLS_X509_FMT_PEM) == 0 ? std::move(certificate) : nullptr;
}

Key readKey(const std::string& file) {
    gnutls_datum_t pem{nullptr, 0};
    check(::gnutls_load_file(file.c_str(), &pem));
    const std::unique_ptr<unsigned char, void (*)(void*)> holder(pem.data, ::gnutls_free);
    gnutls_x509_privkey_t raw = nullptr;
    check(::gnutls_x509_privkey_init(&raw));
    Key key(raw);
    check(::gnutls_x509_privkey_import(raw, &pem, GNUTLS_X509_FMT_PEM));
    return key;
}

bool mayMake(const TlsSettings& settings) {
    const TlsSettings defaults;
    return settings.generate ||
           (settings.certificate == defaults.certificate && settings.key == defaults.key);
}

}  // namespace

bool isCertificateToBeRenewed(const TlsSettings& settings) {
    if (!mayMake(settings)) return false;
    const Certificate certificate = readCertificate(settings.certificate);
    if (!certificate) return false;
    const std::time_t from = ::gnutls_x509_crt_get_activation_time(certificate.get());
    const std::time_t until = ::gnutls_x509_crt_get_expiration_time(certificate.get());
    // Its very lifetime shows that it is one of ours, and not one that the administrator put there.
    // A time before 1970 cannot be read back.
    return (from <= 0 || (from < kTooEarly && until - from == kLifetime + kDay)) &&
           until < std::time(nullptr);
}

bool areTlsFilesToBeMade(const TlsSettings& settings) {
    std::error_code unreadable;  // counts as missing here; reading it says why
    const bool hasCertificate = fs::exists(settings.certificate, unreadable);
    const bool hasKey = fs::exists(settings.key, unreadable);
    if (hasCertificate && hasKey) return false;
    if (mayMake(settings) && !hasCertificate && !hasKey) return true;
    const std::string missing =
        hasCertificate ? "tls.key is " + settings.key : "tls.certificate is " + settings.certificate;
    throw std::runtime_error(missing + ", which does not exist. " +
                             (mayMake(settings)
                                  ? "Restore it, or remove " +
                                        (hasKey ? settings.key : settings.certificate) + " to have both made."
                                  : "Correct the path, or set tls.generate = true to have it made."));
}

bool makeTlsFiles(const TlsSettings& settings) {
    if (isCertificateToBeRenewed(settings)) {
        const Key key = readKey(settings.key);
        const std::string fresh = settings.certificate + ".new";
        ::unlink(fresh.c_str());
        writePem(fresh, makeCertificate(key.get()).get(), ::gnutls_x509_crt_export2, 0644);
        if (::rename(fresh.c_str(), settings.certificate.c_str()) != 0)
            failToWrite(settings.certificate, std::strerror(errno));
        return true;
    }
    if (!areTlsFilesToBeMade(settings)) return false;
    for (const std::string& file : {settings.certificate, settings.key}) {
        std::error_code error;
        const fs::path folder = fs::absolute(file).parent_path();
        fs::create_directories(folder, error);
        if (error) failToWrite(folder.string(), error.message());
    }
    const Key key = makeKey();
    const Certificate certificate = makeCertificate(key.get());
    writePem(settings.key, key.get(), ::gnutls_x509_privkey_export2, 0600);
    writePem(settings.certificate, certificate.get(), ::gnutls_x509_crt_export2, 0644);
    return true;
}

}  // namespace host
