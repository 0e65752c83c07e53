// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <gnutls/abstract.h>

#include <string>

#include "Host/Settings.h"

namespace host {

/// A certificate chain with its private key, as TLS presents it. Does not change once read.
class ServerCertificate {
  public:
    /// Reads PEM files. Throws std::runtime_error that names the file, what is wrong and what to do, also
    /// when key and certificate do not belong together, or when everybody may read the key.
    ServerCertificate(const std::string& certificateFile, const std::string& keyFile);
    ~ServerCertificate();
    ServerCertificate(const ServerCertificate&) = delete;
    ServerCertificate& operator=(const ServerCertificate&) = delete;

    /// The chain, as GnuTLS wants it.
    gnutls_pcert_st* chain() const { return const_cast<gnutls_pcert_st*>(m_chain); }
    unsigned int length() const { return m_length; }
    gnutls_privkey_t key() const { return m_key; }

    /// What is wrong with the time for which the certificate is valid, and what to do; empty when nothing is.
    std::string warning() const;

  private:
    static constexpr unsigned int kMaxCertificates = 8;

    ServerCertificate() = default;
    void readChain(const std::string& file);
    void readKey(const std::string& file);
    void checkPair(const std::string& certificateFile, const std::string& keyFile) const;

    std::string m_file;
    gnutls_pcert_st m_chain[kMaxCertificates]{};
    unsigned int m_length = 0;
    gnutls_privkey_t m_key = nullptr;
};

/// Whether certificate and key have yet to be made: neither exists, and their paths are the default ones or
/// the settings ask for it. A path of the administrator's own may be misspelt, so nothing is made there
/// unasked. Throws std::runtime_error when a file is missing that will not be made.
bool areTlsFilesToBeMade(const TlsSettings& settings);

/// Whether the certificate was made by makeTlsFiles() while the clock stood in a time long before this
/// program, as it does on a machine whose clock has no battery: it has expired since it was set right.
bool isCertificateToBeRenewed(const TlsSettings& settings);

/// Makes a key (mode 0600) and a self-signed certificate for this machine's names, folder included, where
/// areTlsFilesToBeMade(), and a new certificate for the key that is there where isCertificateToBeRenewed();
/// returns whether it made any. The certificate is good for loopback and the machine's name, for ten years.
/// Throws std::runtime_error.
bool makeTlsFiles(const TlsSettings& settings);

}  // namespace host
