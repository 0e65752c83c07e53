// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <memory>
#include <string>

#include "Control/CurlLibrary.h"
#include "Indications/Delivery/AddressPolicy.h"
#include "Indications/Delivery/Queue.h"

namespace indications {

/// One try to bring one message to one listener. Used by one thread.
class Transfer {
  public:
    /// Throws std::bad_alloc.
    Transfer(const std::string& url, const AddressPolicy& policy, std::string body,
             const DeliverySettings& settings);
    Transfer(const Transfer&) = delete;
    Transfer& operator=(const Transfer&) = delete;

    CURL* handle() const { return m_curl.get(); }

    /// What became of it, and what went wrong, for the log.
    struct Result {
        Outcome outcome;
        std::string problem;
    };
    /// @param code  how the transfer ended
    Result result(CURLcode code) const;
    /// To which it went, once it has ended; empty where there was no connection.
    std::string address() const;

  private:
    template <class Value>
    void set(CURLoption option, Value value);
    void setLimits(const DeliverySettings& settings);

    static curl_socket_t openSocket(void* transfer, curlsocktype purpose, curl_sockaddr* address) noexcept;
    static std::size_t takeAnswer(char* bytes, std::size_t size, std::size_t count, void* transfer) noexcept;
    Result resultOfAnswer() const;

    const AddressPolicy m_policy;
    const std::string m_body;
    std::string m_answer;
    bool m_isAllowed = false;  ///< an address of the name
    bool m_isDenied = false;   ///< another one, or the same   ///< the address, by the policy
    bool m_isTooLong = false;  ///< the answer
    std::array<char, CURL_ERROR_SIZE> m_error{};
    std::unique_ptr<CURL, decltype(control::CurlLibrary::easyCleanup)> m_curl;
    std::unique_ptr<curl_slist, decltype(control::CurlLibrary::slistFreeAll)> m_headers;
};

}  // namespace indications
