// SPDX-License-Identifier: Apache-2.0
#include "Host/Daemon/Daemon.h"

#include <sys/stat.h>

#include <cerrno>
#include <stdexcept>
#include <system_error>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Classes/InstanceList.h"
#include "History/Log/LogAgent.h"
#include "Host/Daemon/IndicationSettings.h"
#include "Host/Daemon/Report.h"
#include "Host/Operations/Dispatcher.h"
#include "Host/Operations/InteropNamespace.h"
#include "Host/Server/ServerCertificate.h"
#include "Logind/InhibitingLocker.h"
#include "MidAPI/ma.h"
#include "Providers/Schema/ProviderInterfaces.h"
#include "Providers/Schema/ValueMaps.h"
#include "Utils/Os/Linux/OwnFiles.h"
#include "Utils/Os/Linux/linux.h"

namespace host {

namespace {

/// The updates that the providers are working on: "Job#1 at 42 %, Job#2 at 7 %"; empty when there are none.
std::string runningUpdates(core::CimOperations& operations) {
    std::string text;
    try {
        // By the standard's class, so that jobs of any provider count.
        for (const core::InstanceValue& job : operations.enumerateInstances("CIM_ConcreteJob")) {
            const auto state = job.number("JobState");
            if (state != JobStateStarting && state != JobStateRunning) continue;
            text += (text.empty() ? "" : ", ") + job.text("InstanceID") + " at " +
                    std::to_string(job.number("PercentComplete")) + " %";
        }
    } catch (const core::CimError&) {
        // No provider here serves jobs.
    }
    return text;
}

void selectAdapters(const Settings& settings) {
    const ma::BackendChoice adapters = adaptersOf(settings);
    // What the settings say must be right. What the machine or a variable says may be mended while this runs.
    if (adapters.backend || adapters.description) ma::selectBackend(adapters);
    try {
        const std::string search = ma::describeSearch();
        if (!search.empty()) report(search);
    } catch (const ma::AdapterError& error) {
        reportProblem(std::string("The adapters cannot be had: ") + error.what());
    }
}

/// systemd makes the folder of the default lock file and socket (RuntimeDirectory=); without it a start by
/// hand does.
const std::string& withItsFolder(const std::string& path) {
    if (isInDefaultFolder(path) && ::mkdir(path.substr(0, path.rfind('/')).c_str(), S_IRWXU) != 0 &&
        errno != EEXIST)
        throw std::system_error(errno, std::generic_category());
    return path;
}

}  // namespace

bool isInDefaultFolder(const std::string& path) {
    const std::string file = Settings().lockFile;
    return path.starts_with(file.substr(0, file.rfind('/') + 1)) && path.rfind('/') == file.rfind('/');
}

LockFile::LockFile(const std::string& path) try : m_path(path), m_lock(withItsFolder(path)) {
} catch (const std::system_error& error) {
    throw std::runtime_error("Cannot write the lock file " + path + ": " + error.code().message() + ". " +
                             (error.code().value() == EACCES
                                  ? "Run as root, or set daemon.lock_file."
                                  : "Set daemon.lock_file to a file that can be written."));
} catch (const os::ForeignFile& error) {
    throw std::runtime_error(std::string(error.what()) + ". Or set daemon.lock_file to another file.");
}

void LockFile::require() const {
    if (isHeld()) return;
    throw std::runtime_error("quenx-cimd is already running: " + m_lock.holder() + " holds " + m_path +
                             ". Stop it, or set daemon.lock_file to another file.");
}

void loadProviders(core::ProviderLibraries& providers, const std::string& directory) {
    const std::string advice = ". Set providers.directory to the directory of libQuenx_SoftwareUpdate.so.";
    try {
        providers.load(directory);
    } catch (const std::system_error& error) {
        throw std::runtime_error("Cannot read the provider directory " + directory + ": " +
                                 error.code().message() + advice);
    }
    for (const auto& problem : providers.problems())
        reportProblem("Cannot load " + problem.file + ": " + problem.reason);
    std::string names;
    for (const core::AgentUse& each : core::GetCimBroker()->useAgents())
        names += (names.empty() ? "" : ", ") + each.agent().getProviderName();
    if (names.empty()) throw std::runtime_error("There is no provider library in " + directory + advice);
    report("Loaded the providers " + names + ".");
}

ma::BackendChoice adaptersOf(const Settings& settings) {
    const auto said = [](const std::string& text) {
        return text.empty() ? std::nullopt : std::optional(text);
    };
    return {said(settings.backend), said(settings.adapters), said(settings.adapterState)};
}

Daemon::Daemon(const Settings& settings)
    : m_settings(settings),
      m_lock(settings.lockFile),
      m_history(history::History::wanted()),
      m_events(std::make_shared<indications::EventQueue>()),
      m_ownPorts(std::make_shared<indications::OwnPorts>()),
      m_session(settings.providerConfiguration, settings.policy) {
    m_lock.require();
    reportPolicy();
    for (const std::string& text : warningsOf(settings, raiseDescriptors(settings)))
        reportProblem("Warning: " + text);
    // Before the providers come, which ask for the adapters as soon as they are called.
    selectAdapters(m_settings);
    // Now, and not with the first update: until then an upgrade may have exchanged what it would load.
    logind::loadLibrary();
    m_session.workUnder(std::make_unique<logind::InhibitingLocker>("quenx-cimd"));
    m_session.keepHistory(m_history);
    m_session.tellEvents(m_events);
    // Whoever died in an update cannot tell any more how it ended.
    if (m_history) m_history->look();
    loadProviders(m_session.libraries(), m_settings.providers);
    history::serveLog(m_session, m_history);
    openSpool();
    m_retention.emplace(m_settings.jobs, m_session.operations());
    m_subscriptions = makeSubscriptions();
    m_dispatcher = makeDispatcher();
    m_authentication = makeAuthentication();
    m_control.emplace(m_session.operations(), m_trail, *m_spool);
    m_server = std::make_unique<HttpServer>(m_settings.limits, *m_dispatcher, *m_authentication, &*m_control);
    // Last, so that whoever can connect is also answered.
    listen();
}

Daemon::~Daemon() = default;

std::vector<std::string> Daemon::namespaces() const {
    std::vector<std::string> names{m_session.operations()->getNamespace()};
    // Clients look for the registered profiles under either name (DSP1033 7.1), and few try both.
    for (const char* name : {"interop", "root/interop"}) {
        if (!core::sameName(name, names.front())) names.emplace_back(name);
    }
    return names;
}

std::shared_ptr<indications::Subscriptions> Daemon::makeSubscriptions() const {
    indications::SubscriptionSettings settings = subscriptionSettings(m_settings);
    settings.ownPorts = m_ownPorts;
    auto made = std::make_shared<indications::Subscriptions>(
        std::move(settings), namespaces(), os::getHostname(), m_session.operations(), m_events);
    made->resume();
    return made;
}

std::unique_ptr<Dispatcher> Daemon::makeDispatcher() const {
    const auto implementation = m_session.operations();
    Dispatcher::Namespaces namespaces{implementation};
    const std::vector<std::string> names = this->namespaces();
    const InteropModel model(names, os::getHostname());
    for (std::size_t i = 1; i < names.size(); ++i)
        namespaces.push_back(
            std::make_shared<InteropNamespace>(names[i], implementation, model, m_subscriptions));
    return std::make_unique<Dispatcher>(std::move(namespaces), m_settings.pulls,
                                        m_settings.limits.answerBytes, m_trail);
}

std::unique_ptr<Authentication> Daemon::makeAuthentication() const {
    const AuthenticationSettings& settings = m_settings.authentication;
    // A users file is read at once: a daemon that nobody can log in to should not start.
    std::unique_ptr<PasswordChecker> checker;
    if (settings.method == "users") {
        checker = std::make_unique<UsersFile>(settings.usersFile);
    } else {
        checker = std::make_unique<PamChecker>(settings.readers);
    }
    return std::make_unique<Authentication>(std::move(checker), settings.rememberFor, LoginPace(), m_trail);
}

void Daemon::openSpool() {
    try {
        m_spool.emplace(m_settings.uploads);
    } catch (const std::exception& error) {
        // Another user's, most likely. All else can go on without.
        reportProblem(std::string("Warning: No images are taken: ") + error.what() +
                      ". Set uploads.directory to a folder of this program's own, or to \"\".");
        m_spool.emplace(UploadSettings{.directory = ""});
    }
    utils::SMASHv2Config::getInstance()->setUploadDirectory(m_spool->folder());
}

void Daemon::listenOn(std::uint16_t port, bool tls) {
    const std::string& address = m_settings.listen.address;
    const std::uint16_t actualPort = m_server->listen(address, port, tls);
    m_ownPorts->add(actualPort);
    if (!m_addresses.empty()) m_addresses += " ";
    m_addresses += tls ? "https://" : "http://";
    // An IPv6 address stands in brackets in a URL (RFC 3986 3.2.2).
    m_addresses += address.find(':') == std::string::npos ? address : "[" + address + "]";
    m_addresses += ":" + std::to_string(actualPort);
}

void Daemon::readCertificate() {
    auto certificate =
        std::make_shared<const ServerCertificate>(m_settings.tls.certificate, m_settings.tls.key);
    const std::string warning = certificate->warning();
    if (!warning.empty()) reportProblem("Warning: " + warning);
    m_server->setCertificate(std::move(certificate));
}

void Daemon::listen() {
    if (m_settings.listen.https) {
        // Encrypted from the first start on, though clients have to be told to trust the certificate.
        if (makeTlsFiles(m_settings.tls)) {
            report("Made a self-signed certificate for " + os::getHostname() +
                   ", localhost, 127.0.0.1 and ::1: " + m_settings.tls.certificate);
        }
        readCertificate();
        listenOn(m_settings.listen.httpsPort, true);
    }
    if (m_settings.listen.http) listenOn(m_settings.listen.httpPort, false);
    if (!m_settings.listen.socket.empty()) {
        m_server->listenLocally(withItsFolder(m_settings.listen.socket));
        m_addresses += " unix:" + m_settings.listen.socket;
    }
}

void Daemon::reportPolicy() {
    const std::string problem = m_session.policy().problem();
    if (!problem.empty())
        report("The policy cannot be obeyed, and nothing is installed or deleted until it is mended: " +
               problem);
}

void Daemon::reload() {
    const auto again = [](const std::string& what, const auto& read) {
        try {
            read();
            report("Reloaded the " + what + ".");
        } catch (const std::exception& error) {
            reportProblem("Kept the old " + what + ". " + error.what());
        }
    };
    // Each by itself: a certificate that cannot be read must not keep a removed user in.
    again("users", [this] { m_authentication->reload(); });
    m_server->doubtLogins();
    if (m_settings.listen.https) again("certificate and key", [this] { readCertificate(); });
    reportPolicy();
}

void Daemon::stopAccepting() {
    m_server->stopAccepting();
}

std::string Daemon::unfinished() {
    if (const unsigned int requests = m_server->inFlight(); requests != 0) {
        return std::to_string(requests) + (requests == 1 ? " request" : " requests");
    }
    // From here on no request can start an update, so there can only be fewer of them.
    m_dispatcher->shutDown();
    const std::string updates = runningUpdates(*m_session.operations());
    if (updates.empty() && !core::isReaperBusy()) return "";
    const std::string adapter = update::claimedAdapter(*m_session.operations());
    const std::string update = adapter.empty() ? "an update" : "the update of " + adapter;
    return update + (updates.empty() ? ", whose job was deleted" : " (" + updates + ")");
}

}  // namespace host
