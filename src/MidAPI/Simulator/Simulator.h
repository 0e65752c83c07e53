// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "MidAPI/Backend.h"
#include "MidAPI/Simulator/AdapterDescription.h"
#include "MidAPI/Simulator/Fault.h"
#include "MidAPI/Simulator/FlashStore.h"
#include "Utils/Export.h"

namespace ma {

class SimulatedAdapter;

/// The backend of simulated adapters. Several processes may work on one state directory.
class QUENX_EXPORT Simulator : public Backend {
  public:
    /// Throw AdapterError when the description, or a flash file that it names, has a mistake in it. The state
    /// directory need not be there: it is made at the first change.
    Simulator(const std::string& descriptionFile, const std::string& stateDirectory);
    Simulator(std::vector<AdapterDescription> adapters, const std::string& stateDirectory,
              std::shared_ptr<FlashFiles> files = std::make_shared<FlashFiles>());
    ~Simulator() override;

    /// Orders a fault, beside those of the description. Throws AdapterError for an unknown adapter.
    void injectFault(const std::string& adapter, Fault fault);
    /// Cancels all faults of an adapter, also those of the description.
    void clearFaults(const std::string& adapter);
    /// The persistent record of an adapter and the content of its flash. Throw AdapterError or
    /// std::runtime_error.
    FlashState flashState(const std::string& adapter) const;
    std::vector<std::uint8_t> flashContent(const std::string& adapter) const;

    utils::StringArray enumerateAdapters() override;
    utils::PCIAddr getPCIAddress(const std::string& adapter) override;
    bool getCanBeUpdated(const std::string& adapter) override;
    bool getAdapterFirmwareVersion(const std::string& adapter,
                                   std::vector<utils::FirmwareVersionInfo>& components) override;
    int prepareFlashImage(const std::string& adapter, const std::uint8_t* file, std::uint32_t fileSize,
                          std::uint8_t* output, std::uint32_t* imageSize,
                          std::vector<utils::FirmwareType>& types) override;
    bool writeFlashImage(const std::string& adapter, const std::uint8_t* image, std::uint32_t imageSize,
                         std::uint32_t& errorCode, std::string& errorText) override;
    bool updateCapabilityWord(const std::string& adapter, const std::vector<utils::FirmwareType>& types,
                              std::uint32_t& errorCode, std::string& errorText) override;
    std::uint16_t getFlashImageUpdateProgress(const std::string& adapter) override;
    bool setBootType(const std::string& adapter, BootType type) override;
    AdapterInfo getAdapterInfo(const std::string& adapter) override;
    std::string name() const override { return kSimulatorBackend; }
    std::string describeSearch() override;
    std::string stateFolder() const override { return m_stateDirectory; }

  private:
    SimulatedAdapter* find(const std::string& name) const;
    SimulatedAdapter& require(const std::string& name) const;

    std::vector<std::unique_ptr<SimulatedAdapter>> m_adapters;  // not changed after construction
    const std::string m_stateDirectory;
    std::string m_descriptionFile;  // nor this; empty when there was none
};

}  // namespace ma
