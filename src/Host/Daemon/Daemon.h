// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "Framework/Requests/ProviderSession.h"
#include "History/History.h"
#include "Host/Control/Control.h"
#include "Host/Daemon/JobRetention.h"
#include "Host/Server/HttpServer.h"
#include "Host/Settings.h"
#include "MidAPI/AdapterTypes.h"
#include "Utils/Os/Linux/FileLock.h"

namespace indications {
class EventQueue;
class OwnPorts;
class Subscriptions;
}  // namespace indications

namespace host {

/// Whether the file is in the folder of the default lock file and socket, which a start makes.
bool isInDefaultFolder(const std::string& path);

/// The lock that one daemon on the machine can hold; the file names its process. Given back when the process
/// ends, however that is.
class LockFile {
  public:
    /// Tries to take the lock. Throws std::runtime_error when the file cannot be written.
    explicit LockFile(const std::string& path);

    bool isHeld() const { return m_lock.isHeld(); }
    /// Throws std::runtime_error with the holder's process id, when it is another process.
    void require() const;

  private:
    const std::string m_path;
    os::FileLock m_lock;
};

/// What works, but hardly as it is meant: each says what to do. Plain HTTP on the network, and more
/// connections than `descriptors` the process may have.
std::vector<std::string> warningsOf(const Settings& settings, std::uint64_t descriptors);
/// How many descriptors this process may have at most.
std::uint64_t mostDescriptors();
/// Has it have as many as the settings take, as far as that goes. Returns how many it may have then.
std::uint64_t raiseDescriptors(const Settings& settings);

/// Which adapters the settings name; what they leave open, the environment and the machine say.
ma::BackendChoice adaptersOf(const Settings& settings);

/// Loads the provider libraries of a directory. One that does not load is reported, and the others serve.
/// Throws std::runtime_error when the directory cannot be read, or none of its libraries is a provider.
void loadProviders(core::ProviderLibraries& providers, const std::string& directory);

/// The object manager: providers, operations, server. Started by the constructor.
class Daemon {
  public:
    /// Throws std::runtime_error that says what is missing or wrong, or that another daemon holds the lock
    /// file. A provider library that does not load is only reported, as long as there is another.
    explicit Daemon(const Settings& settings);
    /// Ends connections and unloads the providers, which wait for what they still do.
    ~Daemon();
    Daemon(const Daemon&) = delete;
    Daemon& operator=(const Daemon&) = delete;

    /// Where it listens, for a person: "https://127.0.0.1:5989 unix:/run/quenx-cimd/socket".
    const std::string& addresses() const { return m_addresses; }

    /// Reads certificate, key and users again, and reports what it has read. What cannot be read stays as it
    /// was.
    void reload();

    /// Takes no more connections.
    void stopAccepting();
    /// What a stop still has to wait for, for a person; empty when there is nothing more. First the requests
    /// in flight, then the flashes that have begun.
    std::string unfinished();

  private:
    std::unique_ptr<Dispatcher> makeDispatcher() const;
    std::unique_ptr<Authentication> makeAuthentication() const;
    void openSpool();
    std::shared_ptr<indications::Subscriptions> makeSubscriptions() const;
    /// That of the providers first.
    std::vector<std::string> namespaces() const;
    void readCertificate();
    /// A bad policy stops no reader; the session logs it.
    void reportPolicy();
    void listen();
    void listenOn(std::uint16_t port, bool tls);

    const Settings m_settings;
    const LockFile m_lock;
    std::string m_addresses;
    // Destroyed last to first: the server lets go of its requests before the providers leave.
    const std::shared_ptr<history::History> m_history;  ///< null where none is wanted
    const std::shared_ptr<indications::EventQueue> m_events;
    const std::shared_ptr<indications::OwnPorts> m_ownPorts;
    core::ProviderSession m_session;
    /// Leaves before the providers: what it is told of is theirs.
    std::shared_ptr<indications::Subscriptions> m_subscriptions;
    std::optional<JobRetention> m_retention;
    const std::shared_ptr<AuditTrail> m_trail = std::make_shared<AuditTrail>();
    std::unique_ptr<Dispatcher> m_dispatcher;
    std::unique_ptr<Authentication> m_authentication;
    std::optional<Spool> m_spool;
    std::optional<Control> m_control;
    std::unique_ptr<HttpServer> m_server;
};

}  // namespace host
