// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "Cli/Connection/RefusalSink.h"
#include "Cli/Display/Messages.h"
#include "Framework/Requests/CimOperations.h"
#include "History/History.h"
#include "MidAPI/AdapterTypes.h"

namespace cli {

/// A request that was sent but got no usable answer: the server may have carried it out.
class NoAnswer : public CommandError {
  public:
    using CommandError::CommandError;
};

/// The policy cannot be obeyed, so nothing is installed.
class PolicyRefusal : public CommandError {
  public:
    using CommandError::CommandError;
};

class ServerControl;

/// The way to the management model: in this process, or over the wire. Used from one thread.
struct Connection {
    /// Never null. Errors of the model are core::CimError; errors of the way itself are CommandError. Giving
    /// up the last copy unloads the providers of this process, which waits for the updates that have begun.
    std::shared_ptr<core::CimOperations> operations;
    std::shared_ptr<history::History> history = {};  ///< of this process's adapters; null where none is kept
    std::shared_ptr<const RefusalSink> refusals = {};  ///< of this process; null with a server
    std::shared_ptr<ServerControl> control = {};       ///< of a server; null in process
    bool isInProcess = true;  ///< the providers run, and their jobs end, with this program
    bool sharesFiles = true;  ///< a path means the same file to this program as to the service
};

/// The providers to load; an empty text leaves the choice to the system.
struct ProviderSettings {
    std::string configFile;  ///< the providers' configuration file
    std::string policyFile;  ///< the policy that they obey
    /// What the verb is going to ask to be installed, for which it needs the leave of the policy.
    std::optional<std::vector<core::Argument>> order;
    ma::BackendChoice adapters;  ///< a state directory only with a description
    std::string directory;       ///< where the provider libraries are
};

/// Leaves a record and an audit line of an install that is refused before the service is asked.
void tellOfRefusal(const std::vector<core::Argument>& order, core::ReasonId reason, const std::string& text);

/// The name of the user who runs this program, else the number.
std::string localUser();

/// Loads the providers into this process. Throws CommandError, naming the file, when one cannot be
/// read or loaded, or when the verb needs a policy that cannot be obeyed; any other is only warned of it.
Connection openProviders(const ProviderSettings& settings);

/// The Unix socket of this machine's object manager: QUENXCTL_SOCKET, else its default.
std::string localSocket();

/// The address of a CIM-XML server, whole: scheme, host, port and path, or "unix:" and the path of a socket.
class ServerUrl {
  public:
    /// Reads "https://host", with a port and a path that may be left out, or "unix:", with a path if it is
    /// not localSocket(). Throws CommandError that says how to write it: a user who mistypes it must not send
    /// a password in clear, or to another host.
    explicit ServerUrl(const std::string& text);

    const std::string& text() const { return m_text; }
    /// The path of the Unix socket; empty for a server on the network.
    const std::string& socket() const { return m_socket; }
    bool isEncrypted() const { return m_isEncrypted; }
    /// True when the server is on this machine.
    bool isLoopback() const { return m_isLoopback; }

  private:
    std::string m_text;
    std::string m_socket;
    bool m_isEncrypted = false;
    bool m_isLoopback = false;
};

/// The server to use, and how to log in to it.
struct ServerSettings {
    std::optional<ServerUrl> url;
    std::string user;       ///< empty: QUENXCTL_USER, else asked for on the terminal
    std::string caFile;     ///< certificates to trust in place of the system's; empty for those
    bool insecure = false;  ///< any certificate is taken
    std::string namespaceName = "root/cimv2";
};

/// Prepares requests to any WBEM server that serves these classes, over CIM-XML; nothing is sent yet. Warns
/// on standard error of what gives the password away. The password is QUENXCTL_PASSWORD, else asked for on
/// the terminal. Throws CommandError where nobody can answer. On a Unix socket nothing is asked: the server
/// learns from the system who calls.
/// @param settings       with a URL
/// @param isInterrupted  asked about once a second while an answer is waited for; true ends the request with
///                       a CommandError of ExitStatus::Interrupted
Connection openServer(const ServerSettings& settings, const std::function<bool()>& isInterrupted);

}  // namespace cli
