// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/PciFunctions.h"

#include <algorithm>

#include "Utils/Utils.h"

namespace ma::devlink {
namespace {

const std::string kDevices = "/sys/bus/pci/devices/";
const std::string kInterfaces = "/sys/class/net/";

template <class Number>
std::optional<Number> readHex(Machine& machine, const std::string& path) {
    const std::string text = machine.readFile(path).value_or("");
    if (!text.starts_with("0x")) return std::nullopt;
    return utils::parseNumber<Number>(std::string_view(text).substr(2), 16);
}

PciIds readIds(Machine& machine, const std::string& folder) {
    const auto id = [&](const char* name) {
        return readHex<std::uint16_t>(machine, folder + name).value_or(0);
    };
    return {id("/vendor"), id("/device"), id("/subsystem_vendor"), id("/subsystem_device")};
}

/// What is there and cannot be read.
struct Unreadable {};

utils::StringArray list(Machine& machine, const std::string& folder) {
    auto names = machine.listFolder(folder);
    if (!names) throw Unreadable();
    return *std::move(names);
}

/// The folders below which a function's interfaces are. For virtio they are those of the device within it.
utils::StringArray interfaceFolders(Machine& machine, const std::string& function) {
    utils::StringArray folders;
    if (machine.folderExists(function + "/net")) folders.push_back(function + "/net");
    for (const std::string& name : list(machine, function)) {
        const std::string inner = utils::formatStr("%s/%s/net", function.c_str(), name.c_str());
        if (name.starts_with("virtio") && machine.folderExists(inner)) folders.push_back(inner);
    }
    return folders;
}

utils::StringArray allInterfaces(Machine& machine, const utils::StringArray& folders) {
    utils::StringArray interfaces;
    for (const std::string& folder : folders)
        for (const std::string& interface : list(machine, folder))
            interfaces.push_back(interface);
    return interfaces;
}

/// An interface that stands for a virtual function, or another one, in the switch of the card: the kernel
/// names its port after that function ("pf0vf3", "c1pf0").
bool isRepresentor(Machine& machine, const std::string& interface) {
    std::string port = machine.readFile(kInterfaces + interface + "/phys_port_name").value_or("");
    if (port.starts_with('c')) port.erase(0, std::min(port.find_first_not_of("0123456789", 1), port.size()));
    return port.starts_with("pf");
}

/// A function of an Ethernet card that is not a virtual one.
bool isEthernet(Machine& machine, const std::string& address) {
    constexpr std::string_view kEthernet = "0x0200";
    const std::string folder = kDevices + address;
    const auto code = machine.readFile(folder + "/class");
    // What was pulled out meanwhile is not there any more, either.
    if (!code && machine.folderExists(folder)) throw Unreadable();
    return code.value_or("").starts_with(kEthernet) && parseFunctionAddress(address) &&
           !machine.readLink(folder + "/physfn");
}

std::optional<PciFunction> readFunction(Machine& machine, const std::string& address) {
    const std::string folder = kDevices + address;
    if (!isEthernet(machine, address)) return std::nullopt;
    PciFunction function{.address = address, .ids = readIds(machine, folder)};
    const std::string driver = machine.readLink(folder + "/driver").value_or("");
    function.driver = driver.substr(driver.rfind('/') + 1);
    const utils::StringArray folders = interfaceFolders(machine, folder);
    function.interfaces = allInterfaces(machine, folders);
    // Where there is a place for interfaces but none in it, they are in another namespace.
    if (!folders.empty() && function.interfaces.empty()) return std::nullopt;
    std::erase_if(function.interfaces,
                  [&](const std::string& interface) { return isRepresentor(machine, interface); });
    return function;
}

void readMac(const std::string& text, std::array<std::uint8_t, 6>& mac) {
    const utils::StringArray bytes = utils::split(text, ':');
    if (bytes.size() != mac.size()) return;
    std::ranges::transform(bytes, mac.begin(), [](const std::string& byte) {
        return utils::parseNumber<std::uint8_t>(byte, 16).value_or(0);
    });
}

}  // namespace

std::string PciFunction::card() const {
    return address.substr(0, address.rfind('.'));
}

std::optional<std::vector<PciFunction>> findPciFunctions(Machine& machine) try {
    std::vector<PciFunction> functions;
    for (const std::string& address : list(machine, kDevices))
        if (auto function = readFunction(machine, address)) functions.push_back(*std::move(function));
    // The order of the texts is that of the addresses, but for domains of more than four digits.
    std::ranges::stable_sort(functions, {},
                             [](const PciFunction& function) { return function.address.size(); });
    return functions;
} catch (const Unreadable&) {
    return std::nullopt;
}

CardFunctions readCard(Machine& machine, const std::string& card, const utils::StringArray& addresses) try {
    CardFunctions found;
    const auto isMeant = [&](const std::string& address) {
        return std::ranges::find(addresses, address) != addresses.end() ||
               (address.starts_with(card + '.') && isEthernet(machine, address));
    };
    for (const std::string& address : list(machine, kDevices)) {
        if (!isMeant(address)) continue;
        found.functions.push_back(address);
        const std::string folder = kDevices + address;
        utils::StringArray folders = interfaceFolders(machine, folder);
        for (const std::string& name : list(machine, folder))
            if (name.starts_with("virtfn")) {
                std::string inner = folder + '/';
                inner += name;
                for (std::string& each : interfaceFolders(machine, inner))
                    folders.push_back(std::move(each));
            }
        for (std::string& interface : allInterfaces(machine, folders))
            found.interfaces.push_back(std::move(interface));
    }
    return found;
} catch (const Unreadable&) {
    throw AdapterError("What is on card " + card + " cannot be read in " + kDevices +
                       "; this process may have too many files open.");
}

InterfaceState readInterfaceState(Machine& machine, const PciFunction& function) {
    InterfaceState state;
    for (auto name = function.interfaces.rbegin(); name != function.interfaces.rend(); ++name) {
        const std::string folder = kInterfaces + *name;
        // A bond gives its slaves an address that they have in common.
        const auto own = machine.readFile(folder + "/bonding_slave/perm_hwaddr");
        readMac(own ? *own : machine.readFile(folder + "/address").value_or(""), state.mac);
        // Where nothing is plugged in, the kernel says -1, or nothing.
        const auto megabits =
            utils::parseNumber<std::uint32_t>(machine.readFile(folder + "/speed").value_or(""));
        constexpr std::uint64_t kMega = 1'000'000;
        if (megabits && *megabits != UINT32_MAX) state.speed = *megabits * kMega;
        state.linkUp = state.linkUp || machine.readFile(folder + "/carrier") == "1";
    }
    return state;
}

std::optional<utils::PCIAddr> parseFunctionAddress(std::string_view address) {
    constexpr std::uint8_t kHighestDevice = 31;
    constexpr std::uint8_t kHighestFunction = 7;
    const utils::StringArray fields = utils::split(address, ':');
    if (fields.size() != 3) return std::nullopt;
    const std::size_t point = std::min(fields[2].find('.'), fields[2].size() - 1);
    const auto domain = utils::parseNumber<std::uint32_t>(fields[0], 16);
    const auto bus = utils::parseNumber<std::uint8_t>(fields[1], 16);
    const auto device = utils::parseNumber<std::uint8_t>(std::string_view(fields[2]).substr(0, point), 16);
    const auto function = utils::parseNumber<std::uint8_t>(std::string_view(fields[2]).substr(point + 1), 16);
    if (!domain || !bus || !device || !function) return std::nullopt;
    if (*device > kHighestDevice || *function > kHighestFunction) return std::nullopt;
    return utils::PCIAddr{*bus, *device, *function, false, std::string(address)};
}

}  // namespace ma::devlink
