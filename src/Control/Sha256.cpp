// SPDX-License-Identifier: Apache-2.0
#include "Control/Sha256.h"

#include <gnutls/crypto.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <new>
#include <system_error>
#include <vector>

#include "Utils/Utils.h"

namespace control {

void Sha256::Free::operator()(hash_hd_st* hash) const {
    ::gnutls_hash_deinit(hash, nullptr);
}

Sha256::Sha256() {
    gnutls_hash_hd_t hash = nullptr;
    if (::gnutls_hash_init(&hash, GNUTLS_DIG_SHA256) != 0) throw std::bad_alloc();
    m_hash.reset(hash);
}

void Sha256::add(const void* bytes, std::size_t size) {
    ::gnutls_hash(m_hash.get(), bytes, size);
}

std::string Sha256::take() {
    constexpr std::string_view kHex = "0123456789abcdef";
    std::array<unsigned char, kDigits / 2> sum{};
    ::gnutls_hash_output(m_hash.get(), sum.data());
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
