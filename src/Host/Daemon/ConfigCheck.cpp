// SPDX-License-Identifier: Apache-2.0
#include <sys/stat.h>
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
#include "Host/Server/LocalSocket.h"
#include "Host/Server/ServerCertificate.h"
#include "Host/Server/TlsPriorities.h"
#include "MidAPI/ma.h"
#include "Utils/Os/Linux/PolicyFile.h"
#include "Utils/Os/Linux/linux.h"

namespace host {

namespace {

namespace fs = std::filesystem;

void warn(const std::string& text) {
    if (!text.empty()) std::cerr << "quenx-cimd: Warning: " << text << '\n';
}

/// For a file that a start makes: whether it could be made, in the nearest folder that is there.
fs::path nearestOf(const std::string& file) {
    fs::path nearest = fs::absolute(file);
    std::error_code unreachable;  // counts as missing: the folder above says why
    while (!fs::exists(nearest, unreachable))
        nearest = nearest.parent_path();
    return nearest;
}

void requireWritable(const std::string& file, const std::string& advice) {
    const fs::path nearest = nearestOf(file);
    int error = ::access(nearest.c_str(), W_OK) == 0 ? 0 : errno;
    if (error == 0 && nearest != fs::absolute(file) && !fs::is_directory(nearest)) error = ENOTDIR;
    if (error != 0)
        throw std::runtime_error("Cannot write " + file + ": " + std::strerror(error) + ". " + advice);
}

/// For a file of the folder that is made at the start, or of another one, which has to be there.
void requireFolder(const std::string& file, const std::string& setting) {
    if (isInDefaultFolder(file)) return requireWritable(file, "Run as root, or set " + setting + ".");
    const fs::path directory = fs::absolute(file).parent_path();
    if (fs::is_directory(directory)) return;
    throw std::runtime_error(setting + " is " + file + ", but there is no directory " + directory.string() +
                             ". Make it, or set " + setting + " to another file.");
}

/// Whether a daemon holds the lock file. Does not make it where it is missing.
bool isDaemonRunning(const std::string& file) {
    if (fs::exists(file)) return !LockFile(file).isHeld();
    requireFolder(file, "daemon.lock_file");
    return false;
}

/// For what can be listened on: unless the daemon that a start would replace does so already.
void checkListening(const std::function<void()>& step, bool isRestart) {
    try {
        step();
    } catch (const ListenError& error) {
        if (!isRestart || error.code() != EADDRINUSE) throw;
    }
}

void checkPort(const std::string& address, std::uint16_t port) {
    const os::Descriptor listener(openListener(address, port));
}

void checkSocket(const std::string& path) {
    if (path.empty()) return;
    requireFolder(path, "listen.socket");
    if (fs::is_directory(fs::absolute(path).parent_path())) LocalSocket::check(path);
}

void checkTls(const TlsSettings& settings) {
    requireTlsPriorities(tlsPriorities());
    if (!areTlsFilesToBeMade(settings) && !isCertificateToBeRenewed(settings)) {
        warn(ServerCertificate(settings.certificate, settings.key).warning());
        return;
    }
    for (const std::string& file : {settings.certificate, settings.key})
        requireWritable(file, "Run as root, or set tls.certificate and tls.key to files that exist.");
}

void checkAuthentication(const AuthenticationSettings& settings) {
    const std::string service = "/etc/pam.d/quenx-cimd";
    if (settings.method == "users") {
        UsersFile(settings.usersFile);
    } else if (!fs::exists(service)) {
        // It can work: "other" is strict on most systems, but whom it lets in is not this program's choice.
        warn(service +
             " does not exist, so PAM applies its service \"other\". Copy the file from the installation.");
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
    if (os::isSpecialFile(path) || fs::is_directory(path))
        throw std::runtime_error(path + " is not a regular file. Check providers.configuration.");
}

void checkAdapters(const Settings& settings) {
    // As a start does it: reading the description is what finds its mistakes.
    ma::selectBackend(adaptersOf(settings));
    if (!settings.adapterState.empty()) requireWritable(settings.adapterState, "Check adapters.state.");
}

/// A start goes on without a folder for images that are sent, so this is no error.
void checkUploads(const UploadSettings& settings) try {
    const bool isSet = settings.directory != UploadSettings{}.directory;
    if (settings.directory.empty() || (!isSet && !fs::exists(settings.directory))) return;
    const std::string advice = "Set uploads.directory to another folder, or to \"\".";
    // Of a file in the folder, so that the folder has to be one.
    requireWritable(settings.directory + "/image", advice);
    struct stat status {};
    const fs::path nearest = nearestOf(settings.directory);
    ::stat(nearest.c_str(), &status);
    const bool isOwn = status.st_uid == 0 || status.st_uid == ::geteuid();
    const bool isOpen = isOwn && nearest == fs::absolute(settings.directory) && (status.st_mode & 077) != 0;
    if (isOpen)
        throw std::runtime_error("others may look into " + nearest.string() + "; run: chmod 700 " +
                                 nearest.string());
    if (!isOwn)
        throw std::runtime_error(nearest.string() + " belongs to user " + std::to_string(status.st_uid) +
                                 ". " + advice);
} catch (const std::exception& error) {
    warn(std::string("No images are taken: ") + error.what());
}

void checkSubscriptionsFile(const std::string& file) {
    const bool isSet = file != IndicationSettings{}.file;
    if (file.empty() || (!isSet && !fs::exists(file))) return;
    const std::string advice = "Set indications.file to another file, or to \"\".";
    if (fs::exists(file) && !fs::is_regular_file(file))
        throw std::runtime_error("indications.file is " + file + ", which is no file. " + advice);
    requireWritable(file, advice);
    // The one that it is in is made where it is missing.
    const fs::path above = fs::absolute(file).parent_path().parent_path();
    if (!fs::is_directory(above))
        throw std::runtime_error("There is no directory " + above.string() + ". Make it. " + advice);
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
    const auto checkListener = [&](const std::function<void()>& step) {
        check([&] { checkListening(step, isRunning); });
    };
    if (listen.https) checkListener([&] { checkPort(listen.address, listen.httpsPort); });
    if (listen.http) checkListener([&] { checkPort(listen.address, listen.httpPort); });
    checkListener([&] { checkSocket(listen.socket); });
    for (const std::string& text : warningsOf(settings, mostDescriptors()))
        warn(text);
    if (listen.https) check([&] { checkTls(settings.tls); });
    check([&] { checkAuthentication(settings.authentication); });
    check([&] { checkProviderConfiguration(settings.providerConfiguration); });
    check([&] { utils::PolicyFile(settings.policy).current(); });
    check([&] { checkProviders(settings); });
    check([&] { checkAdapters(settings); });
    check([&] { checkSubscriptionsFile(settings.indications.file); });
    checkUploads(settings.uploads);
    if (status == 0) std::cout << "The configuration is valid.\n";
    return status;
}

}  // namespace host
