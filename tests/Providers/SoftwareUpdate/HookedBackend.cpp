#include "Providers/SoftwareUpdate/HookedBackend.h"

namespace test {

namespace {

bool answer(const HookedBackend::Refusal& refusal, uint32_t& errorCode, std::string& errorText) {
    errorCode = refusal.code;
    errorText = refusal.text;
    return refusal.succeeds;
}

}  // namespace

utils::StringArray HookedBackend::enumerateAdapters() {
    call("enumerateAdapters", "");
    return m_next->enumerateAdapters();
}

utils::PCIAddr HookedBackend::getPCIAddress(const std::string& adapter) {
    call("getPCIAddress", adapter);
    return m_next->getPCIAddress(adapter);
}

bool HookedBackend::getCanBeUpdated(const std::string& adapter) {
    call("getCanBeUpdated", adapter);
    return m_next->getCanBeUpdated(adapter);
}

bool HookedBackend::getAdapterFirmwareVersion(const std::string& adapter,
                                              std::vector<utils::FirmwareVersionInfo>& components) {
    call("getAdapterFirmwareVersion", adapter);
    return m_next->getAdapterFirmwareVersion(adapter, components);
}

int HookedBackend::prepareFlashImage(const std::string& adapter, const uint8_t* file, uint32_t fileSize,
                                     uint8_t* output, uint32_t* imageSize,
                                     std::vector<utils::FirmwareType>& types) {
    call("prepareFlashImage", adapter);
    const int status = m_next->prepareFlashImage(adapter, file, fileSize, output, imageSize, types);
    return prepareStatus.value_or(status);
}

bool HookedBackend::writeFlashImage(const std::string& adapter, const uint8_t* image, uint32_t imageSize,
                                    uint32_t& errorCode, std::string& errorText) {
    call("writeFlashImage", adapter);
    if (writeAnswer) return answer(*writeAnswer, errorCode, errorText);
    return m_next->writeFlashImage(adapter, image, imageSize, errorCode, errorText);
}

bool HookedBackend::updateCapabilityWord(const std::string& adapter,
                                         const std::vector<utils::FirmwareType>& types, uint32_t& errorCode,
                                         std::string& errorText) {
    call("updateCapabilityWord", adapter);
    if (capabilityAnswer) return answer(*capabilityAnswer, errorCode, errorText);
    return m_next->updateCapabilityWord(adapter, types, errorCode, errorText);
}

uint16_t HookedBackend::getFlashImageUpdateProgress(const std::string& adapter) {
    call("getFlashImageUpdateProgress", adapter);
    return m_next->getFlashImageUpdateProgress(adapter);
}

bool HookedBackend::setBootType(const std::string& adapter, ma::BootType type) {
    call("setBootType", adapter);
    return m_next->setBootType(adapter, type);
}

ma::AdapterInfo HookedBackend::getAdapterInfo(const std::string& adapter) {
    call("getAdapterInfo", adapter);
    return m_next->getAdapterInfo(adapter);
}

}  // namespace test
