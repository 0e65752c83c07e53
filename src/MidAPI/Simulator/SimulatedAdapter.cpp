#include "MidAPI/Simulator/SimulatedAdapter.h"

#include <unistd.h>

#include <chrono>
#include <thread>

#include "MidAPI/Image/ImagePreparation.h"
#include "MidAPI/Image/OptionRomWriter.h"
#include "Utils/Log.h"

namespace ma {
namespace {

uint32_t bitOf(utils::FirmwareType type) {
    const auto number = static_cast<uint32_t>(type);
    return number >= 1 && number <= 5 ? 1U << number : 0;
}

uint32_t bitsOf(const std::vector<utils::FirmwareVersionInfo>& components) {
    uint32_t bits = 0;
    for (const utils::FirmwareVersionInfo& component : components)
        bits |= bitOf(component.type);
    return bits;
}

/// The folder of an adapter: its name with everything that a file name does not like as %xx.
std::string folderName(const std::string& name) {
    constexpr std::string_view PLAIN = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789_-";
    constexpr std::string_view DIGITS = "0123456789abcdef";
    std::string result;
    for (const char character : name) {
        if (PLAIN.find(character) != std::string_view::npos) {
            result += character;
            continue;
        }
        const auto byte = static_cast<unsigned char>(character);
        result += {'%', DIGITS[byte >> 4], DIGITS[byte & 0xF]};
    }
    return result;
}

FlashState factoryState(const AdapterDescription& description, std::span<const uint8_t> flash) {
    FlashState state;
    state.bootType = static_cast<uint32_t>(description.bootType);
    if (!flash.empty()) state.capabilityWord = bitsOf(parseOptionRom(flash).components());
    return state;
}

FlashStore makeStore(const AdapterDescription& description, const std::string& stateDirectory,
                     std::shared_ptr<FlashFiles> files) {
    std::vector<uint8_t> flash = makeFactoryFlash(description);
    const FlashState state = factoryState(description, flash);
    return FlashStore(stateDirectory + "/" + folderName(description.name), std::move(flash), state,
                      std::move(files));
}

std::string describeHolder(const std::string& adapter, pid_t holder) {
    std::string text = "adapter " + adapter + " is being written to by ";
    if (holder == 0) return text + "another process; wait until it is done";
    if (holder == ::getpid())
        return text + "this process (" + std::to_string(holder) + "); wait until it is done";
    return text + "process " + std::to_string(holder) + "; wait until it is done";
}

/// Holds a writer back to the adapter's speed.
class Pace {
  public:
    explicit Pace(uint64_t bytesPerSecond) : m_bytesPerSecond(bytesPerSecond) {}

    void waitFor(std::size_t written) const {
        if (m_bytesPerSecond == 0) return;
        const double seconds = static_cast<double>(written) / static_cast<double>(m_bytesPerSecond);
        std::this_thread::sleep_until(m_begin +
                                      std::chrono::duration_cast<std::chrono::steady_clock::duration>(
                                          std::chrono::duration<double>(seconds)));
    }

  private:
    const uint64_t m_bytesPerSecond;
    const std::chrono::steady_clock::time_point m_begin = std::chrono::steady_clock::now();
};

/// Marks the time during which an adapter is being written to, however that ends.
class WritingScope {
  public:
    explicit WritingScope(Progress& progress) : m_progress(progress) { m_progress.begin(); }
    WritingScope(const WritingScope&) = delete;
    WritingScope& operator=(const WritingScope&) = delete;
    ~WritingScope() { m_progress.end(); }

  private:
    Progress& m_progress;
};

/// Runs an operation and turns what it throws into the API's code and text. A power loss and an ordered
/// exception pass through.
template <typename Action>
bool report(const std::string& adapter, uint32_t& errorCode, std::string& errorText, Action action) {
    errorCode = NO_ERROR;
    errorText.clear();
    try {
        action();
        return true;
    } catch (const OrderedFailure& failure) {
        errorCode = failure.code;
        errorText = failure.text;
    } catch (const FlashError& error) {
        errorCode = ERROR_DEVICE;
        errorText = error.what();
    }
    QUENX_ERROR("adapter %s: %s", adapter.c_str(), errorText.c_str());
    return false;
}

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
    const uint32_t generation = m_store.state().generation;
    {
        const utils::Mutex::AutoLocker lock(m_cacheMutex);
        if (m_cacheFilled && m_cacheGeneration == generation) return m_cachedComponents;
    }
    const std::vector<uint8_t> flash = m_store.content();
    std::vector<utils::FirmwareVersionInfo> found;
    if (!flash.empty()) found = parseOptionRom(flash).components();
    const utils::Mutex::AutoLocker lock(m_cacheMutex);
    // The content may be newer than the number; then the next query reads once more.
    m_cacheFilled = true;
    m_cacheGeneration = generation;
    m_cachedComponents = found;
    return found;
}

bool SimulatedAdapter::readComponents(std::vector<utils::FirmwareVersionInfo>& found) {
    try {
        FaultRun(m_faults, Operation::FirmwareVersion).reach();
        found = components();
        return true;
    } catch (const OrderedFailure& failure) {
        QUENX_ERROR("adapter %s: %s", m_description.name.c_str(), failure.text.c_str());
        return false;
    } catch (const FlashError& error) {
        throw AdapterError("adapter " + m_description.name + ": " + error.what());
    }
}

int SimulatedAdapter::prepare(std::span<const uint8_t> file, std::span<uint8_t> output, uint32_t& imageSize,
                              std::vector<utils::FirmwareType>& types) {
    m_progress.prepared();
    try {
        FaultRun(m_faults, Operation::Prepare).reach();
        return prepareUnguarded(file, output, imageSize, types);
    } catch (const OrderedFailure& failure) {
        QUENX_ERROR("adapter %s: %s", m_description.name.c_str(), failure.text.c_str());
        return static_cast<int>(failure.code);
    } catch (const FlashError& error) {
        QUENX_ERROR("adapter %s: %s", m_description.name.c_str(), error.what());
        return UNSPECIFIED_ERROR;
    }
}

PrepareStatus SimulatedAdapter::prepareUnguarded(std::span<const uint8_t> file, std::span<uint8_t> output,
                                                 uint32_t& imageSize,
                                                 std::vector<utils::FirmwareType>& types) {
    const PreparationTarget target{m_description.ids.vendor, m_description.ids.device,
                                   m_description.canBeUpdated, components()};
    const Preparation preparation = assessImage(target, file, types);
    if (!preparation.reason.empty())
        QUENX_ERROR("adapter %s: status %d: %s", m_description.name.c_str(), preparation.status,
                    preparation.reason.c_str());
    if (!hasOutput(preparation.status)) return preparation.status;
    imageSize = static_cast<uint32_t>(composeChosen(preparation, file, output));
    types = preparation.types;
    return preparation.status;
}

void SimulatedAdapter::requireWritable(std::span<const uint8_t> image) const {
    if (!m_description.canBeUpdated)
        throw OrderedFailure{ERROR_NOT_UPDATABLE, "this adapter cannot be updated"};
    const RomFile rom = parseOptionRom(image);
    if (rom.error) throw OrderedFailure{ERROR_BAD_IMAGE, "the image is not intact: " + *rom.error};
    for (const RomImage& part : rom.images)
        if (!part.fits(m_description.ids.vendor, m_description.ids.device))
            throw OrderedFailure{ERROR_BAD_IMAGE,
                                 "the image is for PCI device " + formatIds(part.vendorId, part.deviceId) +
                                     ", not for " +
                                     formatIds(m_description.ids.vendor, m_description.ids.device)};
}

bool SimulatedAdapter::write(std::span<const uint8_t> image, uint32_t& errorCode, std::string& errorText) {
    return report(m_description.name, errorCode, errorText, [&] {
        requireWritable(image);
        const FileLock lock = m_store.lockForWriting();
        if (!lock.isHeld())
            throw OrderedFailure{ERROR_BUSY, describeHolder(m_description.name, lock.holder())};
        writeLocked(image);
    });
}

void SimulatedAdapter::writeLocked(std::span<const uint8_t> image) {
    constexpr uint64_t NOT_YET_BOOTED = 99;  // 100 is for the update that is in force
    const std::vector<uint8_t> merged = mergeOptionRoms(m_store.content(), image);
    if (const RomFile rom = parseOptionRom(merged); rom.error)
        throw OrderedFailure{ERROR_BAD_IMAGE,
                             "with what the adapter keeps it would be no ROM: " + *rom.error};
    const WritingScope writing(m_progress);
    const Pace pace(m_description.writeSpeed);
    FaultRun faults(m_faults, Operation::Write);
    m_store.write(merged, [&](std::size_t written) {
        const auto percent = static_cast<unsigned>(uint64_t{written} * 100 / merged.size());
        pace.waitFor(written);
        m_progress.advance(static_cast<uint16_t>(uint64_t{written} * NOT_YET_BOOTED / merged.size()));
        faults.reach(percent);
    });
    m_progress.advance(100);
}

bool SimulatedAdapter::updateCapabilityWord(const std::vector<utils::FirmwareType>& types,
                                            uint32_t& errorCode, std::string& errorText) {
    return report(m_description.name, errorCode, errorText, [&] {
        FaultRun(m_faults, Operation::CapabilityWord).reach();
        uint32_t wanted = 0;
        for (const utils::FirmwareType type : types)
            wanted |= bitOf(type);
        const uint32_t held = bitsOf(components());
        m_store.changeState(
            [&](FlashState& state) { state.capabilityWord = (state.capabilityWord | wanted) & held; });
    });
}

bool SimulatedAdapter::setBootType(BootType type) {
    uint32_t errorCode = 0;
    std::string errorText;
    return report(m_description.name, errorCode, errorText, [&] {
        FaultRun(m_faults, Operation::BootType).reach();
        m_store.changeState([type](FlashState& state) { state.bootType = static_cast<uint32_t>(type); });
    });
}

AdapterInfo SimulatedAdapter::info() {
    try {
        FaultRun(m_faults, Operation::Info).reach();
        return {m_description.mac, m_description.speed, m_description.linkUp,
                m_description.ids, components(),        m_description.description};
    } catch (const OrderedFailure& failure) {
        throw AdapterError("adapter " + m_description.name + ": " + failure.text);
    } catch (const FlashError& error) {
        throw AdapterError("adapter " + m_description.name + ": " + error.what());
    }
}

}  // namespace ma
