#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "Utils/FirmwareTypes.h"

/// An image as the adapter API prepared it for an adapter.
struct PreparedImage {
    std::unique_ptr<std::uint8_t[]> bytes;
    std::uint32_t size = 0;
    std::vector<utils::FirmwareType> types;  ///< to install
};

/// Reads an image, lets the adapter API prepare it and judges the answer: what an installation and a check
/// share. Neither looks at the adapter claim nor takes it. Throws the refusals of UpdateExceptions.h.
PreparedImage examineImage(const std::string& adapterName, const std::string& uri,
                           const std::vector<unsigned short>& installOptions,
                           const std::vector<std::string>& installOptionValues);

/// The image types that the options ask for. Throws utils::EInvalidParameter for a type that is not known.
std::vector<utils::FirmwareType> requestedTypes(const std::vector<unsigned short>& installOptions,
                                                const std::vector<std::string>& installOptionValues);
