// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Simulator/SimulatedAdapter.h"

#include <algorithm>
#include <chrono>
#include <stdexcept>
#include <system_error>
#include <thread>

#include "MidAPI/Image/ImagePreparation.h"
#include "MidAPI/Image/OptionRom.h"
#include "MidAPI/OperationFailure.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

namespace ma {
namespace {

/// The folder of an adapter: its name, where only letters, digits, _ and - stand for themselves. Names come
/// from a description; "../x" must not leave the state directory, nor may two names share a folder.
std::string folderName(const std::string& name) {
    std::string result;
    for (const char character : name) {
        if (utils::isLetter(character) || utils::isDigit(character) || character == '_' || character == '-')
            result += character;
        else
            result += '%' + utils::hexByte(static_cast<unsigned char>(character));
    }
    return result;
}

constexpr std::size_t kMaxFlash = std::size_t{64} * 1024 * 1024;

[[noreturn]] void refuseFlashFile(const AdapterDescription& adapter, const std::string& why) {
    throw AdapterError("adapter " + adapter.name + ": its flash_file " + adapter.flashFile + " " + why);
}

std::vector<std::uint8_t> readFlashFile(const AdapterDescription& adapter) try {
    if (adapter.flashFile.empty()) return {};
    std::optional<std::vector<std::uint8_t>> bytes = os::readWholeFile(adapter.flashFile, kMaxFlash + 1);
    if (!bytes) refuseFlashFile(adapter, "is not there; name an expansion ROM file");
    if (bytes->size() > kMaxFlash) refuseFlashFile(adapter, "is longer than 64 MiB");
    if (const RomFile rom = parseOptionRom(*bytes); rom.error)
        refuseFlashFile(adapter, "is not an intact ROM image: " + *rom.error);
    return *bytes;
} catch (const std::system_error& error) {
    refuseFlashFile(adapter, std::string("cannot be used: ") + error.what());
}

/// Gives every image of a type this code revision; false when there is none.
bool setRevisions(std::vector<std::uint8_t>& flash, const utils::FirmwareVersionInfo& component) {
    bool found = false;
    for (const RomImage& image : parseOptionRom(flash).images) {
        if (!image.carries(component.type)) continue;
        setCodeRevision(flash, image, static_cast<std::uint16_t>(component.version));
        found = true;
    }
    return found;
}

/// What is in the flash of an adapter that was never written to: the flash file with the code revisions of
/// the listed components set, and made images for those components that the file does not have.
std::vector<std::uint8_t> makeFactoryFlash(const AdapterDescription& adapter) {
    std::vector<std::uint8_t> flash = readFlashFile(adapter);
    for (const utils::FirmwareVersionInfo& component : adapter.components) {
        if (!flash.empty() && setRevisions(flash, component)) continue;
        NewRomImage wanted;
        wanted.type = component.type;
        wanted.vendorId = adapter.ids.vendor;
        wanted.deviceId = adapter.ids.device;
        wanted.codeRevision = static_cast<std::uint16_t>(component.version);
        flash = mergeOptionRoms(flash, makeRomImage(wanted));
    }
    return flash;
}

FlashState factoryState(const AdapterDescription& description, std::span<const std::uint8_t> flash) {
    FlashState state;
    state.bootType = static_cast<std::uint32_t>(description.bootType);
    if (!flash.empty()) state.capabilityWord = capabilityBits(parseOptionRom(flash).components());
    return state;
}

FlashStore makeStore(const AdapterDescription& description, const std::string& stateDirectory,
                     std::shared_ptr<FlashFiles> files) {
    std::vector<std::uint8_t> flash = makeFactoryFlash(description);
    const FlashState state = factoryState(description, flash);
    return FlashStore(stateDirectory + "/" + folderName(description.name), std::move(flash), state,
                      std::move(files));
}

/// Holds a writer back to the adapter's speed.
class Pace {
  public:
    explicit Pace(std::uint64_t bytesPerSecond) : m_bytesPerSecond(bytesPerSecond) {}

    void waitFor(std::size_t written) const {
        if (m_bytesPerSecond == 0) return;
        const double seconds = static_cast<double>(written) / static_cast<double>(m_bytesPerSecond);
        std::this_thread::sleep_until(m_begin +
                                      std::chrono::duration_cast<std::chrono::steady_clock::duration>(
                                          std::chrono::duration<double>(seconds)));
    }

  private:
    const std::uint64_t m_bytesPerSecond;
    const std::chrono::steady_clock::time_point m_begin = std::chrono::steady_clock::now();
};

}  // namespace

SimulatedAdapter::SimulatedAdapter(AdapterDescription description, const std::string& stateDirectory,
                                   std::shared_ptr<FlashFiles> files)
    : m_description(std::move(description)),
      m_store(makeStore(m_description, stateDirectory, std::move(files))),
      m_faults(m_description.faults) {}

utils::PCIAddr SimulatedAdapter::address() {
    FaultRun(m_faults, Operation::PciAddress).reach();
    return m_description.address;
}

std::vector<utils::FirmwareVersionInfo> SimulatedAdapter::components() {
    // Not by its number alone: somebody may have removed the folder, and begun to count anew.
    const FlashState state = m_store.state();
    {
        const utils::Mutex::AutoLocker lock(m_cacheMutex);
        if (m_cache && m_cache->state == state) return m_cache->components;
    }
    const std::vector<std::uint8_t> flash = m_store.content();
    std::vector<utils::FirmwareVersionInfo> found;
    if (!flash.empty()) found = parseOptionRom(flash).components();
    const utils::Mutex::AutoLocker lock(m_cacheMutex);
    // The content may be newer than the state; then the next query reads once more.
    m_cache = Cache{state, found};
    return found;
}

bool SimulatedAdapter::readComponents(std::vector<utils::FirmwareVersionInfo>& found) {
    try {
        FaultRun(m_faults, Operation::FirmwareVersion).reach();
        found = components();
        return true;
    } catch (const OperationFailure& failure) {
        QUENX_ERROR("simulated adapter %s: %s", m_description.name.c_str(), failure.what());
        return false;
    } catch (const std::runtime_error& error) {
        throw AdapterError("adapter " + m_description.name + ": " + error.what());
    }
}

int SimulatedAdapter::prepare(const ImageBuffers& buffers, std::uint32_t& imageSize,
                              std::vector<utils::FirmwareType>& types) {
    // Before the verdict: a client that looks now must not see the 100 of an earlier update.
    m_progress.prepared();
    try {
        FaultRun(m_faults, Operation::Prepare).reach();
        return prepareOrThrow(buffers, imageSize, types);
    } catch (const OperationFailure& failure) {
        QUENX_ERROR("simulated adapter %s: %s", m_description.name.c_str(), failure.what());
        return static_cast<int>(failure.code());
    } catch (const std::runtime_error& error) {
        QUENX_ERROR("simulated adapter %s: %s", m_description.name.c_str(), error.what());
        return PrepareStatus::UnspecifiedError;
    }
}

PrepareStatus SimulatedAdapter::prepareOrThrow(const ImageBuffers& buffers, std::uint32_t& imageSize,
                                               std::vector<utils::FirmwareType>& types) {
    const PreparationTarget target{m_description.ids.vendor, m_description.ids.device,
                                   m_description.canBeUpdated, components()};
    const Preparation preparation = assessImage(target, buffers.file, types);
    if (!preparation.reason.empty())
        QUENX_ERROR("simulated adapter %s: status %d: %s", m_description.name.c_str(), preparation.status,
                    preparation.reason.c_str());
    if (!hasOutput(preparation.status)) return preparation.status;
    {
        const utils::Mutex::AutoLocker lock(m_cacheMutex);
        m_heldAgainst = target.components;
    }
    imageSize = static_cast<std::uint32_t>(composeChosen(preparation, buffers.file, buffers.output));
    types = preparation.types;
    return preparation.status;
}

void SimulatedAdapter::requireWritable(std::span<const std::uint8_t> image) const {
    if (!m_description.canBeUpdated)
        throw OperationFailure(WriteError::NotUpdatable, "this adapter cannot be updated");
    const RomFile rom = parseOptionRom(image);
    if (rom.error) throw OperationFailure(WriteError::BadImage, "the image is not intact: " + *rom.error);
    for (const RomImage& part : rom.images)
        if (!part.fits(m_description.ids.vendor, m_description.ids.device))
            throw OperationFailure(WriteError::BadImage,
                                   "the image is for PCI device " + formatIds(part.vendorId, part.deviceId) +
                                       ", not for " +
                                       formatIds(m_description.ids.vendor, m_description.ids.device));
}

bool SimulatedAdapter::write(std::span<const std::uint8_t> image, std::uint32_t& errorCode,
                             std::string& errorText) {
    return runReporting("simulated adapter " + m_description.name, errorCode, errorText, [&] {
        // What can be refused without the lock is: a second writer then reads what is wrong, not "busy".
        requireWritable(image);
        const os::FileLock lock = m_store.lockForWriting();
        if (!lock.isHeld()) refuseAsBusy("adapter " + m_description.name, lock.holder());
        requireUnchanged();
        writeLocked(image);
    });
}

/// The caller holds the writing lock.
void SimulatedAdapter::requireUnchanged() {
    const std::vector<utils::FirmwareVersionInfo> installed = components();
    const utils::Mutex::AutoLocker lock(m_cacheMutex);
    const auto isSame = [](const auto& left, const auto& right) {
        return left.type == right.type && left.version == right.version;
    };
    if (m_heldAgainst && !std::ranges::equal(*m_heldAgainst, installed, isSame))
        refuseAsOutdated(m_description.name);
    // What this process writes itself is no surprise to it.
    m_heldAgainst.reset();
}

void SimulatedAdapter::writeLocked(std::span<const std::uint8_t> image) {
    constexpr std::uint64_t kMaxPercentBeforeBoot = 99;  // 100 is for the update that is in force
    const std::vector<std::uint8_t> merged = mergeOptionRoms(m_store.content(), image);
    // Each image is in order, but together with those that stay they may be too many.
    if (const RomFile rom = parseOptionRom(merged); rom.error)
        throw OperationFailure(WriteError::BadImage,
                               "with what the adapter keeps it would not be a ROM: " + *rom.error);
    // As a flash file: a larger bank could not be found again if its record were lost.
    if (merged.size() > kMaxFlash)
        throw OperationFailure(WriteError::BadImage,
                               "with what the adapter keeps it would be longer than its flash, 64 MiB");
    const WritingScope writing(m_progress);
    const Pace pace(m_description.writeSpeed);
    FaultRun faults(m_faults, Operation::Write);
    m_store.write(merged, [&](std::size_t written) {
        const auto percent = static_cast<unsigned int>(std::uint64_t{written} * 100 / merged.size());
        pace.waitFor(written);
        m_progress.advance(
            static_cast<std::uint16_t>(std::uint64_t{written} * kMaxPercentBeforeBoot / merged.size()));
        faults.reach(percent);
    });
    m_progress.advance(100);
}

bool SimulatedAdapter::updateCapabilityWord(const std::vector<utils::FirmwareType>& types,
                                            std::uint32_t& errorCode, std::string& errorText) {
    return runReporting("simulated adapter " + m_description.name, errorCode, errorText, [&] {
        FaultRun(m_faults, Operation::CapabilityWord).reach();
        std::uint32_t wanted = 0;
        for (const utils::FirmwareType type : types)
            wanted |= capabilityBit(type);
        // Bits of images that an update took away would let a BIOS look for what is not there.
        const std::uint32_t held = capabilityBits(components());
        m_store.changeState(
            [&](FlashState& state) { state.capabilityWord = (state.capabilityWord | wanted) & held; });
    });
}

bool SimulatedAdapter::setBootType(BootType type) {
    std::uint32_t errorCode = 0;
    std::string errorText;
    return runReporting("simulated adapter " + m_description.name, errorCode, errorText, [&] {
        FaultRun(m_faults, Operation::BootType).reach();
        m_store.changeState([type](FlashState& state) { state.bootType = static_cast<std::uint32_t>(type); });
    });
}

AdapterInfo SimulatedAdapter::info() {
    try {
        FaultRun(m_faults, Operation::Info).reach();
        return {.permanentMac = m_description.mac,
                .speed = m_description.speed,
                .linkUp = m_description.linkUp,
                .ids = m_description.ids,
                .components = components(),
                .description = m_description.description,
                .writer = m_store.writer()};
    } catch (const std::runtime_error& failure) {
        throw AdapterError("adapter " + m_description.name + ": " + failure.what());
    }
}

}  // namespace ma
