// SPDX-License-Identifier: Apache-2.0
#include "Indications/Delivery/Transfer.h"

#include <sys/socket.h>

#include <new>
#include <utility>

#include "CimXml/Export.h"
#include "CimXml/WireError.h"

namespace indications {

namespace {

using control::curl;

constexpr std::size_t kLongestAnswer = 64 << 10;

/// All that the strictest listeners ask for. One that is not sent stands without a value: libcurl would wait
/// for an answer to Expect, a second each time where a listener does not know it.
constexpr std::array kHeaders = {"Content-Type: application/xml; charset=utf-8", "CIMExport: MethodRequest",
                                 "CIMExportMethod: ExportIndication", "CIMProtocolVersion: 1.0", "Expect:"};

/// Whether another try may help. Most of what a listener refuses it would refuse again.
bool mayPass(long status) {
    return status == 408 || status == 429 || (status >= 500 && status != 501);
}

}  // namespace

template <class Value>
void Transfer::set(CURLoption option, Value value) {
    const CURLcode code = curl().easySetopt(m_curl.get(), option, value);
    // What this library lacks would be missed in silence, such as a check of certificates.
    if (code == CURLE_OUT_OF_MEMORY) throw std::bad_alloc();
    if (code != CURLE_OK) throw std::runtime_error(curl().easyStrerror(code));
}

Transfer::Transfer(const std::string& url, const AddressPolicy& policy, std::string body,
                   const DeliverySettings& settings)
    : m_policy(policy),
      m_body(std::move(body)),
      m_curl(curl().easyInit(), curl().easyCleanup),
      m_headers(nullptr, curl().slistFreeAll) {
    if (m_curl == nullptr) throw std::bad_alloc();
    for (const char* header : kHeaders) {
        curl_slist* const longer = curl().slistAppend(m_headers.get(), header);
        if (longer == nullptr) throw std::bad_alloc();
        static_cast<void>(m_headers.release());
        m_headers.reset(longer);
    }
    set(CURLOPT_URL, url.c_str());
    set(CURLOPT_POST, 1L);
    set(CURLOPT_POSTFIELDS, m_body.c_str());
    set(CURLOPT_POSTFIELDSIZE_LARGE, static_cast<curl_off_t>(m_body.size()));
    set(CURLOPT_HTTPHEADER, m_headers.get());
    set(CURLOPT_ERRORBUFFER, m_error.data());
    set(CURLOPT_WRITEFUNCTION, takeAnswer);
    set(CURLOPT_WRITEDATA, this);
    set(CURLOPT_OPENSOCKETFUNCTION, openSocket);
    set(CURLOPT_OPENSOCKETDATA, this);
    setLimits(settings);
}

void Transfer::setLimits(const DeliverySettings& settings) {
    set(CURLOPT_DEFAULT_PROTOCOL, "http");
    set(CURLOPT_PROTOCOLS_STR, "http,https");
    set(CURLOPT_HTTP_VERSION, static_cast<long>(CURL_HTTP_VERSION_1_1));
    set(CURLOPT_FOLLOWLOCATION, 0L);
    set(CURLOPT_PROXY, "");  // none, whatever the environment says
    set(CURLOPT_DISALLOW_USERNAME_IN_URL, 1L);
    set(CURLOPT_NETRC, static_cast<long>(CURL_NETRC_IGNORED));
    set(CURLOPT_NOSIGNAL, 1L);
    // A name server that does not answer would hold up everybody until the look-up has ended.
    set(CURLOPT_QUICK_EXIT, 1L);
    // A connection that another destination made was looked at with that one's policy.
    set(CURLOPT_FRESH_CONNECT, 1L);
    set(CURLOPT_FORBID_REUSE, 1L);
    set(CURLOPT_CONNECTTIMEOUT_MS, static_cast<long>(settings.connectTime.count()));
    set(CURLOPT_TIMEOUT_MS, static_cast<long>(settings.wholeTime.count()));
    set(CURLOPT_SSLVERSION, static_cast<long>(CURL_SSLVERSION_TLSv1_2));
    set(CURLOPT_SSL_VERIFYPEER, settings.verifies ? 1L : 0L);
    set(CURLOPT_SSL_VERIFYHOST, settings.verifies ? 2L : 0L);
    if (!settings.certificates.empty()) set(CURLOPT_CAINFO, settings.certificates.c_str());
}

curl_socket_t Transfer::openSocket(void* transfer, curlsocktype, curl_sockaddr* address) noexcept {
    auto& self = *static_cast<Transfer*>(transfer);
    if (!self.m_policy.allows(address->addr)) {
        self.m_isDenied = true;
        return CURL_SOCKET_BAD;
    }
    self.m_isAllowed = true;
    return ::socket(address->family, address->socktype | SOCK_CLOEXEC, address->protocol);
}

std::size_t Transfer::takeAnswer(char* bytes, std::size_t size, std::size_t count, void* transfer) noexcept
    try {
    auto& self = *static_cast<Transfer*>(transfer);
    self.m_isTooLong = size * count > kLongestAnswer - self.m_answer.size();
    if (self.m_isTooLong) return 0;
    self.m_answer.append(bytes, size * count);
    return size * count;
} catch (const std::bad_alloc&) {
    return 0;
}

Transfer::Result Transfer::result(CURLcode code) const {
    // One of several addresses may be denied, and the one that is not may be back for another try.
    if (m_isDenied && !m_isAllowed && code != CURLE_OK)
        return {Outcome::Refused, "indications.destinations does not allow its address"};
    if (code != CURLE_OK && !m_isTooLong) {
        const bool isExplained = m_error.front() != '\0';
        return {Outcome::Failed, isExplained ? m_error.data() : curl().easyStrerror(code)};
    }
    return resultOfAnswer();
}

std::string Transfer::address() const {
    const char* address = nullptr;
    curl().easyGetinfo(m_curl.get(), CURLINFO_PRIMARY_IP, &address);
    return address == nullptr ? "" : address;
}

Transfer::Result Transfer::resultOfAnswer() const {
    long status = 0;
    curl().easyGetinfo(m_curl.get(), CURLINFO_RESPONSE_CODE, &status);
    if (status != 200) {
        return {mayPass(status) ? Outcome::Failed : Outcome::Refused,
                "it answers with HTTP status " + std::to_string(status)};
    }
    try {
        const auto error = cimxml::readExportAnswer(m_answer);
        if (!error) return {Outcome::Taken, ""};
        // A listener whose queue is full says so, and will have room again.
        return {Outcome::Failed, "it answers with error " + std::to_string(static_cast<int>(error->status)) +
                                     ": " + error->description};
    } catch (const cimxml::WireError&) {
        // Not in the words of the protocol, but it said that all is well.
        return {Outcome::Taken, ""};
    }
}

}  // namespace indications
