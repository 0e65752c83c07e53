// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "Utils/Export.h"

namespace utils {

/// A policy that cannot be obeyed. what() names the file, the line if it has one, and what would be right.
class QUENX_EXPORT PolicyError : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
    PolicyError(const PolicyError&) = default;
    PolicyError& operator=(const PolicyError&) = default;
    ~PolicyError() override;
};

/// Whether a history of updates is kept.
enum class HistoryRule {
    Off,
    Wanted,   ///< where it cannot be kept, updates take place all the same
    Required  ///< where it cannot, none does
};

/// What an image needs beside its bytes to be written.
enum class TrustRule {
    Off,
    Signature  ///< one by a key of the policy's folder, for it or for a manifest that names it
};

/// What the administrators of a machine want kept to, as one reading of their file has it. Whatever is absent
/// restricts nothing.
struct Policy {
    /// Who may call methods and delete instances. The list is complete: root has to be in it, too.
    std::optional<std::vector<std::string>> administrators;
    std::string administratorsPlace;  ///< "/etc/quenx/policy.toml, line 3"
    HistoryRule history = HistoryRule::Wanted;
    std::int64_t historyRecords = 100'000;  ///< how many are kept
    bool historyServed = false;             ///< to clients of the model
    /// Whether a check gives back the adapter that it claimed; absent: as ReleaseClaimAfterCheck has it.
    std::optional<bool> releaseClaimAfterCheck;
    std::string keepImages;  ///< a folder for images that were written; empty for none
    /// The folders below which images may lie, links resolved; absent: anywhere.
    std::optional<std::vector<std::string>> imageDirectories;
    std::int64_t largestImage = 0;  ///< bytes; 0 for any
    TrustRule trust = TrustRule::Off;
    std::string trustKeys = "/etc/quenx/keys";  ///< the folder with the certificates that are trusted
};

/// Reads the text of a policy, whole: a key that nothing here obeys would promise what nobody keeps.
/// @param fileName  for the texts
/// @throws PolicyError
QUENX_EXPORT Policy parsePolicy(std::string_view text, const std::string& fileName);

}  // namespace utils
