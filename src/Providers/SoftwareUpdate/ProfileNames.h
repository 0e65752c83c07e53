#pragma once

/// How registered profiles are told apart: the InstanceID.
namespace ProfileName {

inline constexpr const char* SoftwareUpdate = "Quenx:SoftwareUpdate";
/// Registered by the provider that serves the ports.
inline constexpr const char* EthernetPort = "Quenx:EthernetPort";

}  // namespace ProfileName
