// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <microhttpd.h>

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "CimXml/Request.h"
#include "CimXml/Response.h"
#include "CimXml/WireError.h"
#include "Framework/Requests/Reasons.h"
#include "Host/Authentication/PasswordChecker.h"
#include "Host/Operations/AnswerBudget.h"
#include "Host/Operations/Operations.h"

namespace host {

/// What is used of a request's head.
struct HttpHead {
    std::string method;
    std::string path;
    std::string address;  ///< the client's
    std::string host;     ///< header Host; empty where there is none
    std::optional<std::string> authorization;
    std::optional<std::string> contentType;
    std::optional<std::string> contentEncoding;
    std::optional<std::string> sum;           ///< SHA-256 of the body, as one of our own clients says
    std::vector<std::string> contentLengths;  ///< more than one where the client repeats the header
    bool isChunked = false;
    bool isAmbiguous = false;  ///< has a name that is none, or two headers of which only one can count
    cimxml::RequestHeaders cim;
};

struct HttpAnswer {
    unsigned int status = 200;
    std::vector<std::pair<std::string, std::string>> headers;
    cimxml::Pieces body = {};
    std::optional<AnswerCharge> charge = std::nullopt;  ///< of a large body

    /// Without a body, here and below.
    static HttpAnswer plain(unsigned int status) { return {status, {}}; }
    static HttpAnswer withHeader(unsigned int status, std::string name, std::string value) {
        return {status, {{std::move(name), std::move(value)}}};
    }
    static HttpAnswer refusal(const cimxml::WireError& error);

    /// Says why the call was refused, in a header that our own client knows.
    void tellReason(core::ReasonId reason);
};

/// The announced length of the body; nothing when no header says it in one number, or two differ.
std::optional<std::uint64_t> contentLengthOf(const HttpHead& head);

/// What the head of a request alone is refused for: method, length, encoding, content type, CIM headers.
/// Nothing when the body may be read.
std::optional<HttpAnswer> checkHead(const HttpHead& head, std::size_t bodyLimit);

class ControlCall;
class HttpServer;

/// The address of the client, as addressText() has it.
std::string addressOf(MHD_Connection* connection);

/// One request, from its head to its answer, on the thread of its connection.
class HttpRequest {
  public:
    HttpRequest(HttpServer& server, MHD_Connection* connection, const char* method, const char* path);
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
    bool isLocal() const;
    /// For a path of the daemon's own, and not for CIM-XML.
    bool isControl() const;
    std::optional<HttpAnswer> checkHead() const;
    std::optional<HttpAnswer> authenticate();
    Caller caller() const;
    std::optional<HttpAnswer> openCall();
    /// Under which the user's share of slots and of the budget is counted.
    std::string quotaName() const;
    std::optional<HttpAnswer> chargeBody();
    HttpAnswer carryOut();
    HttpAnswer dispatch(AnswerCharge charge);
    /// The client's time runs again, after it has had to wait for us.
    void goOn();
    MHD_Result queue(HttpAnswer answer);
    bool isBodySmall() const;

    HttpServer& m_server;
    MHD_Connection* m_connection;
    int m_socket;
    HttpHead m_head;
    User m_user;
    std::optional<HttpAnswer> m_refusal;  ///< waits for the body to be read
    std::string m_body;
    std::unique_ptr<ControlCall> m_call;       ///< takes the body instead
    std::size_t m_untimed = 0;                 ///< bytes of it since the client last got time for more
    std::optional<AnswerCharge> m_bodyCharge;  ///< large bodies share the budget of the answers
    bool m_mustDrain = false;
};

}  // namespace host
