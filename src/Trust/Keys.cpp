// SPDX-License-Identifier: Apache-2.0
#include "Trust/Keys.h"

#include <fcntl.h>
#include <gnutls/x509.h>
#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <string_view>
#include <system_error>

#include "Trust/Refusal.h"
#include "Utils/Os/Linux/OwnFiles.h"
#include "Utils/Os/Linux/linux.h"

namespace trust {

namespace {

constexpr std::size_t kMostFiles = 256;
constexpr std::size_t kLargestFile = std::size_t{64} << 10;

[[noreturn]] void refuse(const std::string& path, const std::string& what) {
    throw Refusal(core::ReasonId::KeysFolderBad, path + ": " + what);
}

void requireOwn(const os::Descriptor& opened, const std::string& path, const std::string& subject) {
    const std::string problem = os::whoElseMayChange(opened, path);
    if (!problem.empty()) refuse(path, subject + " of trusted keys " + problem);
}

bool isCertificateName(std::string_view name) {
    return std::ranges::any_of(std::initializer_list<std::string_view>{".pem", ".crt", ".der"},
                               [&](std::string_view ending) { return name.ends_with(ending); });
}

os::Descriptor openFolder(const std::string& path) {
    os::Descriptor folder(::open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (!folder.isOpen() && errno == ENOENT)
        refuse(path, "there is no such folder; make it, and put the certificates there that are trusted");
    if (!folder.isOpen())
        refuse(path,
               "the folder of trusted keys cannot be opened: " + std::generic_category().message(errno));
    requireOwn(folder, path, "the folder");
    return folder;
}

/// Opened in the folder that was looked at, and looked at once it is open.
std::string contentOf(const os::Descriptor& folder, const std::string& name, const std::string& path) {
    constexpr int kFlags = O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC;
    const os::Descriptor file(::openat(folder.number(), name.c_str(), kFlags));
    if (!file.isOpen() && errno == ELOOP)
        refuse(path, "it is a symbolic link, which others may turn; put the certificate itself there");
    if (!file.isOpen()) refuse(path, "it cannot be opened: " + std::generic_category().message(errno));
    struct stat status {};
    if (::fstat(file.number(), &status) != 0 || !S_ISREG(status.st_mode))
        refuse(path, "it is not a regular file; put a certificate there, or remove it");
    requireOwn(file, path, "the file");
    std::string content = os::readUpTo(file, kLargestFile + 1);
    if (content.size() > kLargestFile) refuse(path, "it is larger than 64 KiB; put one certificate there");
    return content;
}

std::vector<Certificate> certificatesIn(std::string& content, const std::string& path) {
    const bool isPem = content.find("-----BEGIN ") != std::string::npos;
    const gnutls_datum_t bytes{reinterpret_cast<unsigned char*>(content.data()),
                               static_cast<unsigned int>(content.size())};
    gnutls_x509_crt_t* list = nullptr;
    unsigned int count = 0;
    const int status = ::gnutls_x509_crt_list_import2(&list, &count, &bytes,
                                                      isPem ? GNUTLS_X509_FMT_PEM : GNUTLS_X509_FMT_DER, 0);
    if (status < 0)
        refuse(path, std::string("it is no certificate (") + ::gnutls_strerror(status) +
                         "); put one there in PEM or DER, or remove it");
    std::vector<Certificate> certificates;
    for (unsigned int i = 0; i < count; ++i)
        certificates.emplace_back(list[i]);
    ::gnutls_free(list);
    return certificates;
}

}  // namespace

void FreeCertificate::operator()(gnutls_x509_crt_int* certificate) const {
    ::gnutls_x509_crt_deinit(certificate);
}

std::vector<Key> readKeys(const std::string& folder) try {
    const os::Descriptor opened = openFolder(folder);
    utils::StringArray names = os::listDirectory(folder);
    std::erase_if(names, [](const std::string& name) { return !isCertificateName(name); });
    if (names.size() > kMostFiles)
        refuse(folder, "it has more than " + std::to_string(kMostFiles) +
                           " certificates; leave those there that sign images");
    std::vector<Key> keys;
    for (const std::string& name : names) {
        const std::string path = folder + "/" + name;
        std::string content = contentOf(opened, name, path);
        for (Certificate& certificate : certificatesIn(content, path))
            keys.push_back({std::filesystem::path(name).stem().string(), std::move(certificate)});
    }
    return keys;
} catch (const std::system_error& error) {
    refuse(folder, std::string("the keys cannot be read: ") + error.what());
}

}  // namespace trust
