// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/DevlinkBackend.h"

#include <algorithm>
#include <cerrno>
#include <system_error>

#include "MidAPI/Devlink/Activator.h"
#include "MidAPI/Devlink/CardLock.h"
#include "MidAPI/Devlink/DeviceRequests.h"
#include "MidAPI/Devlink/FlashRun.h"
#include "MidAPI/Devlink/NetworkUse.h"
#include "MidAPI/Devlink/StagedImage.h"
#include "MidAPI/Image/Bytes.h"
#include "MidAPI/Image/ImageBuffers.h"
#include "MidAPI/Image/ImagePreparation.h"
#include "MidAPI/OperationFailure.h"
#include "Utils/Log.h"
#include "Utils/Utils.h"

namespace ma::devlink {
namespace {

// The packages' state folder, where a hardened daemon may write, too.
constexpr const char* kLockFolder = "/var/lib/quenx/locks";
// What was prepared is written at once; what was not by then was only checked.
constexpr std::chrono::seconds kPreparationPending{30};

std::string unknown(const std::string& adapter) {
    return "there is no adapter " + adapter;
}

/// Whether no process could flash it, whatever its rights.
bool canNeverBeUpdated(const FlashVerdict& flash) {
    return flash.flashable == Flashable::NotOffered || flash.flashable == Flashable::Absent;
}

/// An answer that a file cannot change.
void requireFlashable(const KnownFunction& known) {
    const FlashVerdict& flash = known.flash;
    if (canNeverBeUpdated(flash))
        throw OperationFailure(WriteError::NotUpdatable, "this adapter cannot be updated: " + flash.reason);
    if (flash.flashable == Flashable::NotPermitted)
        throw OperationFailure(codeOf(EPERM), "this process may not update the adapter: " + flash.reason);
    if (flash.flashable != Flashable::Unknown) return;
    if (!known.writer.empty()) refuseAsBusy("its card", known.writer);
    throw OperationFailure(WriteError::DeviceFailed, "the adapter cannot be asked: " + flash.reason);
}

/// What it takes to run what is in the flash. Where the driver cannot activate it, nothing tells whether a
/// restart does or a power cycle; and where it does not tell what is in the flash, nothing tells anything.
ResetNeeded resetNeeded(const KnownFunction& known) {
    const std::vector<NamedVersion>& versions = known.info.versions;
    if (std::ranges::any_of(versions, &NamedVersion::isPending))
        return known.offersActivation ? ResetNeeded::Reload : ResetNeeded::Unknown;
    const auto isTold = [](const NamedVersion& version) { return !version.stored.empty(); };
    return std::ranges::any_of(versions, isTold) ? ResetNeeded::None : ResetNeeded::Unknown;
}

/// What cannot be read must not be taken for what is not there.
void requireVersions(const KnownFunction& known) {
    if (!known.infoError.empty())
        throw AdapterError("the firmware versions of adapter " + known.pci.address +
                           " cannot be read: " + known.infoError);
}

}  // namespace

DevlinkBackend::DevlinkBackend(Settings settings, std::shared_ptr<Machine> machine)
    : m_settings(std::move(settings)), m_machine(std::move(machine)), m_table(m_machine, kLockFolder) {}

DevlinkBackend::~DevlinkBackend() = default;

KnownFunction DevlinkBackend::require(const std::string& adapter) {
    if (auto known = m_table.find(adapter)) return *std::move(known);
    throw AdapterError(unknown(adapter));
}

utils::StringArray DevlinkBackend::enumerateAdapters() {
    return m_table.names();
}

utils::PCIAddr DevlinkBackend::getPCIAddress(const std::string& adapter) {
    // That of a card which has gone meanwhile is what it was: who compares places need not fail for it.
    if (!m_table.hasSeen(adapter)) throw AdapterError(unknown(adapter));
    return parseFunctionAddress(adapter).value_or(utils::PCIAddr());
}

bool DevlinkBackend::getCanBeUpdated(const std::string& adapter) {
    const auto known = m_table.find(adapter);
    if (!known) return false;
    // Nobody writes to a card that takes no updates.
    const bool isOnlyBusy = known->flash.flashable == Flashable::Unknown && !known->writer.empty();
    return known->flash.flashable == Flashable::Yes || isOnlyBusy;
}

bool DevlinkBackend::getAdapterFirmwareVersion(const std::string& adapter,
                                               std::vector<utils::FirmwareVersionInfo>& components) {
    const auto known = m_table.find(adapter);
    if (!known) return false;
    requireVersions(*known);
    components = m_settings.components.installed(known->info.versions);
    return true;
}

int DevlinkBackend::prepareFlashImage(const std::string& adapter, const std::uint8_t* file,
                                      std::uint32_t fileSize, std::uint8_t* output, std::uint32_t* imageSize,
                                      std::vector<utils::FirmwareType>& types) try {
    // What another program has written since must not be taken for what is installed.
    const auto known = m_table.find(adapter, AdapterTable::Ask::Anew);
    const auto buffers = ImageBuffers::of(file, fileSize, output, imageSize);
    if (!known || !buffers) {
        QUENX_ERROR("adapter %s: status %d: %s", adapter.c_str(), PrepareStatus::InvalidParameter,
                    known ? "a buffer is missing or too small" : "there is no such adapter");
        return PrepareStatus::InvalidParameter;
    }
    known->progress->prepared();
    const PackageVerdict verdict = assess(*known, buffers->file, types);
    if (!verdict.reason.empty())
        QUENX_ERROR("adapter %s: status %d: %s", adapter.c_str(), verdict.status, verdict.reason.c_str());
    if (!hasOutput(verdict.status)) return verdict.status;
    remember(*known, buffers->file, verdict.components);
    *imageSize = buffers->copyFile();
    types = verdict.types;
    return verdict.status;
} catch (const std::exception& error) {
    QUENX_ERROR("adapter %s: status %d: %s", adapter.c_str(), PrepareStatus::UnspecifiedError, error.what());
    return PrepareStatus::UnspecifiedError;
}

bool DevlinkBackend::Prepared::isOf(std::span<const std::uint8_t> image) const {
    return size == image.size() && checksum == crc32(image);
}

/// The write is told the bytes alone, so these must not mean two things at a time.
void DevlinkBackend::remember(const KnownFunction& known, std::span<const std::uint8_t> image,
                              const std::vector<std::string>& components) {
    const auto now = std::chrono::steady_clock::now();
    const utils::Mutex::AutoLocker lock(m_preparedMutex);
    Prepared& prepared = m_prepared[known.pci.address];
    if (now < prepared.end && prepared.components != components && prepared.isOf(image))
        throw OperationFailure(WriteError::Busy,
                               "the same image was just prepared for other image types and is about to be "
                               "written; try again in half a minute");
    prepared = {image.size(), crc32(image), components, known.info.versions, now + kPreparationPending};
}

PackageVerdict DevlinkBackend::assess(const KnownFunction& known, std::span<const std::uint8_t> file,
                                      const std::vector<utils::FirmwareType>& types) {
    const PackageTarget target{
        .ids = known.pci.ids,
        .hindrance = canNeverBeUpdated(known.flash) ? known.flash.reason : "",
        .versions = known.info.versions,
        .largestImage = m_settings.largestImage,
        .table = m_settings.components,
        .accepts = [&](const std::string& component) { return accepts(known, component); }};
    PackageVerdict verdict = assessPackage(target, file, types);
    if (!hasOutput(verdict.status)) return verdict;
    // What is wrong with the file comes first: another one is needed whoever writes it.
    requireFlashable(known);
    if (!known.writer.empty()) refuseAsBusy("its card", known.writer);
    requireVersions(known);
    stagingFolder();
    for (const std::string& unchecked : verdict.unchecked)
        QUENX_DEBUG("adapter %s: it could not be checked %s", known.pci.address.c_str(), unchecked.c_str());
    return verdict;
}

bool DevlinkBackend::accepts(const KnownFunction& known, const std::string& component) {
    requireFlashable(known);
    // The question would wait for the end of a flash.
    if (!known.writer.empty()) refuseAsBusy("its card", known.writer);
    DevlinkConnection connection(*m_machine);
    return refusalOfComponent(connection, known.pci.address, component).empty();
}

bool DevlinkBackend::writeFlashImage(const std::string& adapter, const std::uint8_t* image,
                                     std::uint32_t imageSize, std::uint32_t& errorCode,
                                     std::string& errorText) {
    return runReporting("adapter " + adapter, errorCode, errorText, [&] {
        write(adapter, {image, image == nullptr ? 0 : imageSize});
    });
}

void DevlinkBackend::write(const std::string& adapter, std::span<const std::uint8_t> image) {
    const auto known = m_table.find(adapter, AdapterTable::Ask::Anew);
    if (!known) throw OperationFailure(WriteError::UnknownAdapter, unknown(adapter));
    const Prepared prepared = takePrepared(adapter, image);
    // Said before the lock is tried, which takes rights of its own.
    if (known->flash.flashable != Flashable::Unknown) requireFlashable(*known);
    const CardLock lock(*m_machine, kLockFolder, known->pci, known->info, kWriterPatience);
    if (!lock.isHeld()) refuseAsBusy("the card of adapter " + adapter, lock.holder());
    const FlashOrder order{readUnderLock(adapter), stagingFolder(), image, prepared.components};
    // What the driver does not tell now is no other version.
    const std::vector<NamedVersion>& installed = order.function.info.versions;
    const bool isTold = order.function.infoError.empty() && !installed.empty();
    if (prepared.heldAgainst && isTold && *prepared.heldAgainst != installed) refuseAsOutdated(adapter);
    forgetVersions(adapter);
    const AdapterTable::FlashScope flashing(m_table, adapter);
    const WritingScope writing(*order.function.progress);
    runFlash(*m_machine, order, [this] { m_table.readNotifications(); });
}

/// What is known once nobody of this product can change the card any more. Others may: they take no lock, but
/// the kernel tells of them.
KnownFunction DevlinkBackend::readUnderLock(const std::string& adapter) {
    auto known = m_table.find(adapter, AdapterTable::Ask::AnewAsHolder);
    if (!known) throw OperationFailure(ENODEV, "adapter " + adapter + " is gone");
    const std::string flashed = m_table.findFlashedElsewhere(*known);
    if (!flashed.empty()) refuseAsBusy("function " + flashed + " of the card", "another program");
    // It has just ended, and what is known is of before.
    if (!known->writer.empty()) refuseAsBusy("the card of adapter " + adapter, known->writer);
    requireFlashable(*known);
    return *std::move(known);
}

std::string DevlinkBackend::stagingFolder() try {
    return chooseFirmwareFolder(*m_machine, m_settings.firmwareFolder);
} catch (const AdapterError& error) {
    throw OperationFailure(EACCES, error.what());
}

DevlinkBackend::Prepared DevlinkBackend::takePrepared(const std::string& adapter,
                                                      std::span<const std::uint8_t> image) {
    const utils::Mutex::AutoLocker lock(m_preparedMutex);
    const auto found = m_prepared.find(adapter);
    if (found == m_prepared.end() || !found->second.isOf(image))
        throw OperationFailure(WriteError::BadImage,
                               "this image was not prepared for adapter " + adapter + "; prepare it first");
    found->second.end = {};
    return found->second;
}

/// What this process writes itself is no surprise to it.
void DevlinkBackend::forgetVersions(const std::string& adapter) {
    const utils::Mutex::AutoLocker lock(m_preparedMutex);
    m_prepared[adapter].heldAgainst.reset();
}

bool DevlinkBackend::updateCapabilityWord(const std::string& adapter, const std::vector<utils::FirmwareType>&,
                                          std::uint32_t& errorCode, std::string& errorText) {
    return runReporting("adapter " + adapter, errorCode, errorText, [&] {
        const auto known = m_table.find(adapter);
        if (!known || known->flash.flashable == Flashable::Absent)
            throw OperationFailure(ENODEV, "adapter " + adapter + " is gone");
    });
}

std::uint16_t DevlinkBackend::getFlashImageUpdateProgress(const std::string& adapter) {
    const auto progress = m_table.progressOf(adapter);
    return progress ? progress->percent() : std::uint16_t{0};
}

bool DevlinkBackend::setBootType(const std::string& adapter, BootType type) {
    QUENX_DEBUG("adapter %s: boot type %d is not set: devlink knows no boot types", adapter.c_str(),
                static_cast<int>(type));
    return false;
}

AdapterInfo DevlinkBackend::getAdapterInfo(const std::string& adapter) {
    const KnownFunction known = require(adapter);
    requireVersions(known);
    const InterfaceState state = readInterfaceState(*m_machine, known.pci);
    AdapterInfo info;
    info.permanentMac = state.mac;
    info.speed = state.speed;
    info.linkUp = state.linkUp;
    info.ids = known.pci.ids;
    info.components = m_settings.components.installed(known.info.versions);
    info.backend = kDevlinkBackend;
    info.driver = known.pci.driver;
    info.serialNumber = known.info.serialNumber;
    info.boardSerialNumber = known.info.boardSerialNumber;
    info.versions = known.info.versions;
    for (NamedVersion& version : info.versions)
        version.type = m_settings.components.typeOf(version.name);
    info.resetNeeded = resetNeeded(known);
    info.interfaces = known.pci.interfaces;
    info.writer = known.writer;
    info.description = "Ethernet adapter " + known.pci.address;
    return info;
}

std::string DevlinkBackend::describeSearch() {
    const utils::StringArray names = m_table.names();
    std::string text = "Ethernet adapters were looked for on PCI (class 0200 in /sys/bus/pci/devices): " +
                       std::to_string(names.size()) + (names.size() == 1 ? " was found." : " were found.");
    utils::StringArray others;
    for (const std::string& name : names) {
        // From memory: a service that starts has no reason to wait for a device.
        const auto known = m_table.find(name, AdapterTable::Ask::Never);
        if (!known || known->flash.flashable == Flashable::Yes) continue;
        if (known->writer.empty() && known->flash.reason.empty()) {
            others.push_back(name);
            continue;
        }
        text += " " + name + " (" + (known->pci.driver.empty() ? "no driver" : known->pci.driver) + ") " +
                (known->writer.empty() ? "cannot be updated: " + known->flash.reason
                                       : "is being written to by " + known->writer) +
                ".";
    }
    if (!others.empty())
        text += " Asked at the first request whether they can be updated: " + utils::joined(others) + ".";
    return text;
}

std::optional<ImageVerdict> DevlinkBackend::judgeImage(const std::string& adapter,
                                                       std::span<const std::uint8_t> file,
                                                       const std::vector<utils::FirmwareType>& types) {
    const auto known = m_table.find(adapter, AdapterTable::Ask::Anew);
    if (!known) throw AdapterError(unknown(adapter));
    try {
        return assess(*known, file, types);
    } catch (const std::exception& error) {
        return ImageVerdict{.status = PrepareStatus::UnspecifiedError, .reason = error.what()};
    }
}

CardUse DevlinkBackend::getCardUse(const std::string& adapter, const std::string& caller) {
    const KnownFunction known = require(adapter);
    utils::StringArray sameBoard;
    for (const std::string& name : m_table.names()) {
        const auto each = m_table.find(name);
        if (each && areOnOneCard(known, *each)) sameBoard.push_back(name);
    }
    CardFunctions card = readCard(*m_machine, known.pci.card(), sameBoard);
    CardUse use{.functions = std::move(card.functions), .interfaces = std::move(card.interfaces)};
    findNetworkUse(*m_machine, caller, use);
    return use;
}

Activation DevlinkBackend::activate(const std::string& adapter, const ActivationRequest& request) try {
    const KnownFunction known = require(adapter);
    if (known.flash.flashable == Flashable::Absent) return {Activation::NotOffered, known.flash.reason};
    const CardUse use = getCardUse(adapter, request.caller);
    if (!request.mayDisrupt && !use.losses.empty())
        return {Activation::WouldDisrupt, utils::joined(use.losses, "; ")};
    if (known.flash.flashable == Flashable::NotPermitted) return {Activation::Failed, known.flash.reason};
    const CardLock lock(*m_machine, kLockFolder, known.pci, known.info, kWriterPatience);
    if (!lock.isHeld()) refuseAsBusy("the card", lock.holder());
    const std::string flashed = m_table.findFlashedElsewhere(known);
    if (!flashed.empty()) refuseAsBusy("function " + flashed + " of the card", "another program");
    // The device answers nothing meanwhile, and has to be asked anew afterwards.
    const AdapterTable::FlashScope resetting(m_table, adapter);
    return activateDevice(*m_machine, adapter, use.functions);
} catch (const AdapterError&) {
    throw;
} catch (const std::exception& error) {
    // Nothing that throws comes behind the request to the driver.
    return {Activation::Failed, error.what()};
}

}  // namespace ma::devlink
