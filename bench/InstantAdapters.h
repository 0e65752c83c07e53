// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <string>

#include "MidAPI/Backend.h"
#include "Support/TempFolder.h"
#include "Utils/Os/Linux/SMASHv2Config.h"

namespace bench {

/// Any number of adapters that accept every image at once: what is measured is the provider, not a device.
/// Four ports to a card. Stands in for the process's backend while it lives, with a configuration of its own.
class InstantAdapters {
  public:
    /// @param images  how many image files the inventory serves, each another firmware
    explicit InstantAdapters(std::size_t ports, std::size_t images = 1);
    ~InstantAdapters();
    InstantAdapters(const InstantAdapters&) = delete;
    InstantAdapters& operator=(const InstantAdapters&) = delete;

    static std::string portName(std::size_t index);
    /// The first of the images, of one kilobyte, which every adapter takes.
    const std::string& imageUri() const { return m_imageUri; }

  private:
    test::TempFolder m_folder;
    utils::SMASHv2Config m_config;
    std::string m_imageUri;
    std::shared_ptr<ma::Backend> m_previous;
};

}  // namespace bench
