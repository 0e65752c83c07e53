// SPDX-License-Identifier: Apache-2.0
#include "Control/Sha256.h"

#include <gnutls/crypto.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <new>
#include <stdexcept>
#include <system_error>
#include <vector>

#include "Utils/Os/Linux/LoadedLibrary.h"
#include "Utils/Utils.h"

namespace control {

namespace {

struct HashFunctions {
    decltype(&::gnutls_hash_init) init;
    decltype(&::gnutls_hash) add;
    decltype(&::gnutls_hash_output) output;
    decltype(&::gnutls_hash_deinit) deinit;
};

HashFunctions load() {
    // The headers that this is compiled with are the same interface's.
    os::LoadedLibrary library("libgnutls.so.30");
    HashFunctions found{};
    library.find("gnutls_hash_init", found.init);
    library.find("gnutls_hash", found.add);
    library.find("gnutls_hash_output", found.output);
    library.find("gnutls_hash_deinit", found.deinit);
    if (!library.problem().empty())
        throw std::runtime_error("cannot load the library for SHA-256 sums: " + library.problem() +
                                 "; install the package libgnutls30");
    return found;
}

const HashFunctions& functions() {
    static const HashFunctions kFunctions = load();
    return kFunctions;
}

}  // namespace

void Sha256::Free::operator()(hash_hd_st* hash) const {
    functions().deinit(hash, nullptr);
}

Sha256::Sha256() {
    gnutls_hash_hd_t hash = nullptr;
    if (functions().init(&hash, GNUTLS_DIG_SHA256) != 0) throw std::bad_alloc();
    m_hash.reset(hash);
}

void Sha256::add(const void* bytes, std::size_t size) {
    functions().add(m_hash.get(), bytes, size);
}

std::string Sha256::take() {
    constexpr std::string_view kHex = "0123456789abcdef";
    std::array<unsigned char, kDigits / 2> sum{};
    functions().output(m_hash.get(), sum.data());
    std::string digits;
    for (const unsigned char byte : sum)
        digits += {kHex[byte >> 4], kHex[byte & 0xF]};
    return digits;
}

std::string sha256OfFile(int descriptor) {
    constexpr std::size_t kPiece = std::size_t{64} << 10;
    Sha256 hash;
    std::vector<char> piece(kPiece);
    if (::lseek(descriptor, 0, SEEK_SET) != 0) throw std::system_error(errno, std::generic_category());
    while (true) {
        const ssize_t got = ::read(descriptor, piece.data(), piece.size());
        if (got < 0 && errno == EINTR) continue;
        if (got < 0) throw std::system_error(errno, std::generic_category());
        if (got == 0) return hash.take();
        hash.add(piece.data(), static_cast<std::size_t>(got));
    }
}

bool isSha256(std::string_view text) {
    return text.size() == Sha256::kDigits &&
           std::ranges::all_of(text, [](char c) { return utils::isDigit(c) || (c >= 'a' && c <= 'f'); });
}

}  // namespace control
