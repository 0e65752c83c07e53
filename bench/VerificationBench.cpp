// SPDX-License-Identifier: Apache-2.0
// Verifying an image of 31 MiB from the page cache, and reading the same file into memory once.
#include <benchmark/benchmark.h>

#include <span>

#include "MidAPI/Image/OptionRom.h"
#include "Providers/SoftwareUpdate/ImageVerification.h"
#include "Support/SimulatedAdapters.h"
#include "Support/TestRoms.h"
#include "Utils/Os/Linux/SMASHv2Config.h"
#include "Utils/Os/Linux/linux.h"

namespace {

/// As long as one image can be: its length is counted in 16 bits, in units of 512 bytes.
constexpr std::size_t kImageLength = 0xFFFF * 512UL;

/// A legacy image padded to the greatest length, newer than what the adapter carries.
std::vector<std::uint8_t> largeRom() {
    std::vector<std::uint8_t> rom = test::madeRom({{utils::FirmwareType::PXE, 9}});
    const std::size_t structure = static_cast<std::size_t>(rom[0x18]) | static_cast<std::size_t>(rom[0x19])
                                                                            << 8;
    rom.resize(kImageLength);
    for (std::size_t i = 4096; i + 1 < rom.size(); i += 7)
        rom[i] = static_cast<std::uint8_t>(i * 31);
    rom[structure + 0x10] = 0xFF;
    rom[structure + 0x11] = 0xFF;
    std::uint8_t sum = 0;
    for (const std::uint8_t byte : rom)
        sum = static_cast<std::uint8_t>(sum + byte);
    rom.back() = static_cast<std::uint8_t>(rom.back() - sum);
    return rom;
}

class Fixture {
  public:
    Fixture() : path(m_folder.write("large.rom", std::span<const std::uint8_t>(largeRom()))) {}

    const test::TempFolder m_folder;
    const utils::SMASHv2Config config{"/nonexistent"};
    const test::SimulatedAdapters adapters{R"(
[[adapter]]
name = "eth0"
pci_address = "0000:03:00.0"
pci_id = "1af4:1041"
mac = "52:54:00:00:00:10"
components = [ { type = "IMG_PXE", revision = 1 } ]
)"};
    const std::string path;
};

void readOnce(benchmark::State& state) {
    const Fixture fixture;
    for (auto _ : state) {
        const auto buffer = std::make_unique_for_overwrite<std::uint8_t[]>(kImageLength);
        if (os::readFile(fixture.path, std::span(buffer.get(), kImageLength)) != kImageLength) {
            state.SkipWithError("the file is short");
        }
        benchmark::DoNotOptimize(buffer.get());
    }
    state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(kImageLength));
}

void verify(benchmark::State& state) {
    const Fixture fixture;
    const UpdateOrder order{"eth0", "file://" + fixture.path, {5}, {}};
    for (auto _ : state) {
        VerifiedImage verified = verifyImage(order);
        benchmark::DoNotOptimize(verified.image.bytes.get());
        verified.claim.release();
    }
    state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(kImageLength));
}

BENCHMARK(readOnce)->Unit(benchmark::kMillisecond);
BENCHMARK(verify)->Unit(benchmark::kMillisecond);

}  // namespace
