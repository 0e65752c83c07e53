// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Simulator/Simulator.h"

#include "MidAPI/Image/ImageBuffers.h"
#include "MidAPI/Simulator/SimulatedAdapter.h"
#include "Utils/Log.h"
#include "Utils/Utils.h"

namespace ma {
namespace {

std::string unknown(const std::string& name) {
    return "there is no adapter " + name;
}

bool refuseUnknown(const std::string& name, std::uint32_t& errorCode, std::string& errorText) {
    errorCode = WriteError::UnknownAdapter;
    errorText = unknown(name);
    QUENX_ERROR_TEXT(errorText);
    return false;
}

}  // namespace

Simulator::Simulator(const std::string& descriptionFile, const std::string& stateDirectory)
    : Simulator(loadAdapterDescriptions(descriptionFile), stateDirectory) {
    m_descriptionFile = descriptionFile;
}

Simulator::Simulator(std::vector<AdapterDescription> adapters, const std::string& stateDirectory,
                     std::shared_ptr<FlashFiles> files)
    : m_stateDirectory(stateDirectory) {
    for (AdapterDescription& adapter : adapters)
        m_adapters.push_back(std::make_unique<SimulatedAdapter>(std::move(adapter), stateDirectory, files));
}

Simulator::~Simulator() = default;

SimulatedAdapter* Simulator::find(const std::string& name) const {
    for (const std::unique_ptr<SimulatedAdapter>& adapter : m_adapters)
        if (adapter->description().name == name) return adapter.get();
    return nullptr;
}

SimulatedAdapter& Simulator::require(const std::string& name) const {
    if (SimulatedAdapter* adapter = find(name)) return *adapter;
    throw AdapterError(unknown(name));
}

void Simulator::injectFault(const std::string& adapter, Fault fault) {
    require(adapter).faults().add(std::move(fault));
}

void Simulator::clearFaults(const std::string& adapter) {
    require(adapter).faults().clear();
}

FlashState Simulator::flashState(const std::string& adapter) const {
    return require(adapter).state();
}

std::vector<std::uint8_t> Simulator::flashContent(const std::string& adapter) const {
    return require(adapter).flashContent();
}

utils::StringArray Simulator::enumerateAdapters() {
    utils::StringArray names;
    for (const std::unique_ptr<SimulatedAdapter>& adapter : m_adapters) {
        try {
            FaultRun(adapter->faults(), Operation::Enumerate).reach();
        } catch (const OperationFailure& failure) {
            // All or none: a list that lacks one port would look as if a card had been pulled out.
            QUENX_ERROR_TEXT(failure.what());
            return {};
        }
        names.push_back(adapter->description().name);
    }
    return names;
}

utils::PCIAddr Simulator::getPCIAddress(const std::string& adapter) {
    try {
        return require(adapter).address();
    } catch (const OperationFailure& failure) {
        throw AdapterError("adapter " + adapter + ": " + failure.what());
    }
}

bool Simulator::getCanBeUpdated(const std::string& adapter) {
    const SimulatedAdapter* found = find(adapter);
    return found != nullptr && found->description().canBeUpdated;
}

bool Simulator::getAdapterFirmwareVersion(const std::string& adapter,
                                          std::vector<utils::FirmwareVersionInfo>& components) {
    SimulatedAdapter* found = find(adapter);
    return found != nullptr && found->readComponents(components);
}

int Simulator::prepareFlashImage(const std::string& adapter, const std::uint8_t* file, std::uint32_t fileSize,
                                 std::uint8_t* output, std::uint32_t* imageSize,
                                 std::vector<utils::FirmwareType>& types) {
    SimulatedAdapter* found = find(adapter);
    const auto buffers = ImageBuffers::of(file, fileSize, output, imageSize);
    if (found == nullptr || !buffers) {
        QUENX_ERROR("simulated adapter %s: status %d: %s", adapter.c_str(), PrepareStatus::InvalidParameter,
                    found == nullptr ? "there is no such adapter" : "a buffer is missing or too small");
        return PrepareStatus::InvalidParameter;
    }
    return found->prepare(*buffers, *imageSize, types);
}

bool Simulator::writeFlashImage(const std::string& adapter, const std::uint8_t* image,
                                std::uint32_t imageSize, std::uint32_t& errorCode, std::string& errorText) {
    SimulatedAdapter* found = find(adapter);
    if (found == nullptr) return refuseUnknown(adapter, errorCode, errorText);
    return found->write({image, image == nullptr ? 0 : imageSize}, errorCode, errorText);
}

bool Simulator::updateCapabilityWord(const std::string& adapter,
                                     const std::vector<utils::FirmwareType>& types, std::uint32_t& errorCode,
                                     std::string& errorText) {
    SimulatedAdapter* found = find(adapter);
    if (found == nullptr) return refuseUnknown(adapter, errorCode, errorText);
    return found->updateCapabilityWord(types, errorCode, errorText);
}

std::uint16_t Simulator::getFlashImageUpdateProgress(const std::string& adapter) {
    const SimulatedAdapter* found = find(adapter);
    return found != nullptr ? found->progress() : std::uint16_t{0};
}

bool Simulator::setBootType(const std::string& adapter, BootType type) {
    SimulatedAdapter* found = find(adapter);
    return found != nullptr && found->setBootType(type);
}

AdapterInfo Simulator::getAdapterInfo(const std::string& adapter) {
    AdapterInfo info = require(adapter).info();
    info.backend = kSimulatorBackend;
    return info;
}

std::string Simulator::describeSearch() {
    return fmt("Simulated adapters were looked for in %s, which describes %zu.", m_descriptionFile.c_str(),
               m_adapters.size());
}

}  // namespace ma
