// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <cstdint>
#include <string>
#include <variant>
#include <vector>

#include "Host/Settings.h"

namespace host {

/// One setting: its place in the configuration file, its option, and what it sets. File and command line are
/// read by the same list, so that neither knows a setting that the other does not.
struct SettingsField {
    using Target = std::variant<bool*, std::uint16_t*, unsigned int*, std::size_t*, std::chrono::seconds*,
                                std::string*, std::vector<std::string>*>;

    std::string key;  ///< "section.name" in the file; the option is "--section-name"
    Target target;
    std::string help;
    std::uint64_t least = 0;  ///< of a number; of a text, characters
    std::uint64_t most = 0;   ///< of a number
    bool takesOne = false;    ///< of a list: its one text may stand for it

    std::string option() const;
    bool isFlag() const { return std::holds_alternative<bool*>(target); }
    bool isNumber() const { return !isFlag() && !isText(); }
    bool isText() const { return std::holds_alternative<std::string*>(target) || isList(); }
    bool isList() const { return std::holds_alternative<std::vector<std::string>*>(target); }

    /// Sets the value from its text ("true" and "false" for a flag; a list gets one more element). Throws
    /// std::runtime_error that says what would be right.
    void set(const std::string& text) const;
    /// The value as text, for the help.
    std::string text() const;
    /// The numbers it may be, as "1 to 4096".
    std::string range() const;
};

/// All settings, pointing into the given ones.
std::vector<SettingsField> fieldsOf(Settings& settings);

/// Reads a TOML file over the settings. Throws std::runtime_error that names file, line and mistake; a key
/// that is not known is one.
void readSettingsFile(const std::string& file, Settings& settings);

/// Checks what the single fields cannot know. Throws std::runtime_error.
void checkSettings(const Settings& settings);

}  // namespace host
