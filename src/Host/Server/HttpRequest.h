// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <microhttpd.h>

#include "Host/Authentication/PasswordChecker.h"
#include "Host/Server/HttpMessage.h"

namespace host {

class HttpServer;

/// One request, from its head to its answer, on the thread of its connection.
class HttpRequest {
  public:
    HttpRequest(HttpServer& server, MHD_Connection* connection, const char* method);
    /// After the answer has gone, or the connection has broken.
    ~HttpRequest();
    HttpRequest(const HttpRequest&) = delete;
    HttpRequest& operator=(const HttpRequest&) = delete;

    /// Looks at the head. With an answer that cannot wait for the body, queues it.
    MHD_Result begin();
    /// Takes a piece of the body.
    void take(const char* data, std::size_t size);
    /// The body is whole: carries the request out and queues the answer.
    MHD_Result finish();

    /// The answer has gone while the client was still sending: without this the client sees a reset
    /// connection in place of the answer.
    void drain();

  private:
    std::optional<HttpAnswer> refusal();
    std::optional<HttpAnswer> authenticate();
    HttpAnswer carryOut();
    MHD_Result queue(HttpAnswer answer);
    bool isBodySmall() const;

    HttpServer& m_server;
    MHD_Connection* m_connection;
    int m_socket;
    HttpHead m_head;
    User m_user;
    std::optional<HttpAnswer> m_refusal;  ///< waits for the body to be read
    std::string m_body;
    bool m_mustDrain = false;
};

}  // namespace host
