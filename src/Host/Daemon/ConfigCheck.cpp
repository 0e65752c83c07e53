#include "Host/Daemon/ConfigCheck.h"

#include <unistd.h>

#include <filesystem>
#include <functional>
#include <iostream>
#include <stdexcept>

#include "Host/Authentication/UsersFile.h"
#include "Host/Server/TlsIdentity.h"

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

void requireDirectory(const std::string& path) {
    if (!fs::is_directory(path)) throw std::runtime_error(path + ": is no directory");
}

void requireReadable(const std::string& path) {
    if (!path.empty() && ::access(path.c_str(), R_OK) != 0)
        throw std::runtime_error(path + ": cannot be read");
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
    if (settings.listen.https) check([&] { checkTls(settings.tls); });
    if (settings.authentication.method == "users") {
        check([&] { readUsersFile(settings.authentication.usersFile); });
    }
    check([&] { requireDirectory(settings.providers); });
    check([&] { requireReadable(settings.providerConfiguration); });
    check([&] { requireReadable(settings.adapters); });
    if (status == 0) std::cout << "The configuration is good.\n";
    return status;
}

}  // namespace host
