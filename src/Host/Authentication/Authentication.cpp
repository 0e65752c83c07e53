// SPDX-License-Identifier: Apache-2.0
#include "Host/Authentication/Authentication.h"

#include <gnutls/gnutls.h>

#include <condition_variable>
#include <mutex>

#include "Framework/Model/CimType.h"
#include "Framework/Requests/Audit.h"
#include "Host/Authentication/ClientAddress.h"
#include "Utils/Log.h"

namespace host {

namespace {

/// No name is longer, and an attacker's must not fill the memory.
constexpr std::size_t kLongestName = 64;

/// The bytes of a base64 text (RFC 4648 4), with or without padding; nothing for any other text.
std::optional<std::string> decodeBase64(std::string text) {
    while (text.size() % 4 != 0)
        text += '=';
    const gnutls_datum_t encoded{reinterpret_cast<unsigned char*>(text.data()),
                                 static_cast<unsigned int>(text.size())};
    gnutls_datum_t decoded{};
    const int outcome = ::gnutls_base64_decode2(&encoded, &decoded);
    // Not the client's fault, who would ask for another password.
    if (outcome == GNUTLS_E_MEMORY_ERROR) throw std::bad_alloc();
    if (outcome != GNUTLS_E_SUCCESS) return std::nullopt;
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

void waitUntil(std::chrono::steady_clock::time_point time, const std::stop_token& stop) {
    std::mutex mutex;
    std::condition_variable_any timeCame;  // nobody calls it: only the time or the stop ends the wait
    std::unique_lock lock(mutex);
    timeCame.wait_until(lock, stop, time, [] { return false; });
}

}  // namespace

HeldSlot::HeldSlot(Slots& slots, std::chrono::milliseconds patience, const std::stop_token& stop)
    : m_slots(slots) {
    constexpr std::chrono::milliseconds kLook(100);  // a semaphore cannot wait for a token
    const auto until = std::chrono::steady_clock::now() + patience;
    while (!m_isHeld && !stop.stop_requested() && std::chrono::steady_clock::now() < until)
        m_isHeld = slots.try_acquire_for(kLook);
}

Authentication::Authentication(std::unique_ptr<PasswordChecker> checker, std::chrono::seconds rememberFor,
                               const LoginPace& pace, std::shared_ptr<AuditTrail> trail)
    : m_checker(std::move(checker)), m_cache(rememberFor), m_trail(std::move(trail)), m_queue(pace) {}

AuthenticationResult Authentication::authenticate(const std::optional<std::string>& header,
                                                  const std::string& address, const std::stop_token& ended) {
    const auto credentials = header ? readBasicHeader(*header) : std::nullopt;
    if (!credentials) return {AuthenticationOutcome::Missing, {}};
    std::optional<Checked> checked;
    try {
        checked = check(*credentials, address, ended);
    } catch (const CheckFailed& error) {
        QUENX_ERROR("cannot check a password: %s", error.what());
    }
    if (!checked) return {AuthenticationOutcome::Busy, {}};
    const auto& user = checked->user;
    if (user && user->mayRead) return {AuthenticationOutcome::Accepted, *user};
    if (user) {
        m_trail->refused(
            {{.principal = credentials->user, .address = address}, "login", "", "denied: not admitted"}, {});
        return {AuthenticationOutcome::Forbidden, *user};
    }
    core::audit({{.principal = credentials->user, .address = address},
                 "login",
                 "",
                 "denied: wrong user or password"});
    waitUntil(checked->mayBeTold, ended);
    return {AuthenticationOutcome::Wrong, {}};
}

std::optional<Authentication::Checked> Authentication::check(const Credentials& credentials,
                                                             const std::string& address,
                                                             const std::stop_token& ended) {
    const std::string place = placeOf(address);
    auto known = m_cache.find(credentials, place);
    if (known && known->isFresh) return Checked{known->user, {}};
    const LoginQueue::Attempt attempt{credentials.user.substr(0, kLongestName), place, known.has_value()};
    LoginQueue::Turn turn(m_queue, attempt, ended);
    if (!turn) return std::nullopt;
    // Several requests may have come with the same credentials while the first of them was checked.
    known = m_cache.find(credentials, place);
    if (known && known->isFresh) return Checked{known->user, {}};
    const std::uint64_t generation = m_cache.generation();
    const auto start = Clock::now();
    const std::optional<User> user = m_checker->check(credentials, address);
    const auto mayBeTold = start + m_queue.answerAfter(Clock::now() - start);
    if (user) {
        turn.succeeded();
        m_cache.remember(credentials, place, *user, generation);
    } else {
        m_cache.forget(credentials, place);
        turn.failed();
    }
    return Checked{user, mayBeTold};
}

void Authentication::reload() {
    m_checker->reload();
    m_cache.expire();
}

}  // namespace host
