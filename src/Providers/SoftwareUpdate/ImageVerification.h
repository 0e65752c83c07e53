// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "Providers/Schema/ProviderInterfaces.h"
#include "Providers/SoftwareUpdate/AdapterClaim.h"
#include "Utils/FirmwareTypes.h"

/// What the job registry is asked to install or to check.
struct UpdateOrder {
    std::string adapterName;
    std::string uri;
    std::vector<std::uint16_t> options;
    std::vector<std::string> values;  ///< beside the options
};

/// An image as the adapter API has prepared it for an adapter.
struct PreparedImage {
    std::unique_ptr<std::uint8_t[]> bytes;
    std::uint32_t size = 0;
    std::vector<utils::FirmwareType> types;  ///< those to install
};

/// An image that may be installed, with the claim on the adapter that it was verified for.
struct VerifiedImage {
    AdapterClaim claim;
    PreparedImage image;
};

/// The image types that the options ask for, none for all that the image has. Throws
/// utils::EInvalidParameter for a type that is not known, and leaves the claim alone.
std::vector<utils::FirmwareType> getTargetTypes(const std::vector<std::uint16_t>& options,
                                                const std::vector<std::string>& values);

/// Reads the image that the URI names, has the adapter API prepare it and judges the answer. Claims nothing.
/// Throws the refusals of MethodResults.h, and what the adapter API throws.
PreparedImage examineImage(const UpdateOrder& order);

/// Reads the image that the URI names, and judges it by the policy alone. Nothing is read where that does not
/// ask for signatures.
update::ImageTrust examineTrust(const std::string& uri);

/// The same as examineImage() with the adapter claimed. A refusal gives the claim back before it leaves; any
/// other failure keeps it, since the adapter is then in an unknown state, unless the configuration asks for
/// its release.
VerifiedImage verifyImage(const UpdateOrder& order);
