// SPDX-License-Identifier: Apache-2.0
#include "Trust/Signature.h"

#include <gnutls/crypto.h>
#include <gnutls/pkcs7.h>
#include <gnutls/x509.h>

#include <array>
#include <new>
#include <optional>
#include <vector>

#include "Trust/Refusal.h"
#include "Utils/Utils.h"

namespace trust {

namespace {

using core::ReasonId;

/// Nobody needs more, and each may cost a digest of the image.
constexpr int kMostSigners = 16;

gnutls_datum_t datumOf(std::span<const std::uint8_t> bytes) {
    return {const_cast<unsigned char*>(bytes.data()), static_cast<unsigned int>(bytes.size())};
}

std::string_view textOf(const gnutls_datum_t& datum) {
    return {reinterpret_cast<const char*>(datum.data), datum.size};
}

/// "2026-11-22 18:04 UTC"
std::string timeText(std::time_t time) {
    std::tm fields{};
    std::array<char, 64> text{};
    if (::gmtime_r(&time, &fields) == nullptr) return "an unknown time";
    std::strftime(text.data(), text.size(), "%Y-%m-%d %H:%M UTC", &fields);
    return text.data();
}

/// Who has signed, as one of the signers of a message tells it.
class Signer {
  public:
    Signer(gnutls_pkcs7_t message, unsigned int index)
        : m_status(::gnutls_pkcs7_get_signature_info(message, index, &m_info)) {}
    ~Signer() {
        if (m_status >= 0) ::gnutls_pkcs7_signature_info_deinit(&m_info);
    }
    Signer(const Signer&) = delete;
    Signer& operator=(const Signer&) = delete;

    bool isReadable() const { return m_status >= 0; }
    std::time_t time(std::time_t otherwise) const {
        return m_info.signing_time > 0 ? m_info.signing_time : otherwise;
    }

    /// A signer names its certificate by issuer and number, or by the identifier of its key.
    bool has(gnutls_x509_crt_t certificate) const {
        std::array<unsigned char, 256> buffer{};
        std::size_t size = buffer.size();
        const auto is = [&](const gnutls_datum_t& named) {
            return named.size == size && std::equal(buffer.begin(), buffer.begin() + size, named.data);
        };
        if (m_info.issuer_keyid.size != 0)
            return ::gnutls_x509_crt_get_subject_key_id(certificate, buffer.data(), &size, nullptr) == 0 &&
                   is(m_info.issuer_keyid);
        gnutls_datum_t issuer{nullptr, 0};
        if (::gnutls_x509_crt_get_serial(certificate, buffer.data(), &size) != 0 ||
            !is(m_info.signer_serial) || ::gnutls_x509_crt_get_raw_issuer_dn(certificate, &issuer) != 0)
            return false;
        const bool isIssuer = textOf(issuer) == textOf(m_info.issuer_dn);
        ::gnutls_free(issuer.data);
        return isIssuer;
    }

    /// Nothing that can be forged counts: MD5 and SHA-1 do not.
    bool isStrong() const {
        switch (::gnutls_sign_get_hash_algorithm(m_info.algo)) {
            case GNUTLS_DIG_SHA256:
            case GNUTLS_DIG_SHA384:
            case GNUTLS_DIG_SHA512:
            case GNUTLS_DIG_SHA3_256:
            case GNUTLS_DIG_SHA3_384:
            case GNUTLS_DIG_SHA3_512:
                return true;
            default:
                return false;
        }
    }

    /// "RSA-SHA1"
    std::string algorithm() const {
        const char* const name = ::gnutls_sign_get_name(m_info.algo);
        return name == nullptr ? "an unknown algorithm" : name;
    }

    /// What a person needs to find the certificate: "the certificate with the number 01ab of CN=Acme".
    std::string description() const {
        const bool isByKey = m_info.issuer_keyid.size != 0;
        std::string text = isByKey ? "the key with the identifier " : "the certificate with the number ";
        for (const char byte : textOf(isByKey ? m_info.issuer_keyid : m_info.signer_serial))
            text += utils::hexByte(static_cast<unsigned char>(byte));
        std::array<char, 256> name{};
        std::size_t size = name.size();
        if (isByKey || ::gnutls_x509_rdn_get(&m_info.issuer_dn, name.data(), &size) != 0) return text;
        std::string issuer = name.data();
        for (char& character : issuer)
            if (utils::isControl(character)) character = '?';
        return text + " of " + issuer;
    }

  private:
    gnutls_pkcs7_signature_info_st m_info{};
    const int m_status;
};

/// A message in memory.
class Message {
  public:
    Message(std::span<const std::uint8_t> bytes, const std::string& path) : m_path(path) {
        gnutls_pkcs7_t raw = nullptr;
        if (::gnutls_pkcs7_init(&raw) != 0) throw std::bad_alloc();
        m_message.reset(raw);
        const gnutls_datum_t encoded = datumOf(bytes);
        const int status = ::gnutls_pkcs7_import(raw, &encoded, GNUTLS_X509_FMT_DER);
        if (status == GNUTLS_E_MEMORY_ERROR) throw std::bad_alloc();
        m_signers = status < 0 ? status : ::gnutls_pkcs7_get_signature_count(raw);
        if (m_signers <= 0)
            throw Refusal(ReasonId::SignatureWrong, path +
                                                        " is no signature: it has to be CMS in DER, such as "
                                                        "\"openssl cms -sign -binary -outform DER\" makes");
        if (m_signers > kMostSigners)
            throw Refusal(ReasonId::SignatureWrong, path + " has more than 16 signers; use fewer");
    }

    int signers() const { return m_signers; }
    gnutls_pkcs7_t handle() const { return m_message.get(); }

    /// Why this signer does not vouch for the content; nothing when it does.
    std::optional<Refusal> problemOf(unsigned int index, const Signer& signer, const Key& key,
                                     const gnutls_datum_t& content, std::time_t now) const {
        const std::string by = m_path + ", signed with the key \"" + key.name + "\": ";
        if (!signer.isStrong())
            return Refusal(ReasonId::SignatureWrong,
                           by + signer.algorithm() + " is too weak; sign with SHA-256 or a stronger digest");
        // They are judged by the time of today, which is another question than whether it was valid then.
        constexpr unsigned int kFlags =
            GNUTLS_VERIFY_DISABLE_TIME_CHECKS | GNUTLS_VERIFY_DISABLE_TRUSTED_TIME_CHECKS;
        const int status =
            ::gnutls_pkcs7_verify_direct(m_message.get(), key.certificate.get(), index, &content, kFlags);
        if (status < 0)
            return Refusal(ReasonId::SignatureWrong, by + "it is not the signature of this content (" +
                                                         ::gnutls_strerror(status) +
                                                         "); get image and signature anew from their source");
        return whetherValid(key, signer.time(now), by);
    }

  private:
    static std::optional<Refusal> whetherValid(const Key& key, std::time_t signing, const std::string& by) {
        const std::time_t from = ::gnutls_x509_crt_get_activation_time(key.certificate.get());
        const std::time_t until = ::gnutls_x509_crt_get_expiration_time(key.certificate.get());
        const bool isOpenEnded = until == static_cast<std::time_t>(-1);
        if (from != static_cast<std::time_t>(-1) && from <= signing && (isOpenEnded || signing <= until))
            return std::nullopt;
        return Refusal(ReasonId::CertificateNotValid, by + "its certificate is valid from " + timeText(from) +
                                                          " to " + timeText(until) +
                                                          ", and the signature is of " + timeText(signing));
    }

    struct Free {
        void operator()(gnutls_pkcs7_t message) const { ::gnutls_pkcs7_deinit(message); }
    };
    std::unique_ptr<std::remove_pointer_t<gnutls_pkcs7_t>, Free> m_message;
    const std::string& m_path;
    int m_signers = 0;
};

}  // namespace

std::string verifySignature(std::span<const std::uint8_t> signature, std::span<const std::uint8_t> content,
                            std::span<const Key> keys, std::time_t now, const std::string& path) {
    // GnuTLS would take nothing for the wish to verify what the message itself may have brought along.
    if (content.empty())
        throw Refusal(ReasonId::SignatureWrong,
                      path + ": there is nothing that it could be the signature of");
    const Message message(signature, path);
    const gnutls_datum_t signedContent = datumOf(content);
    std::optional<Refusal> problem;
    std::string strangers;
    for (unsigned int i = 0; i < static_cast<unsigned int>(message.signers()); ++i) {
        const Signer signer(message.handle(), i);
        if (!signer.isReadable()) continue;
        bool isKnown = false;
        for (const Key& key : keys) {
            if (!signer.has(key.certificate.get())) continue;
            isKnown = true;
            const auto found = message.problemOf(i, signer, key, signedContent, now);
            if (!found) return key.name;
            if (!problem) problem = found;
        }
        if (!isKnown) strangers += (strangers.empty() ? "" : ", ") + signer.description();
    }
    if (problem) throw *problem;
    if (strangers.empty())
        throw Refusal(ReasonId::SignatureWrong, path + ": no signer can be read; sign anew");
    throw Refusal(ReasonId::KeyUnknown,
                  path + ": it was made with " + strangers + ", which is not among the trusted keys");
}

}  // namespace trust
