#include "MidAPI/Simulator/AdapterDescription.h"

#include <algorithm>
#include <charconv>
#include <filesystem>
#include <limits>

#include "MidAPI/AdapterError.h"
#include "MidAPI/Image/OptionRom.h"
#include "MidAPI/Simulator/FlashFiles.h"
#include "MidAPI/Simulator/TomlTable.h"
#include "MidAPI/Simulator/WholeFile.h"

namespace ma {
namespace {

constexpr std::size_t LONGEST_NAME = 64;
constexpr uint64_t LONGEST_STALL = 600'000;  // ten minutes, in milliseconds

constexpr std::array<std::string_view, 14> ADAPTER_KEYS = {
    "name", "description", "pci_address", "pci_id",    "subsystem_id", "mac",        "speed",
    "link", "updatable",   "write_speed", "boot_type", "flash_file",   "components", "fault"};
constexpr std::array<std::string_view, 2> COMPONENT_KEYS = {"type", "revision"};
constexpr std::array<std::string_view, 7> FAULT_KEYS = {"at",   "action",       "percent", "code",
                                                        "text", "milliseconds", "once"};
constexpr std::array<std::string_view, 1> TOP_KEYS = {"adapter"};
constexpr std::array<std::string_view, 5> COMPONENT_TYPES = {"IMG_CLP", "IMG_iSCSI", "IMG_PXE", "IMG_UEFI",
                                                             "IMG_FCoE"};
constexpr std::array<std::string_view, 5> BOOT_TYPES = {"none", "pxe", "iscsi", "fcoe", "uefi"};
// In the order of Operation and of Fault::Action.
constexpr std::array<std::string_view, 8> OPERATIONS = {"enumerate", "pci-address", "firmware-version",
                                                        "prepare",   "write",       "capability-word",
                                                        "boot-type", "info"};
constexpr std::array<std::string_view, 5> ACTIONS = {"fail", "throw", "stall", "power-loss", "kill"};

/// Takes hexadecimal digits and then the separator (none when it is NUL) off the front of a text.
bool takeHex(std::string_view& text, std::size_t fewest, std::size_t most, char separator, uint32_t& value) {
    const char* end = text.data() + std::min(most, text.size());
    const auto result = std::from_chars(text.data(), end, value, 16);
    const auto count = static_cast<std::size_t>(result.ptr - text.data());
    if (result.ec != std::errc() || count < fewest) return false;
    text.remove_prefix(count);
    if (separator == '\0') return text.empty();
    if (text.empty() || text.front() != separator) return false;
    text.remove_prefix(1);
    return true;
}

bool parseIds(std::string_view text, uint16_t& vendor, uint16_t& device) {
    uint32_t first = 0;
    uint32_t second = 0;
    if (!takeHex(text, 4, 4, ':', first) || !takeHex(text, 4, 4, '\0', second)) return false;
    vendor = static_cast<uint16_t>(first);
    device = static_cast<uint16_t>(second);
    return true;
}

/// "0000:03:00.0"; the domain may be left out, and so may the function.
bool parseAddress(std::string_view text, utils::PCIAddr& address) {
    constexpr uint32_t HIGHEST_DEVICE = 31;
    constexpr uint32_t HIGHEST_FUNCTION = 7;
    // One spelling for one place: ports are told apart by this text, too.
    address.text.resize(text.size());
    std::transform(text.begin(), text.end(), address.text.begin(), [](char character) {
        return character >= 'A' && character <= 'F' ? static_cast<char>(character - 'A' + 'a') : character;
    });
    uint32_t domain = 0;
    uint32_t bus = 0;
    uint32_t device = 0;
    uint32_t function = 0;
    if (std::count(text.begin(), text.end(), ':') == 2) {
        if (!takeHex(text, 4, 4, ':', domain)) return false;
    } else {
        address.text = "0000:" + address.text;
    }
    address.noFunction = text.find('.') == std::string_view::npos;
    if (!takeHex(text, 2, 2, ':', bus) || !takeHex(text, 2, 2, address.noFunction ? '\0' : '.', device))
        return false;
    if (!address.noFunction && !takeHex(text, 1, 1, '\0', function)) return false;
    address.bus = static_cast<uint8_t>(bus);
    address.device = static_cast<uint8_t>(device);
    address.function = static_cast<uint8_t>(function);
    return device <= HIGHEST_DEVICE && function <= HIGHEST_FUNCTION;
}

bool parseMac(std::string_view text, std::array<uint8_t, 6>& mac) {
    for (std::size_t index = 0; index < mac.size(); ++index) {
        uint32_t value = 0;
        if (!takeHex(text, 2, 2, index + 1 == mac.size() ? '\0' : ':', value)) return false;
        mac[index] = static_cast<uint8_t>(value);
    }
    return true;
}

/// Names are printed, logged and made part of object paths: anything printable, but no control character.
bool isGoodName(std::string_view name) {
    return !name.empty() && name.size() <= LONGEST_NAME &&
           std::none_of(name.begin(), name.end(), [](char character) {
               return static_cast<unsigned char>(character) < 0x20 || character == 0x7F;
           });
}

utils::FirmwareVersionInfo readComponent(const TomlTable& table) {
    table.allowOnly(COMPONENT_KEYS);
    const std::optional<std::size_t> type = table.choice("type", COMPONENT_TYPES);
    if (!type) table.fail("type", "\"type\" is missing; it must be " + listOf(COMPONENT_TYPES));
    const uint64_t revision = table.number("revision", std::numeric_limits<uint16_t>::max()).value_or(1);
    return {static_cast<utils::FirmwareType>(*type + 1), static_cast<uint32_t>(revision)};
}

Fault readFault(const TomlTable& table) {
    table.allowOnly(FAULT_KEYS);
    const std::optional<std::size_t> operation = table.choice("at", OPERATIONS);
    if (!operation) table.fail("at", "\"at\" is missing; it must be " + listOf(OPERATIONS));
    const std::optional<std::size_t> action = table.choice("action", ACTIONS);
    if (!action) table.fail("action", "\"action\" is missing; it must be " + listOf(ACTIONS));
    Fault fault;
    fault.at = static_cast<Operation>(*operation);
    fault.action = static_cast<Fault::Action>(*action);
    fault.percent = static_cast<uint16_t>(table.number("percent", 100).value_or(0));
    fault.code =
        static_cast<uint32_t>(table.number("code", std::numeric_limits<uint32_t>::max()).value_or(6));
    fault.text = table.text("text").value_or("ordered fault: " + std::string(ACTIONS[*action]) + " at " +
                                             std::string(OPERATIONS[*operation]));
    fault.milliseconds = static_cast<uint32_t>(table.number("milliseconds", LONGEST_STALL).value_or(0));
    fault.once = table.flag("once", false);
    return fault;
}

void readIds(const TomlTable& table, PciIds& ids) {
    const std::string id = table.requiredText("pci_id", "1af4:1041");
    if (!parseIds(id, ids.vendor, ids.device))
        table.fail("pci_id",
                   "\"pci_id\" is " + inQuotes(id) + ", it must be like \"1af4:1041\" (vendor:device)");
    const std::string subsystem = table.text("subsystem_id").value_or(id);
    if (!parseIds(subsystem, ids.subsystemVendor, ids.subsystemDevice))
        table.fail("subsystem_id",
                   "\"subsystem_id\" is " + inQuotes(subsystem) + ", it must be like \"1af4:1100\"");
}

void readPlace(const TomlTable& table, AdapterDescription& adapter) {
    const std::string address = table.requiredText("pci_address", "0000:03:00.0");
    if (!parseAddress(address, adapter.address))
        table.fail("pci_address", "\"pci_address\" is " + inQuotes(address) +
                                      ", it must be like \"0000:03:00.0\" (domain:bus:device.function)");
    const std::string mac = table.requiredText("mac", "52:54:00:12:34:56");
    if (!parseMac(mac, adapter.mac))
        table.fail("mac", "\"mac\" is " + inQuotes(mac) + ", it must be like \"52:54:00:12:34:56\"");
}

AdapterDescription readAdapter(const toml::table& node, const TomlTable& top, std::size_t number) {
    const TomlTable unnamed = top.inner(node, "adapter " + std::to_string(number));
    AdapterDescription adapter;
    adapter.name = unnamed.requiredText("name", "eth0");
    if (!isGoodName(adapter.name))
        unnamed.fail("name", "\"name\" is " + inQuotes(adapter.name) + ", it must be 1 to " +
                                 std::to_string(LONGEST_NAME) + " bytes without control characters");

    const TomlTable table = top.inner(node, "adapter " + inQuotes(adapter.name));
    table.allowOnly(ADAPTER_KEYS);
    readPlace(table, adapter);
    readIds(table, adapter.ids);
    adapter.description = table.text("description").value_or("");
    adapter.speed = table.number("speed", std::numeric_limits<int64_t>::max()).value_or(0);
    adapter.linkUp = table.flag("link", true);
    adapter.canBeUpdated = table.flag("updatable", true);
    adapter.writeSpeed = table.number("write_speed", std::numeric_limits<int64_t>::max()).value_or(0);
    adapter.bootType = static_cast<BootType>(table.choice("boot_type", BOOT_TYPES).value_or(0));
    adapter.flashFile = table.text("flash_file").value_or("");
    for (const toml::table* component : table.tables("components"))
        adapter.components.push_back(
            readComponent(table.inner(*component, "a component of " + inQuotes(adapter.name))));
    for (const toml::table* fault : table.tables("fault"))
        adapter.faults.push_back(readFault(table.inner(*fault, "a fault of " + inQuotes(adapter.name))));
    return adapter;
}

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

std::vector<AdapterDescription> parseAdapterDescriptions(std::string_view text, const std::string& fileName) {
    const toml::parse_result parsed = toml::parse(text);
    if (!parsed)
        throw AdapterError(fileName + ", line " + std::to_string(parsed.error().source().begin.line) + ": " +
                           std::string(parsed.error().description()));
    const TomlTable top(parsed.table(), fileName, "adapter description");
    top.allowOnly(TOP_KEYS);
    std::vector<AdapterDescription> adapters;
    for (const toml::table* node : top.tables("adapter"))
        adapters.push_back(readAdapter(*node, top, adapters.size() + 1));
    refuseDoubles(adapters, top);
    return adapters;
}

std::vector<AdapterDescription> loadAdapterDescriptions(const std::string& path) {
    constexpr std::size_t MOST_TEXT = std::size_t{4} * 1024 * 1024;
    std::optional<std::vector<uint8_t>> bytes;
    try {
        bytes = readWholeFile(path, MOST_TEXT + 1);
    } catch (const FlashError& error) {
        throw AdapterError(std::string("the adapter description: ") + error.what());
    }
    if (!bytes) throw AdapterError("there is no adapter description " + path + "; name a readable file");
    if (bytes->size() > MOST_TEXT)
        throw AdapterError("the adapter description " + path + " is longer than 4 MiB");
    std::vector<AdapterDescription> adapters =
        parseAdapterDescriptions(std::string(bytes->begin(), bytes->end()), path);
    const std::filesystem::path folder = std::filesystem::path(path).parent_path();
    for (AdapterDescription& adapter : adapters)
        if (!adapter.flashFile.empty()) adapter.flashFile = (folder / adapter.flashFile).string();
    return adapters;
}

}  // namespace ma
