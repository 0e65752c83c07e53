// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/Settings.h"

#include <array>
#include <system_error>

#include "MidAPI/Image/OptionRom.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Toml.h"

namespace ma::devlink {
namespace {

using utils::TomlTable;

constexpr const char* kVariable = "QUENX_DEVLINK";
constexpr const char* kDefaultFile = "/etc/quenx-devlink.toml";

constexpr std::array<std::string_view, 4> kTopKeys = {"firmware_folder", "largest_image", "component",
                                                      "package_component"};
constexpr std::array<std::string_view, 3> kComponentKeys = {"type", "component", "version"};
constexpr std::array<std::string_view, 2> kPackageKeys = {"identifier", "version"};

ComponentTable::Row readComponent(const TomlTable& table) {
    table.allowOnly(kComponentKeys);
    ComponentTable::Row row;
    const std::string type = table.requiredText("type", "IMG_PXE");
    if (const auto known = firmwareTypeFromName(type))
        row.type = *known;
    else
        table.refuse("type", type, "IMG_CLP, IMG_iSCSI, IMG_PXE, IMG_UEFI or IMG_FCoE");
    row.component = table.requiredText("component", "fw.undi");
    row.version = table.text("version").value_or(row.component);
    return row;
}

ComponentTable::PackageRow readPackageComponent(const TomlTable& table) {
    table.allowOnly(kPackageKeys);
    const auto identifier = table.number<std::uint16_t>("identifier");
    if (!identifier)
        table.fail("identifier", "\"identifier\" is missing; write for example identifier = 256");
    return {*identifier, table.requiredText("version", "fw.mgmt")};
}

/// Nothing where nobody named a file and the usual one is not there.
std::optional<std::string> readSettings(const char* named, const std::string& path) try {
    auto text = os::readTextFile(path);
    if (text || named == nullptr) return text;
    throw AdapterError(std::string(kVariable) + ": there is no file " + path + "; name a readable file");
} catch (const os::UnusableFile& error) {
    throw AdapterError("the settings of devlink: " + path + " " + error.what());
} catch (const std::system_error& error) {
    throw AdapterError(std::string("the settings of devlink: ") + error.what());
}

}  // namespace

Settings parseSettings(std::string_view text, const std::string& fileName) try {
    const toml::table parsed = utils::parseToml(text);
    const TomlTable top(parsed, "the settings of devlink");
    top.allowOnly(kTopKeys);
    Settings settings;
    settings.firmwareFolder = top.text("firmware_folder").value_or("");
    settings.largestImage = top.number<std::uint32_t>("largest_image").value_or(settings.largestImage);
    for (const toml::table* node : top.tables("component"))
        settings.components.set(readComponent(top.inner(*node, "a component")));
    for (const toml::table* node : top.tables("package_component"))
        settings.components.set(readPackageComponent(top.inner(*node, "a component of packages")));
    return settings;
} catch (const utils::TomlError& error) {
    throw AdapterError(error.in(fileName));
}

Settings loadSettings() {
    const char* named = os::getEnvVariable(kVariable);
    const std::string path = named == nullptr ? kDefaultFile : named;
    const auto text = readSettings(named, path);
    return text ? parseSettings(*text, path) : Settings();
}

}  // namespace ma::devlink
