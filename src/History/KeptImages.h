// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <string>

#include "History/Record.h"

/// Images that were written, kept so that adapters can go back to them: files MODEL-SHA256 in a folder of the
/// user's own, where the policy names one.
namespace history {

/// How many are kept for each model of adapter: the one that it has, and the one before.
inline constexpr std::size_t kKeptForEachModel = 2;

/// Copies the image of a record into the folder, and removes the oldest of its model when there are too many.
/// @param model   the adapter's PCI ids, "1af4:1041"
/// @throws std::exception  which says why it is not kept: among other reasons because the file no longer has
///                         the sum of the record
void keepImage(const std::string& folder, const std::string& model, const Record& record);

/// Whether a file has this sum.
/// @param bytes  its size; a file of another one is not read
bool hasSum(const std::string& path, const std::string& sha256, std::int64_t bytes);

/// The first file with this sum in a folder or below it; nothing where there is none. Links are not followed,
/// and what cannot be read is passed over.
std::optional<std::string> findImage(const std::string& folder, const std::string& sha256,
                                     std::int64_t bytes);

}  // namespace history
