#pragma once

#include <microhttpd.h>

#include "Host/Server/HttpMessage.h"
#include "Host/Server/HttpServer.h"

namespace host {

/// One request and its answer, on the thread of its connection. Made when the head is there.
class Exchange {
  public:
    Exchange(HttpServer& server, MHD_Connection* connection, const char* method);
    /// After the answer has gone, or the connection has broken.
    ~Exchange();
    Exchange(const Exchange&) = delete;
    Exchange& operator=(const Exchange&) = delete;

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
    Identity m_identity;
    std::optional<HttpAnswer> m_refusal;  ///< waits for the body to be read
    std::string m_body;
    bool m_mustDrain = false;
};

}  // namespace host
