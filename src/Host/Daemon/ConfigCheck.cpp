// SPDX-License-Identifier: Apache-2.0
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <functional>
#include <iostream>
#include <stdexcept>

#include "Host/Authentication/PasswordChecker.h"
#include "Host/Daemon/CommandLine.h"
#include "Host/Daemon/Daemon.h"
#include "Host/Server/ServerCertificate.h"
#include "MidAPI/Simulator/Simulator.h"
#include "MidAPI/ma.h"
#include "Utils/Os/Linux/linux.h"

namespace host {

namespace {

namespace fs = std::filesystem;

/// For a file that a start makes: whether it could be made, in the nearest folder that is there.
void requireWritable(const std::string& file, const std::string& advice) {
    fs::path nearest = fs::absolute(file);
    std::error_code unreachable;  // counts as missing: the folder above says why
    while (!fs::exists(nearest, unreachable))
        nearest = nearest.parent_path();
    int error = ::access(nearest.c_str(), W_OK) == 0 ? 0 : errno;
    if (error == 0 && nearest != fs::absolute(file) && !fs::is_directory(nearest)) error = ENOTDIR;
    if (error != 0)
        throw std::runtime_error("Cannot write " + file + ": " + std::strerror(error) + ". " + advice);
}

/// Whether a daemon holds the lock file. Does not make it where it is missing.
bool isDaemonRunning(const std::string& file) {
    if (fs::exists(file)) return !LockFile(file).isHeld();
    const fs::path directory = fs::absolute(file).parent_path();
    // The folder of the default is made at the start.
    const bool isDefault = file == Settings().lockFile;
    if (isDefault) requireWritable(file, "Run as root, or set daemon.lock_file.");
    if (!isDefault && !fs::is_directory(directory)) {
        throw std::runtime_error("daemon.lock_file is " + file + ", but there is no directory " +
                                 directory.string() + ". Make it, or set daemon.lock_file to another file.");
    }
    return false;
}

void checkPort(const std::string& address, std::uint16_t port, bool isRestart) {
    try {
        const os::Descriptor listener(openListener(address, port));
    } catch (const ListenError& error) {
        // The daemon that this one would replace is likely the one that listens there.
        if (!isRestart || error.code() != EADDRINUSE) throw;
    }
}

void checkTls(const TlsSettings& settings) {
    if (!areTlsFilesToBeMade(settings)) {
        ServerCertificate(settings.certificate, settings.key);
        return;
    }
    for (const std::string& file : {settings.certificate, settings.key})
        requireWritable(file, "Run as root, or set tls.certificate and tls.key to files that exist.");
}

void checkAuthentication(const AuthenticationSettings& settings) {
    constexpr const char* kService = "/etc/pam.d/quenx-cimd";
    if (settings.method == "users") {
        readUsersFile(settings.usersFile);
    } else if (!fs::exists(kService)) {
        // It can work: "other" is strict on most systems, but whom it lets in is not this program's choice.
        std::cerr << "quenx-cimd: Warning: " << kService
                  << " does not exist, so PAM applies its service \"other\". "
                  << "Copy the file from the installation.\n";
    }
}

void checkProviders(const Settings& settings) {
    core::ProviderLibraries providers;
    loadProviders(providers, settings.providers);
}

void checkProviderConfiguration(const std::string& path) {
    if (!path.empty() && ::access(path.c_str(), R_OK) != 0) {
        throw std::runtime_error("Cannot read " + path + ": " + std::strerror(errno) +
                                 ". Check providers.configuration.");
    }
}

void checkAdapters(const Settings& settings) {
    // As a start does it: reading the description is what finds its mistakes.
    if (settings.adapters.empty()) {
        ma::enumerateAdapters();
    } else {
        ma::Simulator(settings.adapters, settings.adapterState);
        requireWritable(settings.adapterState, "Check adapters.state.");
    }
}

}  // namespace

int checkConfiguration(const Settings& settings) {
    int status = 0;
    // Each step by itself, so that one run tells all that is wrong.
    const auto check = [&](const std::function<void()>& step) {
        try {
            step();
        } catch (const std::exception& error) {
            std::cerr << "quenx-cimd: " << error.what() << '\n';
            status = 2;
        }
    };
    const ListenSettings& listen = settings.listen;
    // First, since a daemon that runs already excuses its ports.
    bool isRunning = false;
    check([&] { isRunning = isDaemonRunning(settings.lockFile); });
    if (listen.https) check([&] { checkPort(listen.address, listen.httpsPort, isRunning); });
    if (listen.http) check([&] { checkPort(listen.address, listen.httpPort, isRunning); });
    if (listen.https) check([&] { checkTls(settings.tls); });
    check([&] { checkAuthentication(settings.authentication); });
    check([&] { checkProviderConfiguration(settings.providerConfiguration); });
    check([&] { checkProviders(settings); });
    check([&] { checkAdapters(settings); });
    if (status == 0) std::cout << "The configuration is valid.\n";
    return status;
}

}  // namespace host
