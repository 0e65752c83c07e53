// SPDX-License-Identifier: Apache-2.0
#include "Host/Server/HttpServer.h"

#include <microhttpd.h>
#include <netinet/in.h>
#include <unistd.h>

#include <cstdarg>
#include <cstdio>
#include <stdexcept>

#include "Host/Server/ConnectionWatch.h"
#include "Host/Server/HttpRequest.h"
#include "Host/Server/LocalSocket.h"
#include "Host/Server/ServerCertificate.h"
#include "Host/Server/SessionTickets.h"
#include "Host/Server/TlsPriorities.h"
#include "Utils/Log.h"

namespace host {

namespace {

/// What the function below shows; old ones live as long as their server.
std::atomic<const ServerCertificate*> currentCertificate{nullptr};

/// GnuTLS asks for each handshake, so a certificate that was renewed is shown without a restart.
int retrieveCertificate(gnutls_session_t, const gnutls_datum_t*, int, const gnutls_pk_algorithm_t*, int,
                        gnutls_pcert_st** chain, unsigned int* length, gnutls_privkey_t* key) {
    const ServerCertificate* certificate = currentCertificate.load();
    if (certificate == nullptr) return -1;  // the handshake fails, the server goes on
    *chain = certificate->chain();
    *length = certificate->length();
    *key = certificate->key();
    return 0;
}

std::uint16_t portOf(int listener) {
    sockaddr_storage address{};
    socklen_t length = sizeof address;
    ::getsockname(listener, reinterpret_cast<sockaddr*>(&address), &length);
    // The port stands at the same place in both families.
    return ntohs(reinterpret_cast<const sockaddr_in&>(address).sin_port);
}

int socketOf(MHD_Connection* connection) {
    return ::MHD_get_connection_info(connection, MHD_CONNECTION_INFO_CONNECTION_FD)->connect_fd;
}

void logLibrary(void*, const char* format, va_list arguments) __attribute__((format(printf, 2, 0)));
void logLibrary(void*, const char* format, va_list arguments) {
    char line[512];
    if (std::vsnprintf(line, sizeof line, format, arguments) < 0) return;
    QUENX_DEBUG("http: %s", utils::escapeForFormat(line).c_str());
}

}  // namespace

/// What the HTTP library calls. No exception may pass through it.
struct HttpServer::Callbacks {
    static MHD_Result request(void* server, MHD_Connection* connection, const char* path, const char* method,
                              const char*, const char* data, std::size_t* size, void** state) {
        try {
            if (*state == nullptr) {
                auto made = std::make_unique<HttpRequest>(*static_cast<HttpServer*>(server), connection,
                                                          method, path);
                *state = made.get();
                return made.release()->begin();
            }
            auto& request = *static_cast<HttpRequest*>(*state);
            if (*size == 0) return request.finish();
            request.take(data, *size);
            *size = 0;  // tells the library that all of it was taken
            return MHD_YES;
        } catch (const std::exception& error) {
            // Most likely there is no memory, so none is asked for in order to answer: the connection ends.
            QUENX_ERROR("a request failed: %s", utils::escapeForFormat(error.what()).c_str());
            return MHD_NO;
        }
    }

    static void completed(void* server, MHD_Connection* connection, void** state,
                          MHD_RequestTerminationCode code) {
        auto& self = *static_cast<HttpServer*>(server);
        const std::unique_ptr<HttpRequest> request(static_cast<HttpRequest*>(*state));
        *state = nullptr;
        if (request && code == MHD_REQUEST_TERMINATED_COMPLETED_OK) request->drain();
        self.m_watch->idle(socketOf(connection), self.m_limits.idleTime + self.m_limits.headerTime);
    }

    static void connection(void* server, MHD_Connection* connection, void**,
                           MHD_ConnectionNotificationCode code) {
        auto& self = *static_cast<HttpServer*>(server);
        const int socket = socketOf(connection);
        if (code != MHD_CONNECTION_NOTIFY_STARTED) {
            self.m_watch->closed(socket);
            return;
        }
        self.m_watch->started(socket);
        const auto* info = ::MHD_get_connection_info(connection, MHD_CONNECTION_INFO_GNUTLS_SESSION);
        if (info != nullptr && info->tls_session != nullptr)
            self.m_tickets->offer(static_cast<gnutls_session_t>(info->tls_session));
    }
};

HttpServer::HttpServer(const ServerLimits& limits, Dispatcher& dispatcher, Authentication& authentication,
                       Control* control)
    : m_limits(limits),
      m_dispatcher(dispatcher),
      m_authentication(authentication),
      m_control(control),
      m_userSlots(limits.requestsPerUser),
      m_workers(static_cast<std::ptrdiff_t>(limits.workers)),
      m_localWorkers(static_cast<std::ptrdiff_t>(ConnectionWatch::kLocalConnections)),
      m_tickets(std::make_unique<SessionTickets>()),
      m_watch(std::make_unique<ConnectionWatch>(limits)) {}

HttpServer::~HttpServer() {
    if (!m_stopping.load()) stopAccepting();
    // The library waits for its threads, and some of them may sit out the delay after a wrong password.
    m_watch->endWaiting();
    for (MHD_Daemon* library : m_libraries) {
        if (library != nullptr) ::MHD_stop_daemon(library);
    }
    currentCertificate.store(nullptr);
}

void HttpServer::setCertificate(std::shared_ptr<const ServerCertificate> certificate) {
    currentCertificate.store(certificate.get());
    m_certificates.push_back(std::move(certificate));
    // Last: until here somebody whom the old one convinced may have got a ticket.
    m_tickets->forget();
}

MHD_Daemon* HttpServer::library(bool tls) {
    MHD_Daemon*& library = m_libraries[tls ? 1 : 0];
    if (library != nullptr) return library;
    constexpr unsigned int kFlags = MHD_USE_INTERNAL_POLLING_THREAD | MHD_USE_THREAD_PER_CONNECTION |
                                    MHD_USE_POLL | MHD_USE_ITC | MHD_USE_ERROR_LOG | MHD_USE_NO_LISTEN_SOCKET;
    // The logger comes first, so that complaints about the others reach it.
    std::vector<MHD_OptionItem> options{
        {MHD_OPTION_EXTERNAL_LOGGER, reinterpret_cast<intptr_t>(&logLibrary), nullptr},
        {MHD_OPTION_NOTIFY_COMPLETED, reinterpret_cast<intptr_t>(&Callbacks::completed), this},
        {MHD_OPTION_NOTIFY_CONNECTION, reinterpret_cast<intptr_t>(&Callbacks::connection), this},
        // Never reached: the watch admits no more, and at its limit the library locks a mutex for good.
        {MHD_OPTION_CONNECTION_LIMIT, 2 * static_cast<intptr_t>(ConnectionWatch::mostOf(m_limits)), nullptr},
        {MHD_OPTION_CONNECTION_TIMEOUT, static_cast<intptr_t>(m_limits.idleTime.count()), nullptr},
        {MHD_OPTION_CONNECTION_MEMORY_LIMIT, static_cast<intptr_t>(m_limits.headerBytes), nullptr},
        {MHD_OPTION_STRICT_FOR_CLIENT, 1, nullptr}};
    // Certificate and key by a function, not by their text, so that SIGHUP can put others in their place.
    if (tls) {
        requireTlsPriorities(tlsPriorities());  // the library's complaint is for its log alone
        options.push_back({MHD_OPTION_HTTPS_CERT_CALLBACK, 0, reinterpret_cast<void*>(&retrieveCertificate)});
        options.push_back({MHD_OPTION_HTTPS_PRIORITIES, 0, const_cast<char*>(tlsPriorities())});
    }
    options.push_back({MHD_OPTION_END, 0, nullptr});
    library = ::MHD_start_daemon(tls ? kFlags | MHD_USE_TLS : kFlags, 0, nullptr, nullptr,
                                 &Callbacks::request, this, MHD_OPTION_ARRAY, options.data(), MHD_OPTION_END);
    if (library == nullptr)
        throw std::runtime_error("Cannot start the HTTP server. The system log says more.");
    return library;
}

void HttpServer::accept(int listener, Acceptor::Taker taker) {
    m_acceptors.push_back(std::make_unique<Acceptor>(listener, *m_watch, std::move(taker)));
}

std::uint16_t HttpServer::listen(const std::string& address, std::uint16_t port, bool tls) {
    MHD_Daemon* serving = library(tls);
    const int listener = openListener(address, port);
    const std::uint16_t actualPort = portOf(listener);
    accept(listener, [serving](int socket, const sockaddr& client, socklen_t length) {
        return ::MHD_add_connection(serving, socket, &client, length) == MHD_YES;
    });
    return actualPort;
}

void HttpServer::listenLocally(const std::string& path) {
    MHD_Daemon* serving = library(false);
    m_localSocket = std::make_unique<LocalSocket>(path);
    accept(m_localSocket->listener(), [serving](int socket, const sockaddr& client, socklen_t length) {
        return ::MHD_add_connection(serving, socket, &client, length) == MHD_YES;
    });
}

void HttpServer::doubtLogins() {
    m_watch->doubtLogins();
}

void HttpServer::stopAccepting() {
    m_stopping.store(true);
    m_localSocket.reset();
    m_acceptors.clear();
    m_watch->endIdle();
}

}  // namespace host
