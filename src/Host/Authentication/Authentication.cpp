#include "Host/Authentication/Authentication.h"

#include "Host/Authentication/BasicHeader.h"
#include "Utils/Log.h"

namespace host {

namespace {

/// Password hashes are made to be costly, so a flood of them is kept to a part of the processors.
constexpr unsigned int kChecksAtATime = 2;
constexpr std::chrono::seconds kWaitForCheck{10};

}  // namespace

Authentication::Authentication(std::unique_ptr<PasswordChecker> checker, std::chrono::seconds rememberFor)
    : m_checker(std::move(checker)), m_cache(rememberFor), m_checks(kChecksAtATime) {}

AuthenticationResult Authentication::authenticate(const std::optional<std::string>& header,
                                                  const std::string& address) {
    const auto credentials = header ? readBasicHeader(*header) : std::nullopt;
    if (!credentials) return {AuthenticationOutcome::Missing, {}};
    std::optional<Identity> identity = m_cache.find(*credentials, FailureDelays::keyOf(address));
    if (!identity) {
        // Whoever guesses passwords shall not keep those out who share the address and know theirs.
        if (!m_cache.knows(*credentials, FailureDelays::keyOf(address)) && !waitForTurn(address))
            return {AuthenticationOutcome::Busy, {}};
        const Slots::Use check(m_checks, kWaitForCheck);
        if (!check) return {AuthenticationOutcome::Busy, {}};
        identity = checkNow(*credentials, address);
    }
    if (!identity) return {AuthenticationOutcome::Wrong, {}};
    return {identity->mayRead ? AuthenticationOutcome::Accepted : AuthenticationOutcome::Forbidden,
            *identity};
}

bool Authentication::waitForTurn(const std::string& address) {
    const auto turn = m_delays.admit(address);
    return turn && m_stop.sleepUntil(*turn);
}

std::optional<Identity> Authentication::checkNow(const Credentials& credentials, const std::string& address) {
    // Several requests may have come with the same credentials while the first of them was checked.
    const std::string place = FailureDelays::keyOf(address);
    std::optional<Identity> identity = m_cache.find(credentials, place);
    if (identity) return identity;
    const std::uint64_t generation = m_cache.generation();
    identity = m_checker->check(credentials, address);
    if (identity) {
        // One who did not have to wait says nothing about the others there.
        if (!m_cache.knows(credentials, place)) m_delays.succeeded(address);
        m_cache.remember(credentials, place, *identity, generation);
    } else {
        m_cache.forget(credentials, place);
        m_delays.failed(address);
        QUENX_ERROR("wrong user or password \"%s\" from %s", credentials.user.c_str(), address.c_str());
    }
    return identity;
}

void Authentication::reload() {
    m_checker->reload();
    m_cache.clear();
}

void Authentication::stop() {
    m_stop.stop();
}

}  // namespace host
