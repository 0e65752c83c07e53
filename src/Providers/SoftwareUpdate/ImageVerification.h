// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "Providers/SoftwareUpdate/AdapterClaim.h"
#include "Utils/FirmwareTypes.h"

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

/// Reads the image that the URI names, has the adapter API prepare it and judges the answer. Claims nothing.
/// Throws the refusals of MethodResults.h.
PreparedImage examineImage(const std::string& adapterName, const std::string& uri,
                           const std::vector<std::uint16_t>& installOptions,
                           const std::vector<std::string>& installOptionValues);

/// The same with the adapter claimed. A refusal gives the claim back before it leaves; any other failure
/// keeps it, since the adapter is then in an unknown state, unless the configuration asks for its release.
VerifiedImage verifyImage(const std::string& adapterName, const std::string& uri,
                          const std::vector<std::uint16_t>& installOptions,
                          const std::vector<std::string>& installOptionValues);
