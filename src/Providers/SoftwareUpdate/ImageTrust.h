// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <span>
#include <string>

#include "Utils/Os/Linux/PatientReading.h"

/// What the policy of the machine asks of an image, whatever the adapter says. Without a policy nothing.
/// Every operation throws EAdapterNotSupported for an image that may not be written, and notes why.

/// The image lies below one of the folders in which images may lie, among them those that the object manager
/// itself fills: of uploads, and of images that were written.
void requireAllowedPlace(const std::string& uri, const os::FileLook& file);

/// The largest image in bytes that the policy allows; 0 for any.
std::int64_t largestAllowedImage();
[[noreturn]] void refuseTooLarge(const std::string& uri, std::int64_t size);

/// Somebody whom the policy trusts has signed these bytes for such an adapter.
/// @param path         of the file from which the bytes are
/// @param adapterName  empty where only the signature matters
void requireTrust(const std::string& uri, const std::string& path, std::span<const std::uint8_t> bytes,
                  const std::string& adapterName);
