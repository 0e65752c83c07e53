#pragma once

/// Values of InstallOptions (DMTF CIM_SoftwareInstallationService), as far as this provider acts on them.
namespace InstallOption {

inline constexpr unsigned short ForceInstallation = 3;
inline constexpr unsigned short Update = 5;
/// The first vendor-specific value: the option value at the same position lists target types, joined by plus
/// signs.
inline constexpr unsigned short TargetTypes = 32768;
/// What stands between target types in an option value.
inline constexpr char TargetTypeSeparator = '+';

}  // namespace InstallOption
