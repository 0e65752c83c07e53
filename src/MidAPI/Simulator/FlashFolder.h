// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "MidAPI/Simulator/FlashState.h"

namespace ma {

/// What a folder tells of its adapter.
struct FoundState {
    std::optional<FlashState> state;  ///< nothing: never written to
    std::string damage;               ///< what is damaged, and what stands in for it; empty when nothing is
};

/// Reads the files of one adapter's flash, while others may write them. docs/image-format.md describes them.
/// No lock and no state; operations throw std::system_error for what may not be read.
class FlashFolder {
  public:
    explicit FlashFolder(std::string path) : m_path(std::move(path)) {}

    const std::string& path() const { return m_path; }
    std::string file(const char* name) const { return m_path + "/" + name; }
    std::string record() const { return file("state"); }
    std::string copy() const { return file("state.copy"); }
    std::string bank(std::uint8_t number) const { return file(number == 0 ? "bank-0.rom" : "bank-1.rom"); }

    /// The record or, when that is damaged, its copy or, when that is no good either, what the banks tell.
    /// @param factory  for what no bank tells
    /// @throws std::runtime_error when there is damage and nothing whole is left
    FoundState findState(const FlashState& factory) const;
    /// The same where the record is of no use; no state when nothing whole is left.
    /// @param why  for the text: "is damaged"
    FoundState findWithoutRecord(const FlashState& factory, const std::string& why) const;
    /// Whether a bank holds what the record says.
    bool isBootable(const FlashState& state) const;

    /// The content of a bank, when it is what the record says.
    std::optional<std::vector<std::uint8_t>> bankContent(const FlashState& state, std::uint8_t number) const;

  private:
    std::optional<FlashState> rebuild(const FlashState& factory) const;

    const std::string m_path;
};

}  // namespace ma
