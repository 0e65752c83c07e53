// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <filesystem>
#include <string>
#include <vector>

#include "Support/TempFolder.h"
#include "Trust/Verifier.h"

namespace test {

/// A folder with an image, keys and signatures as people make them, and the folder of those that are trusted.
class Workshop {
  public:
    using Options = std::vector<std::string>;

    Workshop();

    /// Makes a key and its certificate, valid from today on for some days: NAME.key and NAME.pem.
    void makeKey(const std::string& name, const std::string& kind = "ec");
    /// Makes a certificate that was valid in 2020 alone.
    void makeOldKey(const std::string& name);
    /// Puts the certificate into the folder of trusted keys.
    void pin(const std::string& name) const;
    /// Makes the detached signature of a file by a key, beside it.
    std::string sign(const std::string& path, const std::string& key, const Options& more = {}) const;
    /// Gives an image a signed manifest with this text.
    void writeManifest(const std::string& text, const std::string& key,
                       const std::string& name = "port.rom") const;

    std::string operator/(const std::string& name) const { return folder / name; }

    core::TrustVerdict judge(std::time_t (*clock)() = nullptr) const;

    TempFolder folder;
    const std::string keys = folder / "keys";
    const std::string image = folder / "port.rom";
    std::vector<std::uint8_t> bytes;
    std::optional<std::array<std::uint16_t, 4>> ids = {{0x1af4, 0x1041, 0x1af4, 0x1100}};

  private:
    static void openssl(const Options& arguments);
};

}  // namespace test
