// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "CimXml/Request.h"

namespace host {

/// Everything that bounds what clients can make the daemon spend. All have options.
struct ServerLimits {
    std::size_t bodyBytes = 1U << 20;            ///< of one request
    std::size_t anonymousBodyBytes = 16U << 10;  ///< read of one that is refused, so that the answer arrives
    std::size_t headerBytes = 32U << 10;         ///< of one request, buffers of the connection included
    unsigned int connections = 256;              ///< and so connection threads
    unsigned int connectionsPerAddress = 64;
    unsigned int workers = 16;          ///< requests carried out at a time
    unsigned int requestsPerUser = 12;  ///< of those, by one user
    std::size_t answerBytes =
        256U << 20;  ///< of all large answers in hand, those of open enumerations included
    std::chrono::seconds headerTime{10};   ///< from the connection, or the end of idling, to the last header
    std::chrono::seconds requestTime{30};  ///< for a body to arrive, and for an answer to be taken
    std::chrono::seconds idleTime{60};     ///< between requests
};

/// Pull enumerations: those that clients open and read in pieces.
struct PullLimits {
    std::size_t open = 32;                 ///< enumerations open at a time
    std::size_t openPerUser = 8;           ///< of those, by one user
    std::chrono::seconds timeout{180};     ///< between two pulls, unless the client asks for less or more
    std::chrono::seconds maxTimeout{600};  ///< what it may ask for
};

struct ListenSettings {
    std::string address = "127.0.0.1";
    std::uint16_t httpsPort = 5989;
    std::uint16_t httpPort = 5988;
    bool https = true;
    bool http = false;  ///< plain, for loopback and tests; passwords travel readable
    std::string socket = cimxml::kDefaultSocket;  ///< a Unix socket, for this machine's root; empty: none
};

struct TlsSettings {
    std::string certificate = "/etc/quenx-cimd/cert.pem";
    std::string key = "/etc/quenx-cimd/key.pem";
    bool generate = false;  ///< also at paths other than these, when neither file exists
};

struct AuthenticationSettings {
    std::string method = "pam";  ///< "pam" or "users"
    std::string usersFile = "/etc/quenx-cimd/users";
    /// With PAM: who may read besides the administrators; names, "@group" or "*" for everybody.
    std::vector<std::string> readers;
    std::chrono::seconds rememberFor{60};  ///< verified credentials; 0 remembers none
};

/// Which jobs that have ended the daemon keeps; 0 sets no bound.
struct JobSettings {
    std::size_t keep = 0;             ///< how many of them
    std::chrono::seconds keepFor{0};  ///< how long, from their end
};

/// Images that administrators send, see Spool.
struct UploadSettings {
    std::string directory = "/var/lib/quenx/images";  ///< empty: none are taken
    std::size_t imageBytes = 256U << 20;              ///< of one file
    std::size_t totalBytes = 1U << 30;                ///< of all; beyond it the oldest go
};

/// Who is told of events, and how.
struct IndicationSettings {
    std::string file = "/var/lib/quenx/subscriptions.json";  ///< keeps them; empty: none outlives the daemon
    /// "subscriber" alone or nothing at all: the machine that subscribed; "any"; else networks.
    std::vector<std::string> destinations{"subscriber"};
    std::size_t most = 100;    ///< destinations, and subscriptions
    std::string certificates;  ///< a file of authorities beside the system's; empty: none
    bool verify = true;        ///< the certificates of listeners
    unsigned int retries = 3;  ///< tries after the first
    std::chrono::seconds retryTime{30};
    /// After which a transient destination that takes nothing is removed; 0: never.
    std::chrono::seconds abandonTime{24 * 3600};
    unsigned int perSecond = 20;  ///< messages to one address; 0 sets no bound
};

/// What the configuration file and the options say. Field by field documented in packaging/quenx-cimd.toml.
struct Settings {
    ListenSettings listen;
    TlsSettings tls;
    AuthenticationSettings authentication;
    ServerLimits limits;
    PullLimits pulls;
    JobSettings jobs;
    UploadSettings uploads;
    IndicationSettings indications;
    std::string providers;              ///< directory of the provider libraries
    std::string providerConfiguration;  ///< empty: the providers' own default
    std::string policy;                 ///< file of the policy; empty: the machine's
    std::string backend;                ///< which adapters; empty: default
    std::string adapters;               ///< description of simulated adapters; empty: default
    std::string adapterState;           ///< their state directory; empty: default
    std::string lockFile = "/run/quenx-cimd/lock";
};

}  // namespace host
