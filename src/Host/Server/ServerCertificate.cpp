// SPDX-License-Identifier: Apache-2.0
#include "Host/Server/ServerCertificate.h"

#include <sys/stat.h>

#include <array>
#include <cerrno>
#include <cstring>
#include <ctime>
#include <memory>
#include <stdexcept>
#include <system_error>
#include <utility>

#include "Utils/Os/Linux/linux.h"

namespace host {

namespace {

[[noreturn]] void fail(const std::string& file, const std::string& why) {
    throw std::runtime_error("Cannot use " + file + ": " + why + ". Check tls.certificate and tls.key.");
}

void check(int status, const std::string& file) {
    if (status >= 0) return;
    std::string why = ::gnutls_strerror(status);
    if (why.ends_with('.')) why.pop_back();
    fail(file, why);
}

std::string readPem(const std::string& file) {
    try {
        if (auto text = os::readTextFile(file)) return std::move(*text);
    } catch (const os::UnusableFile& error) {
        fail(file, std::string("it ") + error.what());
    } catch (const std::system_error& error) {
        if (error.code().value() != EACCES) fail(file, error.code().message());
        throw std::runtime_error("Cannot read " + file + ": " + error.code().message() +
                                 ". Run as root, or let the user that runs quenx-cimd read it: chown USER " +
                                 file);
    }
    fail(file, std::strerror(ENOENT));
}

gnutls_datum_t datumOf(std::string& text) {
    return {reinterpret_cast<unsigned char*>(text.data()), static_cast<unsigned int>(text.size())};
}

/// Whoever has the key can pose as this server. A group may have it: some systems keep one for keys.
void requireNotPublic(const std::string& file) {
    struct stat status {};
    if (::stat(file.c_str(), &status) != 0 || (status.st_mode & (S_IROTH | S_IWOTH)) == 0) return;
    throw std::runtime_error(file + ": everybody may read or change this private key. Run: chmod o= " + file +
                             ", and replace the key if others use this machine.");
}

std::string dateOf(std::time_t time) {
    std::tm utc{};
    std::array<char, sizeof "9999-12-31"> text{};
    if (::gmtime_r(&time, &utc) == nullptr) return "?";
    return {text.data(), std::strftime(text.data(), text.size(), "%Y-%m-%d", &utc)};
}

using KeyId = std::array<unsigned char, 64>;

KeyId idOf(gnutls_pubkey_t key, const std::string& file) {
    KeyId id{};
    std::size_t size = id.size();
    check(::gnutls_pubkey_get_key_id(key, GNUTLS_KEYID_USE_SHA256, id.data(), &size), file);
    return id;
}

}  // namespace

// The constructor that it calls first makes a whole object, so the destructor runs when a step fails.
ServerCertificate::ServerCertificate(const std::string& certificateFile, const std::string& keyFile)
    : ServerCertificate() {
    m_file = certificateFile;
    readChain(certificateFile);
    requireNotPublic(keyFile);
    readKey(keyFile);
    checkPair(certificateFile, keyFile);
}

ServerCertificate::~ServerCertificate() {
    for (unsigned int i = 0; i < m_length; ++i)
        ::gnutls_pcert_deinit(&m_chain[i]);
    if (m_key != nullptr) ::gnutls_privkey_deinit(m_key);
}

void ServerCertificate::readChain(const std::string& file) {
    std::string pem = readPem(file);
    const gnutls_datum_t data = datumOf(pem);
    unsigned int count = kMaxCertificates;
    check(::gnutls_pcert_list_import_x509_raw(m_chain, &count, &data, GNUTLS_X509_FMT_PEM, 0), file);
    m_length = count;
}

void ServerCertificate::readKey(const std::string& file) {
    std::string pem = readPem(file);
    const gnutls_datum_t data = datumOf(pem);
    check(::gnutls_privkey_init(&m_key), file);
    const int status = ::gnutls_privkey_import_x509_raw(m_key, &data, GNUTLS_X509_FMT_PEM, nullptr, 0);
    // Freed memory keeps what was in it, and may end up in a core file.
    ::gnutls_memset(pem.data(), 0, pem.size());
    check(status, file);
}

std::string ServerCertificate::warning() const {
    gnutls_x509_crt_t raw = nullptr;
    check(::gnutls_pcert_export_x509(const_cast<gnutls_pcert_st*>(m_chain), &raw), m_file);
    const std::unique_ptr<std::remove_pointer_t<gnutls_x509_crt_t>, decltype(&::gnutls_x509_crt_deinit)> own(
        raw, ::gnutls_x509_crt_deinit);
    const std::time_t now = std::time(nullptr);
    const std::time_t from = ::gnutls_x509_crt_get_activation_time(raw);
    const std::time_t until = ::gnutls_x509_crt_get_expiration_time(raw);
    if (from <= now && now <= until) return "";
    return "The certificate " + m_file +
           (now < from ? " is not valid before " + dateOf(from) : " has expired on " + dateOf(until)) +
           ", so clients refuse it. Set the clock, or replace the certificate.";
}

void ServerCertificate::checkPair(const std::string& certificateFile, const std::string& keyFile) const {
    // GnuTLS itself would find out in the first handshake, and could tell nobody but the client.
    gnutls_pubkey_t own = nullptr;
    check(::gnutls_pubkey_init(&own), keyFile);
    const std::unique_ptr<std::remove_pointer_t<gnutls_pubkey_t>, decltype(&::gnutls_pubkey_deinit)> holder(
        own, ::gnutls_pubkey_deinit);
    check(::gnutls_pubkey_import_privkey(own, m_key, 0, 0), keyFile);
    if (idOf(own, keyFile) != idOf(m_chain[0].pubkey, certificateFile)) {
        fail(keyFile, "it is not the key of the certificate in " + certificateFile);
    }
}

}  // namespace host
