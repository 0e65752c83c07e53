// SPDX-License-Identifier: Apache-2.0
#include "Host/Daemon/Daemon.h"

#include "Framework/Classes/InstanceReaper.h"
#include "Host/Authentication/Authentication.h"
#include "Host/Authentication/UsersFile.h"
#include "Host/Daemon/Providers.h"
#include "Host/Daemon/Report.h"
#include "Host/Daemon/RunningJobs.h"
#include "Host/Operations/Dispatcher.h"
#include "Host/Operations/InteropNamespace.h"
#include "Host/Server/Listener.h"
#include "Host/Server/TlsIdentity.h"
#include "MidAPI/ma.h"
#include "Utils/Os/Linux/linux.h"

namespace host {

Daemon::Daemon(const Settings& settings) : m_settings(settings), m_session(settings.providerConfiguration) {
    if (!m_settings.adapters.empty()) ma::configureSimulator(m_settings.adapters, m_settings.adapterState);
    loadProviders(m_session.libraries(), m_settings.providers);
    m_dispatcher = makeDispatcher();
    m_authentication = makeAuthentication();
    m_server = std::make_unique<HttpServer>(m_settings.limits, *m_dispatcher, *m_authentication);
    listen();
}

Daemon::~Daemon() = default;

std::unique_ptr<Dispatcher> Daemon::makeDispatcher() const {
    const auto implementation = m_session.operations();
    Dispatcher::Namespaces namespaces{implementation};
    std::vector<std::string> names{implementation->getNamespace()};
    for (const char* name : {"interop", "root/interop"}) {
        if (!core::sameName(name, names.front())) names.emplace_back(name);
    }
    const auto model = std::make_shared<InteropModel>(names, os::getHostname());
    for (std::size_t i = 1; i < names.size(); ++i) {
        namespaces.push_back(std::make_shared<InteropNamespace>(names[i], implementation, model));
    }
    return std::make_unique<Dispatcher>(std::move(namespaces), m_settings.pulls);
}

std::unique_ptr<Authentication> Daemon::makeAuthentication() const {
    const AuthenticationSettings& settings = m_settings.authentication;
    std::unique_ptr<PasswordChecker> checker;
    if (settings.method == "users") {
        checker = std::make_unique<UsersFile>(settings.usersFile);
    } else {
        checker = std::make_unique<PamChecker>(settings.readers);
    }
    return std::make_unique<Authentication>(std::move(checker), settings.rememberFor);
}

void Daemon::listenOn(std::uint16_t port, bool tls) {
    const std::string& address = m_settings.listen.address;
    Listener listener(address, port);
    if (!m_places.empty()) m_places += " ";
    m_places += tls ? "https://" : "http://";
    m_places += address.find(':') == std::string::npos ? address : "[" + address + "]";
    m_places += ":" + std::to_string(listener.port());
    m_server->listen(std::move(listener), tls);
}

void Daemon::readIdentity() {
    m_server->setIdentity(
        std::make_shared<const TlsIdentity>(m_settings.tls.certificate, m_settings.tls.key));
}

void Daemon::listen() {
    if (m_settings.listen.https) {
        if (makeTlsFiles(m_settings.tls)) {
            report("Made a self-signed certificate for " + os::getHostname() +
                   ", localhost, 127.0.0.1 and ::1: " + m_settings.tls.certificate);
        }
        readIdentity();
        listenOn(m_settings.listen.httpsPort, true);
    }
    if (m_settings.listen.http) listenOn(m_settings.listen.httpPort, false);
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
    again("users", [this] { m_authentication->reload(); });
    if (m_settings.listen.https) again("certificate and key", [this] { readIdentity(); });
}

void Daemon::stopAccepting() {
    m_server->stopAccepting();
}

std::string Daemon::unfinished() {
    if (const unsigned int requests = m_server->inFlight(); requests != 0) {
        return std::to_string(requests) + (requests == 1 ? " request" : " requests");
    }
    m_dispatcher->shutDown();
    const std::vector<RunningJob> jobs = runningJobs(*m_session.operations());
    if (!jobs.empty()) return "the update of " + describe(jobs);
    return core::isReaperBusy() ? "an update whose job was deleted" : "";
}

}  // namespace host
