// SPDX-License-Identifier: Apache-2.0
#include "Fuzz/Fuzz.h"
#include "MidAPI/Devlink/PackageVerdict.h"
#include "MidAPI/Devlink/PldmPackage.h"
#include "MidAPI/Image/Bytes.h"
#include "MidAPI/Image/ImagePreparation.h"

namespace {

using ma::devlink::PackageFormat;

/// Few inputs have the right checksum: make it so.
void seal(std::vector<std::uint8_t>& file) {
    if (file.size() < 23) return;
    const std::size_t size = ma::readLe16(file, 17);
    if (size < 23 || size > file.size()) return;
    ma::writeLe32(file, size - 4, ma::crc32(std::span(file).first(size - 4)));
}

}  // namespace

void fuzz(const std::string& bytes) {
    std::vector<std::uint8_t> file(bytes.begin(), bytes.end());
    seal(file);
    ma::devlink::ComponentTable table;
    table.set(ma::devlink::ComponentTable::PackageRow{1, "fw"});
    const ma::devlink::PackageTarget target = {.ids = {0x1af4, 0x1041, 0x1af4, 0x1100},
                                               .versions = {{.name = "fw", .running = "1.9"}},
                                               .table = table,
                                               .accepts = [](const std::string&) { return true; }};
    const auto verdict = ma::devlink::assessPackage(target, file, {});
    require(verdict.reason.empty() == (verdict.status == ma::PrepareStatus::Prepared));
    if (ma::devlink::packageFormat(file) != PackageFormat::Known) return;
    const auto package = ma::devlink::readPldmPackage(file);
    require(!package.error || verdict.status == ma::PrepareStatus::InvalidParameter);
    for (const auto& component : package.components)
        require(ma::fitsIn(component.offset, component.size, file.size()));
}
