// SPDX-License-Identifier: Apache-2.0
#include "Host/Daemon/ConfigCheck.h"

#include <unistd.h>

#include <cerrno>
#include <cstring>
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
    if (!areTlsFilesToBeMade(settings)) TlsIdentity(settings.certificate, settings.key);
}

void requireConfiguration(const std::string& path) {
    if (!path.empty() && ::access(path.c_str(), R_OK) != 0) {
        throw std::runtime_error("Cannot read " + path + ": " + std::strerror(errno) +
                                 ". Check providers.configuration.");
    }
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
                                 directory.string() + ". Make it, or set daemon.lock_file to another file.");
    }
}

void checkAuthentication(const AuthenticationSettings& settings) {
    constexpr const char* kService = "/etc/pam.d/quenx-cimd";
    if (settings.method == "users") {
        readUsersFile(settings.usersFile);
    } else if (!fs::exists(kService)) {
        std::cerr << "quenx-cimd: Warning: " << kService
                  << " does not exist, so PAM applies its service \"other\". "
                  << "Copy the file from the installation.\n";
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
    check([&] { requireConfiguration(settings.providerConfiguration); });
    check([&] {
        core::ProviderLibraries providers;
        loadProviders(providers, settings.providers);
    });
    check([&] { checkAdapters(settings); });
    check([&] { checkLockFile(settings.lockFile); });
    if (status == 0) std::cout << "The configuration is valid.\n";
    return status;
}

}  // namespace host
