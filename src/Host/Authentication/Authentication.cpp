// SPDX-License-Identifier: Apache-2.0
#include "Host/Authentication/Authentication.h"

#include <gnutls/gnutls.h>

#include <condition_variable>
#include <mutex>

#include "Framework/Model/CimType.h"
#include "Utils/Log.h"

namespace host {

namespace {

/// Password hashes are made to be costly, so a flood of them is kept to a part of the processors.
constexpr unsigned int kChecksAtATime = 2;
constexpr std::chrono::seconds kWaitForCheck{10};

/// The bytes of a base64 text (RFC 4648 4), with or without padding; nothing for any other text.
std::optional<std::string> decodeBase64(std::string text) {
    while (text.size() % 4 != 0)
        text += '=';
    const gnutls_datum_t encoded{reinterpret_cast<unsigned char*>(text.data()),
                                 static_cast<unsigned int>(text.size())};
    gnutls_datum_t decoded{nullptr, 0};
    if (::gnutls_base64_decode2(&encoded, &decoded) != GNUTLS_E_SUCCESS) return std::nullopt;
    std::string bytes(reinterpret_cast<const char*>(decoded.data), decoded.size);
    ::gnutls_memset(decoded.data, 0, decoded.size);
    ::gnutls_free(decoded.data);
    return bytes;
}

/// The credentials in an Authorization header (RFC 7617), split at the first colon. Nothing for another
/// scheme, a broken text, or one with a NUL byte, which the password files of a system cannot hold.
std::optional<Credentials> readBasicHeader(std::string_view header) {
    constexpr std::string_view kScheme = "Basic ";
    if (!core::sameName(header.substr(0, kScheme.size()), kScheme)) return std::nullopt;
    header.remove_prefix(kScheme.size());
    const std::size_t start = header.find_first_not_of(' ');
    if (start == std::string_view::npos) return std::nullopt;
    const std::size_t end = header.find_last_not_of(' ') + 1;
    const std::optional<std::string> decoded = decodeBase64(std::string(header.substr(start, end - start)));
    if (!decoded || decoded->find('\0') != std::string::npos) return std::nullopt;
    const std::size_t colon = decoded->find(':');
    if (colon == std::string::npos) return std::nullopt;
    return Credentials{decoded->substr(0, colon), decoded->substr(colon + 1)};
}

}  // namespace

Authentication::Authentication(std::unique_ptr<PasswordChecker> checker, std::chrono::seconds rememberFor)
    : m_checker(std::move(checker)), m_cache(rememberFor), m_checks(kChecksAtATime) {}

AuthenticationResult Authentication::authenticate(const std::optional<std::string>& header,
                                                  const std::string& address) {
    const auto credentials = header ? readBasicHeader(*header) : std::nullopt;
    if (!credentials) return {AuthenticationOutcome::Missing, {}};
    const auto known = m_cache.find(*credentials, FailureDelays::keyOf(address));
    // If somebody guesses passwords, other users of the same address must still get in.
    if (!known && !waitForTurn(address)) return {AuthenticationOutcome::Busy, {}};
    std::optional<User> user;
    if (known && known->isFresh) {
        user = known->user;
    } else {
        const HeldSlot check(m_checks, kWaitForCheck);
        if (!check) return {AuthenticationOutcome::Busy, {}};
        user = checkNow(*credentials, address);
    }
    if (!user) return {AuthenticationOutcome::Wrong, {}};
    return {user->mayRead ? AuthenticationOutcome::Accepted : AuthenticationOutcome::Forbidden, *user};
}

bool Authentication::waitForTurn(const std::string& address) {
    const auto turn = m_delays.admit(address);
    if (!turn) return false;
    std::mutex mutex;
    std::condition_variable_any turnCame;  // nobody calls it: only the time or the stop ends the wait
    std::unique_lock lock(mutex);
    turnCame.wait_until(lock, m_stop.get_token(), *turn, [] { return false; });
    return !m_stop.stop_requested();
}

std::optional<User> Authentication::checkNow(const Credentials& credentials, const std::string& address) {
    const std::string place = FailureDelays::keyOf(address);
    // Several requests may have come with the same credentials while the first of them was checked.
    const auto known = m_cache.find(credentials, place);
    if (known && known->isFresh) return known->user;
    const std::uint64_t generation = m_cache.generation();
    const std::optional<User> user = m_checker->check(credentials, address);
    if (user) {
        // One who did not have to wait says nothing about the others there.
        if (!known) m_delays.succeeded(address);
        m_cache.remember(credentials, place, *user, generation);
    } else {
        m_cache.forget(credentials, place);
        m_delays.failed(address);
        QUENX_ERROR("wrong user or password \"%s\" from %s", credentials.user.c_str(), address.c_str());
    }
    return user;
}

void Authentication::reload() {
    m_checker->reload();
    m_cache.clear();
}

void Authentication::stop() {
    m_stop.request_stop();
}

}  // namespace host
