// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Simulator/AdapterDescription.h"

#include <algorithm>
#include <charconv>
#include <filesystem>
#include <limits>
#include <system_error>

#include "MidAPI/AdapterTypes.h"
#include "MidAPI/Image/OptionRom.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Toml.h"
#include "Utils/Utils.h"

namespace ma {
namespace {

using utils::inQuotes;
using utils::TomlTable;

constexpr std::size_t kLongestName = 64;
constexpr std::uint64_t kHighestSpeed = std::numeric_limits<std::int64_t>::max();  // all that TOML has
constexpr std::uint32_t kLongestStall = 600'000;  // ten minutes, in milliseconds

constexpr auto kAdapterKeys = std::to_array<std::string_view>(
    {"name", "description", "pci_address", "pci_id", "subsystem_id", "mac", "speed", "link", "updatable",
     "write_speed", "boot_type", "flash_file", "components", "fault"});
constexpr auto kComponentKeys = std::to_array<std::string_view>({"type", "revision"});
constexpr auto kFaultKeys =
    std::to_array<std::string_view>({"at", "action", "percent", "code", "text", "milliseconds", "once"});
constexpr auto kTopKeys = std::to_array<std::string_view>({"adapter"});
constexpr auto kComponentTypes =
    std::to_array<std::string_view>({"IMG_CLP", "IMG_iSCSI", "IMG_PXE", "IMG_UEFI", "IMG_FCoE"});
constexpr auto kBootTypes = std::to_array<std::string_view>({"none", "pxe", "iscsi", "fcoe", "uefi"});
// In the order of Operation and of Fault::Action.
constexpr auto kOperations =
    std::to_array<std::string_view>({"enumerate", "pci-address", "firmware-version", "prepare", "write",
                                     "capability-word", "boot-type", "info"});
constexpr auto kActions = std::to_array<std::string_view>({"fail", "throw", "stall", "power-loss", "kill"});

/// Takes so many hexadecimal digits and then the separator (none when it is NUL) off the front of a text.
template <class T>
bool takeHex(std::string_view& text, std::size_t digits, char separator, T& value) {
    // from_chars() takes neither signs nor blanks nor "0x", so what it takes is digits.
    const char* end = text.data() + std::min(digits, text.size());
    const auto result = std::from_chars(text.data(), end, value, 16);
    if (result.ec != std::errc() || result.ptr != text.data() + digits) return false;
    text.remove_prefix(digits);
    if (separator == '\0') return text.empty();
    if (!text.starts_with(separator)) return false;
    text.remove_prefix(1);
    return true;
}

bool parseIds(std::string_view text, std::uint16_t& vendor, std::uint16_t& device) {
    return takeHex(text, 4, ':', vendor) && takeHex(text, 4, '\0', device);
}

/// "0000:03:00.0"; the domain may be left out, and so may the function.
bool parseAddress(std::string_view text, utils::PCIAddr& address) {
    constexpr std::uint8_t kHighestDevice = 31;
    constexpr std::uint8_t kHighestFunction = 7;
    // One spelling for one place: ports are told apart by this text, too.
    address.text = utils::lowerCase(text);
    if (std::count(text.begin(), text.end(), ':') == 2) {
        std::uint16_t domain = 0;
        if (!takeHex(text, 4, ':', domain)) return false;
    } else {
        address.text = "0000:" + address.text;
    }
    address.noFunction = text.find('.') == std::string_view::npos;
    if (!takeHex(text, 2, ':', address.bus)) return false;
    if (!takeHex(text, 2, address.noFunction ? '\0' : '.', address.device)) return false;
    if (!address.noFunction && !takeHex(text, 1, '\0', address.function)) return false;
    return address.device <= kHighestDevice && address.function <= kHighestFunction;
}

bool parseMac(std::string_view text, std::array<std::uint8_t, 6>& mac) {
    for (std::size_t index = 0; index < mac.size(); ++index)
        if (!takeHex(text, 2, index + 1 == mac.size() ? '\0' : ':', mac[index])) return false;
    return true;
}

/// Names are printed, logged and made part of object paths: anything printable, but no control character.
bool isGoodName(std::string_view name) {
    return !name.empty() && name.size() <= kLongestName &&
           std::none_of(name.begin(), name.end(), utils::isControl);
}

utils::FirmwareVersionInfo readComponent(const TomlTable& table) {
    table.allowOnly(kComponentKeys);
    const std::size_t type = table.requiredChoice("type", kComponentTypes);
    const std::uint16_t revision = table.number<std::uint16_t>("revision").value_or(1);
    return {static_cast<utils::FirmwareType>(type + 1), revision};
}

Fault readFault(const TomlTable& table) {
    table.allowOnly(kFaultKeys);
    const std::size_t operation = table.requiredChoice("at", kOperations);
    const std::size_t action = table.requiredChoice("action", kActions);
    Fault fault;
    fault.at = static_cast<Operation>(operation);
    fault.action = static_cast<Fault::Action>(action);
    fault.percent = table.number<std::uint16_t>("percent", 100).value_or(0);
    fault.code = table.number<std::uint32_t>("code").value_or(6);
    fault.text = table.text("text").value_or("ordered fault: " + std::string(kActions[action]) + " at " +
                                             std::string(kOperations[operation]));
    fault.milliseconds = table.number<std::uint32_t>("milliseconds", kLongestStall).value_or(0);
    fault.once = table.flag("once", false);
    return fault;
}

void readIds(const TomlTable& table, PciIds& ids) {
    const std::string id = table.requiredText("pci_id", "1af4:1041");
    if (!parseIds(id, ids.vendor, ids.device))
        table.refuse("pci_id", id, "like \"1af4:1041\" (vendor:device)");
    // A card without a subsystem of its own repeats its ids there.
    const std::string subsystem = table.text("subsystem_id").value_or(id);
    if (!parseIds(subsystem, ids.subsystemVendor, ids.subsystemDevice))
        table.refuse("subsystem_id", subsystem, "like \"1af4:1100\"");
}

void readPlace(const TomlTable& table, AdapterDescription& adapter) {
    const std::string address = table.requiredText("pci_address", "0000:03:00.0");
    if (!parseAddress(address, adapter.address))
        table.refuse("pci_address", address, "like \"0000:03:00.0\" (domain:bus:device.function)");
    const std::string mac = table.requiredText("mac", "52:54:00:12:34:56");
    if (!parseMac(mac, adapter.mac)) table.refuse("mac", mac, "like \"52:54:00:12:34:56\"");
}

/// The name first: every other mistake is then told with it.
AdapterDescription readAdapter(const toml::table& node, const TomlTable& top, std::size_t number) {
    const TomlTable unnamed = top.inner(node, "adapter " + std::to_string(number));
    // A name that seems to be missing may be there under a misspelt key.
    if (!node.contains("name")) unnamed.allowOnly(kAdapterKeys);
    AdapterDescription adapter;
    adapter.name = unnamed.requiredText("name", "eth0");
    if (!isGoodName(adapter.name))
        unnamed.refuse("name", adapter.name,
                       "1 to " + std::to_string(kLongestName) + " bytes without control characters");

    const TomlTable table = top.inner(node, "adapter " + inQuotes(adapter.name));
    table.allowOnly(kAdapterKeys);
    readPlace(table, adapter);
    readIds(table, adapter.ids);
    adapter.description = table.text("description").value_or("");
    adapter.speed = table.number<std::uint64_t>("speed", kHighestSpeed).value_or(adapter.speed);
    adapter.linkUp = table.flag("link", adapter.linkUp);
    adapter.canBeUpdated = table.flag("updatable", adapter.canBeUpdated);
    adapter.writeSpeed = table.number<std::uint64_t>("write_speed", kHighestSpeed).value_or(adapter.writeSpeed);
    adapter.bootType = static_cast<BootType>(table.choice("boot_type", kBootTypes).value_or(0));
    adapter.flashFile = table.text("flash_file").value_or("");
    for (const toml::table* component : table.tables("components"))
        adapter.components.push_back(
            readComponent(table.inner(*component, "a component of " + inQuotes(adapter.name))));
    for (const toml::table* fault : table.tables("fault"))
        adapter.faults.push_back(readFault(table.inner(*fault, "a fault of " + inQuotes(adapter.name))));
    return adapter;
}

std::optional<std::vector<std::uint8_t>> readDescriptionFile(const std::string& path, std::size_t most) try {
    return os::readWholeFile(path, most);
} catch (const std::system_error& error) {
    throw AdapterError(std::string("the adapter description: ") + error.what());
}

/// Two ports under one name would be one adapter to every caller; two at one address, one card to the
/// boot-type reset and to the inventory.
void refuseDoubles(const std::vector<AdapterDescription>& adapters, const TomlTable& top) {
    for (std::size_t last = 1; last < adapters.size(); ++last) {
        for (std::size_t first = 0; first < last; ++first) {
            if (adapters[first].name == adapters[last].name)
                top.fail("adapter", "two adapters are called " + inQuotes(adapters[last].name) +
                                        "; each needs its own name");
            if (adapters[first].address == adapters[last].address)
                top.fail("adapter", "adapters " + inQuotes(adapters[first].name) + " and " +
                                        inQuotes(adapters[last].name) +
                                        " have one PCI address; each needs its own");
        }
    }
}

}  // namespace

std::vector<AdapterDescription> parseAdapterDescriptions(std::string_view text,
                                                         const std::string& fileName) try {
    const toml::table parsed = utils::parseToml(text);
    const TomlTable top(parsed, "adapter description");
    top.allowOnly(kTopKeys);
    std::vector<AdapterDescription> adapters;
    for (const toml::table* node : top.tables("adapter"))
        adapters.push_back(readAdapter(*node, top, adapters.size() + 1));
    refuseDoubles(adapters, top);
    return adapters;
} catch (const utils::TomlError& error) {
    throw AdapterError(error.in(fileName));
}

std::vector<AdapterDescription> loadAdapterDescriptions(const std::string& path) {
    constexpr std::size_t kMaxText = std::size_t{4} * 1024 * 1024;
    // One byte more tells a file that is too long from one that just fits.
    const auto bytes = readDescriptionFile(path, kMaxText + 1);
    if (!bytes) throw AdapterError("there is no adapter description " + path + "; name a readable file");
    if (bytes->size() > kMaxText)
        throw AdapterError("the adapter description " + path + " is longer than 4 MiB");
    std::vector<AdapterDescription> adapters =
        parseAdapterDescriptions(std::string(bytes->begin(), bytes->end()), path);
    // Relative to the description, so that both can be moved together; "/" takes an absolute path as it is.
    const std::filesystem::path folder = std::filesystem::path(path).parent_path();
    for (AdapterDescription& adapter : adapters)
        if (!adapter.flashFile.empty()) adapter.flashFile = (folder / adapter.flashFile).string();
    return adapters;
}

}  // namespace ma
