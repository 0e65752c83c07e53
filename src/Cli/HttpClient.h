// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "Cli/ServerUrl.h"

namespace cli {

/// How to log in to a server.
struct ServerSettings {
    std::string user;
    std::string password;
    std::string caFile;     ///< certificates to trust in place of the system's; empty for those
    bool insecure = false;  ///< any certificate is taken
    std::string namespaceName = "root/cimv2";
};

struct HttpReply {
    long status = 0;
    std::string body;
    std::string cimError;    ///< the header of that name
    std::string retryAfter;  ///< likewise, in seconds
};

/// Requests to one server over one connection. Used from one thread.
class HttpClient {
  public:
    HttpClient(const ServerUrl& url, const ServerSettings& settings);
    ~HttpClient();
    HttpClient(const HttpClient&) = delete;
    HttpClient& operator=(const HttpClient&) = delete;

    /// Sends a body of XML. Throws Failure when there is no answer.
    HttpReply post(const std::vector<std::string>& headers, const std::string& body);

  private:
    struct Handle;
    std::unique_ptr<Handle> handle_;
    std::string url_;
    bool namesCaFile_;
};

}  // namespace cli
