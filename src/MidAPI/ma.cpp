// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/ma.h"

#include <mutex>

#include "MidAPI/Backends.h"

namespace ma {
namespace {

/// The backend in use. A failure to make one is not remembered: the next call reads the corrected
/// description.
class Selection {
  public:
    // A shared pointer, so that a call that has begun keeps its backend while another is put in place.
    std::shared_ptr<Backend> current() {
        const std::lock_guard lock(m_mutex);
        if (!m_backend) m_backend = makeBackend({});
        return m_backend;
    }

    std::shared_ptr<Backend> exchange(std::shared_ptr<Backend> backend) {
        const std::lock_guard lock(m_mutex);
        m_backend.swap(backend);
        return backend;
    }

  private:
    std::mutex m_mutex;
    std::shared_ptr<Backend> m_backend;
};

/// Of static storage from the load of this library on, so that it outlives the providers: at the exit of a
/// process that does not unload them, their workers still flash.
constinit Selection selection;

std::shared_ptr<Backend> backend() {
    return selection.current();
}

}  // namespace

AdapterError::AdapterError(const std::string& text) : utils::Exception("%s", text.c_str()) {}
AdapterError::~AdapterError() = default;

Backend::~Backend() = default;

std::string Backend::name() const {
    return {};
}

std::string Backend::describeSearch() {
    return {};
}

std::string Backend::stateFolder() const {
    return {};
}

std::optional<ImageVerdict> Backend::judgeImage(const std::string&, std::span<const std::uint8_t>,
                                                const std::vector<utils::FirmwareType>&) {
    return std::nullopt;
}

CardUse Backend::getCardUse(const std::string&, const std::string&) {
    return {};
}

Activation Backend::activate(const std::string&, const ActivationRequest&) {
    return {Activation::NotOffered, ""};
}

utils::StringArray enumerateAdapters() {
    return backend()->enumerateAdapters();
}

utils::PCIAddr getPCIAddress(std::string adapter) {
    return backend()->getPCIAddress(adapter);
}

bool getCanBeUpdated(std::string adapter) {
    return backend()->getCanBeUpdated(adapter);
}

bool getAdapterFirmwareVersion(std::string adapter, std::vector<utils::FirmwareVersionInfo>& components) {
    return backend()->getAdapterFirmwareVersion(adapter, components);
}

int prepareFlashImage(std::string adapter, const std::uint8_t* file, std::uint32_t fileSize,
                      std::uint8_t* output, std::uint32_t* imageSize,
                      std::vector<utils::FirmwareType>& types) {
    return backend()->prepareFlashImage(adapter, file, fileSize, output, imageSize, types);
}

bool writeFlashImage(std::string adapter, const std::uint8_t* image, std::uint32_t imageSize,
                     std::uint32_t& errorCode, std::string& errorText) {
    return backend()->writeFlashImage(adapter, image, imageSize, errorCode, errorText);
}

bool updateCapabilityWord(std::string adapter, std::vector<utils::FirmwareType> types,
                          std::uint32_t& errorCode, std::string& errorText) {
    return backend()->updateCapabilityWord(adapter, types, errorCode, errorText);
}

std::uint16_t getFlashImageUpdateProgress(std::string adapter) {
    return backend()->getFlashImageUpdateProgress(adapter);
}

bool setBootType(std::string adapter, BootType type) {
    return backend()->setBootType(adapter, type);
}

std::string backendName() {
    return backend()->name();
}

AdapterInfo getAdapterInfo(std::string adapter) {
    return backend()->getAdapterInfo(adapter);
}

std::optional<ImageVerdict> judgeImage(std::string adapter, std::span<const std::uint8_t> file,
                                       const std::vector<utils::FirmwareType>& types) {
    return backend()->judgeImage(adapter, file, types);
}

CardUse getCardUse(std::string adapter, const std::string& caller) {
    return backend()->getCardUse(adapter, caller);
}

Activation activate(std::string adapter, const ActivationRequest& request) {
    return backend()->activate(adapter, request);
}

void selectBackend(const BackendChoice& choice) {
    selection.exchange(makeBackend(choice));
}

std::string stateFolder() {
    return backend()->stateFolder();
}

std::string describeSearch() {
    return backend()->describeSearch();
}

std::shared_ptr<Backend> setBackend(std::shared_ptr<Backend> backend) {
    return selection.exchange(std::move(backend));
}

}  // namespace ma
