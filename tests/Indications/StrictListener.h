// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <gnutls/gnutls.h>

#include <condition_variable>
#include <functional>
#include <future>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

namespace test {

/// What a listener does with one message.
enum class ListenerAnswer { Taken, Error, Nonsense, Nothing, Never, Endless, Redirect };
struct ListenerStep {
    ListenerAnswer answer = ListenerAnswer::Taken;
    int status = 200;
};

/// A listener on loopback that takes only what the strictest listeners take, and answers as a test says.
class StrictListener {
  public:
    using Answer = ListenerAnswer;
    using Step = ListenerStep;

    /// @param script  what to answer to the message of this number, from 0; called on threads of the listener
    /// @param pem     a file with key and certificate, to take nothing but TLS; empty for no TLS
    explicit StrictListener(
        std::function<Step(std::size_t)> script = [](std::size_t) { return Step(); },
        const std::string& pem = {});
    /// Waits for those that connect, and lets go of those that it keeps waiting.
    ~StrictListener();
    StrictListener(const StrictListener&) = delete;
    StrictListener& operator=(const StrictListener&) = delete;

    int port() const { return m_port; }
    std::string url(const std::string& path = "/CIMListener/a") const {
        return (m_credentials == nullptr ? "http" : "https") + ("://127.0.0.1:" + std::to_string(m_port)) +
               path;
    }

    /// The bodies that have come, when there are so many.
    std::vector<std::string> waitFor(std::size_t count);
    /// What was wrong with their headers.
    std::vector<std::string> problems();

  private:
    class Channel;

    void accept();
    void serve(int connection);
    void answer(Channel& channel, const Step& step, const std::string& body);

    const std::function<Step(std::size_t)> m_script;
    gnutls_certificate_credentials_t m_credentials = nullptr;
    int m_socket;
    int m_port = 0;
    std::mutex m_mutex;
    std::condition_variable m_changed;
    std::vector<std::string> m_bodies;
    std::vector<std::string> m_problems;
    bool m_isEnding = false;
    std::vector<std::future<void>> m_serving;  ///< the accepting thread's own
    std::jthread m_accepting;
};

}  // namespace test
