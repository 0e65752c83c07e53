// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "Framework/Requests/Reasons.h"
#include "Utils/Export.h"
#include "Utils/FirmwareTypes.h"
#include "Utils/StringArray.h"
#include "Utils/Time.h"

namespace core {
class CimOperations;
class CimPath;
}  // namespace core

// What instances can do for other providers and for a front in the same process, beside what clients see. Who
// needs them finds an instance through the broker and asks it by dynamic_cast from core::CimInstance; no
// provider library links another. All operations may be called from any thread, while the instance is held.

namespace inventory {

/// One port of an Ethernet adapter.
class QUENX_EXPORT EthernetPort {
  public:
    virtual ~EthernetPort();
    /// The name by which the adapter API knows the port; never empty.
    virtual std::string getAdapterName() const = 0;
    virtual utils::PCIAddr getPCIAddress() const = 0;
};

/// The card that carries a number of ports.
class QUENX_EXPORT PortController {
  public:
    virtual ~PortController();
    /// Bus and device of the card; it carries no function.
    virtual utils::PCIAddr getPCIAddress() const = 0;
    /// True when the address is that of one of the card's functions.
    virtual bool holds(const utils::PCIAddr& address) const = 0;
    /// True when holds() is true for functions of getPCIAddress() alone. Who looks for the controller of a
    /// port need not ask then about ports elsewhere. A controller that cannot promise it is asked about all.
    virtual bool holdsOneDevice() const { return false; }
};

/// A piece of firmware: in a file that can be installed, or on an adapter.
class QUENX_EXPORT SoftwareIdentity {
  public:
    /// What getTypeCode() tells apart.
    enum TypeCode : int {
        InstalledComponent = 1,  ///< runs on an adapter
        FirmwareImage = 4,       ///< a file that can be installed
    };

    virtual ~SoftwareIdentity();
    /// Equal to SoftwareIdentityResource::getFirmwareFileID() of the resource that has the file.
    virtual std::string getIdentifier() const = 0;
    virtual int getTypeCode() const = 0;
    /// Names of the image types in it, such as "IMG_PXE"; empty when there are none that can be installed.
    virtual utils::StringArray getTargetTypes() const = 0;
};

/// Where the file of a software identity is.
class QUENX_EXPORT SoftwareIdentityResource {
  public:
    virtual ~SoftwareIdentityResource();
    /// The identifier of the firmware file that the resource stands for.
    virtual std::string getFirmwareFileID() const = 0;
    /// The file's URI.
    virtual std::string getAccessInfo() const = 0;
};

}  // namespace inventory

namespace update {

/// The hold on the one adapter that a process services at a time.
struct Claim {
    std::string adapter = {};  ///< empty while none is held
    std::string user = {};     ///< who had it claimed, as the front knows him; empty where none said
    std::string job = {};      ///< the InstanceID of the job that it is for; empty for a check
    utils::Time since{};
    bool isAtWork = false;  ///< a verification or a job needs it; false for what a check has left behind
};

/// What became of a claim that was to be given back.
enum class ClaimRelease { Freed, NotHeld, AtWork };

/// What the policy of the machine says of an image, whatever adapter it is for.
struct ImageTrust {
    bool isAsked = false;  ///< the policy wants images to be signed; false: nothing was looked at
    std::string key = {};  ///< by which it is trusted; empty for one that is not
    core::ReasonId reason = core::ReasonId::None;  ///< why it is not; None where nobody can tell
    std::string why = {};                          ///< the same in words
};

/// Judges images without installing them, and tells which adapter the process holds, and for whom.
class QUENX_EXPORT ImageCheck {
  public:
    virtual ~ImageCheck();
    /// Verifies the image at a URI as InstallFromURI does with these arguments, and ends there: no job is
    /// created and no adapter is claimed, now or afterwards, so that an update may run meanwhile. Returns 0
    /// for an image that could be installed, else what InstallFromURI returns. Thread-safe.
    virtual unsigned int checkImage(const std::string& uri, const core::CimPath& target,
                                    const std::vector<std::uint16_t>& options,
                                    const std::vector<std::string>& values) = 0;
    /// Whether the policy would let the image at a URI be installed; claims nothing. Reads the whole file
    /// where the policy asks for signatures. Thread-safe. @throws core::CimError where the policy cannot be
    /// obeyed
    virtual ImageTrust trustOf(const std::string& uri) = 0;
    /// The adapter that is claimed in this process, by an update or by a check; empty for none. Thread-safe.
    virtual std::string claimedAdapter() const = 0;
    /// The same with who holds it, and for what. Thread-safe.
    virtual Claim claim() const = 0;
    /// Frees the adapter from a claim that a check has left behind; one that a job or a verification needs
    /// stays. Thread-safe. @throws core::CimError where the policy does not let the caller
    virtual ClaimRelease releaseClaim(const std::string& adapter) = 0;
};

/// The image check of the service that the path names, where it has one; null otherwise. Good until the
/// calling thread's request scope ends.
QUENX_EXPORT ImageCheck* findImageCheck(core::CimPath& service);

/// The adapter that is claimed in this process; empty for none, or where nobody serves updates.
QUENX_EXPORT std::string claimedAdapter(core::CimOperations& operations);

}  // namespace update
