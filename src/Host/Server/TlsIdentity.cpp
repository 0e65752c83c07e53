// SPDX-License-Identifier: Apache-2.0
#include "Host/Server/TlsIdentity.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdint>
#include <cstring>
#include <stdexcept>
#include <vector>

#include "Utils/Os/Linux/linux.h"

namespace host {

namespace {

[[noreturn]] void fail(const std::string& file, const std::string& why) {
    throw std::runtime_error("Cannot use " + file + ": " + why + ". Check tls.certificate and tls.key.");
}

void check(int status, const std::string& file) {
    if (status < 0) fail(file, ::gnutls_strerror(status));
}

std::string readWhole(const std::string& file) {
    const auto bytes = os::readWholeFile(file, SIZE_MAX);
    if (!bytes) fail(file, std::strerror(ENOENT));
    return {bytes->begin(), bytes->end()};
}

gnutls_datum_t datumOf(std::string& text) {
    return {reinterpret_cast<unsigned char*>(text.data()), static_cast<unsigned int>(text.size())};
}

using KeyId = std::array<unsigned char, 64>;

KeyId idOf(gnutls_pubkey_t key, const std::string& file) {
    KeyId id{};
    std::size_t size = id.size();
    check(::gnutls_pubkey_get_key_id(key, GNUTLS_KEYID_USE_SHA256, id.data(), &size), file);
    return id;
}

}  // namespace

TlsIdentity::TlsIdentity(const std::string& certificateFile, const std::string& keyFile) {
    try {
        readCertificates(certificateFile);
        readKey(keyFile);
        checkPair(certificateFile, keyFile);
    } catch (...) {
        release();
        throw;
    }
}

TlsIdentity::~TlsIdentity() {
    release();
}

void TlsIdentity::release() noexcept {
    for (unsigned int i = 0; i < m_count; ++i)
        ::gnutls_pcert_deinit(&m_certificates[i]);
    m_count = 0;
    if (m_key != nullptr) ::gnutls_privkey_deinit(m_key);
    m_key = nullptr;
}

void TlsIdentity::readCertificates(const std::string& file) {
    std::string pem = readWhole(file);
    const gnutls_datum_t data = datumOf(pem);
    unsigned int count = kMostCertificates;
    check(::gnutls_pcert_list_import_x509_raw(m_certificates, &count, &data, GNUTLS_X509_FMT_PEM, 0), file);
    m_count = count;
}

void TlsIdentity::readKey(const std::string& file) {
    std::string pem = readWhole(file);
    const gnutls_datum_t data = datumOf(pem);
    check(::gnutls_privkey_init(&m_key), file);
    const int status = ::gnutls_privkey_import_x509_raw(m_key, &data, GNUTLS_X509_FMT_PEM, nullptr, 0);
    std::fill(pem.begin(), pem.end(), '\0');
    check(status, file);
}

void TlsIdentity::checkPair(const std::string& certificateFile, const std::string& keyFile) const {
    gnutls_pubkey_t own = nullptr;
    check(::gnutls_pubkey_init(&own), keyFile);
    const std::unique_ptr<std::remove_pointer_t<gnutls_pubkey_t>, decltype(&::gnutls_pubkey_deinit)> holder(
        own, ::gnutls_pubkey_deinit);
    check(::gnutls_pubkey_import_privkey(own, m_key, 0, 0), keyFile);
    if (idOf(own, keyFile) != idOf(m_certificates[0].pubkey, certificateFile)) {
        fail(keyFile, "it is not the key of the certificate in " + certificateFile);
    }
}

}  // namespace host
