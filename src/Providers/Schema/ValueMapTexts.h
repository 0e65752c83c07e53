// SPDX-License-Identifier: Apache-2.0
#pragma once

/// Value maps that several classes share, in the form of core::CimElementText::values.
namespace schema {

inline constexpr const char* kExtendedResourceTypes =
    "0=Unknown;1=Other;2=Not Applicable;3=Linux RPM;4=HP-UX Depot;5=Windows MSI;6=Solaris "
    "Package;7=Macintosh Disk Image;8=Debian linux Package;9=VMware vSphere Installation Bundle;10=VMware "
    "Software Bulletin;11=HP Smart Component;12..32767=DMTF Reserved;32768..65535=Vendor Reserved";

inline constexpr const char* kInstallOptions =
    "2=Defer target/system reset;3=Force "
    "installation;4=Install;5=Update;6=Repair;7=Reboot;8=Password;9=Uninstall;10=Log;11=SilentMode;12="
    "AdministrativeMode;13=ScheduleInstallAt;..=DMTF Reserved;32768..65535=Vendor Specific";

}  // namespace schema
