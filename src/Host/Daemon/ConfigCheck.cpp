#include "Host/Daemon/ConfigCheck.h"

#include <unistd.h>

#include <filesystem>
#include <functional>
#include <iostream>
#include <stdexcept>

#include "Host/Authentication/UsersFile.h"
#include "Host/Daemon/Providers.h"
#include "Host/Server/Listener.h"
#include "Host/Server/TlsIdentity.h"
#include "MidAPI/Simulator/Simulator.h"
#include "MidAPI/ma.h"

namespace host {

namespace {

namespace fs = std::filesystem;

void checkTls(const TlsSettings& settings) {
    const bool hasCertificate = fs::exists(settings.certificate);
    if (hasCertificate != fs::exists(settings.key)) {
        throw std::runtime_error("of " + settings.certificate + " and " + settings.key +
                                 " only one is there");
    }
    if (hasCertificate) TlsIdentity(settings.certificate, settings.key);
}

void requireReadable(const std::string& path) {
    if (!path.empty() && ::access(path.c_str(), R_OK) != 0)
        throw std::runtime_error(path + ": cannot be read");
}

void checkAdapters(const Settings& settings) {
    if (settings.adapters.empty()) {
        ma::enumerateAdapters();
    } else {
        ma::Simulator(settings.adapters, settings.adapterState);
    }
}

void checkLockFile(const std::string& file) {
    const fs::path directory = fs::absolute(file).parent_path();
    if (!fs::is_directory(directory)) {
        throw std::runtime_error("daemon.lock_file is " + file + ", but there is no directory " +
                                 directory.string());
    }
}

void checkAuthentication(const AuthenticationSettings& settings) {
    constexpr const char* kService = "/etc/pam.d/quenx-cimd";
    if (settings.method == "users") {
        readUsersFile(settings.usersFile);
    } else if (!fs::exists(kService)) {
        std::cerr << "quenx-cimd: note: " << kService
                  << " is missing, so PAM goes by its service \"other\"\n";
    }
}

}  // namespace

int checkConfiguration(const Settings& settings) {
    int status = 0;
    const auto check = [&](const std::function<void()>& step) {
        try {
            step();
        } catch (const std::exception& error) {
            std::cerr << "quenx-cimd: " << error.what() << '\n';
            status = 2;
        }
    };
    check([&] { Listener::checkAddress(settings.listen.address); });
    if (settings.listen.https) check([&] { checkTls(settings.tls); });
    check([&] { checkAuthentication(settings.authentication); });
    check([&] { requireReadable(settings.providerConfiguration); });
    check([&] {
        core::ProviderLibraries providers;
        loadProviders(providers, settings.providers);
    });
    check([&] { checkAdapters(settings); });
    check([&] { checkLockFile(settings.lockFile); });
    if (status == 0) std::cout << "The configuration is good.\n";
    return status;
}

}  // namespace host
