// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <memory>
#include <string>
#include <string_view>

struct hash_hd_st;

namespace control {

/// The SHA-256 of bytes that come piece by piece. Used from one thread. GnuTLS, which computes it, is loaded
/// with the first sum: it and the eight libraries that it needs take longer to load than most commands to
/// run.
class Sha256 {
  public:
    static constexpr std::size_t kDigits = 64;

    /// @throws std::bad_alloc
    /// @throws std::runtime_error  GnuTLS cannot be loaded
    Sha256();

    void add(const void* bytes, std::size_t size);
    /// Of what was added since the last call, in lower-case hexadecimal digits.
    std::string take();

  private:
    struct Free {
        void operator()(hash_hd_st* hash) const;
    };
    std::unique_ptr<hash_hd_st, Free> m_hash;
};

/// Of what can be read from a descriptor, from its beginning to its end; it stands at the end afterwards.
/// @throws std::system_error
/// @throws std::runtime_error  as Sha256()
std::string sha256OfFile(int descriptor);

/// Whether the text is such a sum.
bool isSha256(std::string_view text);

}  // namespace control
