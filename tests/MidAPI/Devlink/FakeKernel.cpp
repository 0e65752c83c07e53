// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/FakeKernel.h"

#include <linux/devlink.h>
#include <linux/genetlink.h>
#include <linux/netlink.h>
#include <sys/socket.h>

#include <cerrno>
#include <filesystem>
#include <system_error>

#include "MidAPI/Devlink/GenericNetlink.h"

namespace test {

namespace {

constexpr std::uint16_t kFamily = 21;
constexpr std::uint32_t kGroup = 6;
const std::string kFirmware = "/lib/firmware/";

/// Puts messages together, by the layout alone: the fake shares no code with what reads it.
class Writer {
  public:
    Writer& bytes(const Datagram& bytes) {
        m_bytes.insert(m_bytes.end(), bytes.begin(), bytes.end());
        return *this;
    }
    template <class Number>
    Writer& number(Number value) {
        const auto* const first = reinterpret_cast<const std::uint8_t*>(&value);
        return bytes({first, first + sizeof value});
    }
    Writer& attribute(std::uint16_t type, const Datagram& payload) {
        number(static_cast<std::uint16_t>(payload.size() + 4)).number(type).bytes(payload);
        m_bytes.resize((m_bytes.size() + 3) / 4 * 4);
        return *this;
    }
    Writer& text(std::uint16_t type, const std::string& value) {
        return attribute(type, Datagram(value.c_str(), value.c_str() + value.size() + 1));
    }
    template <class Number>
    Writer& value(std::uint16_t type, Number number) {
        return attribute(type, Writer().number(number).take());
    }
    Datagram take() { return std::move(m_bytes); }

  private:
    Datagram m_bytes;
};

Datagram message(std::uint16_t type, std::uint16_t flags, std::uint32_t sequence, const Datagram& payload) {
    Writer header;
    header.number(static_cast<std::uint32_t>(16 + payload.size())).number(type).number(flags);
    return header.number(sequence).number(std::uint32_t{0}).bytes(payload).take();
}

Datagram familyMessage(std::uint16_t family, std::uint8_t command, std::uint32_t sequence, Writer& content) {
    return message(family, 0, sequence, Writer().bytes({command, 1, 0, 0}).bytes(content.take()).take());
}

}  // namespace

/// What a request holds: every attribute of ours is a text, or is not looked at.
struct FakeKernel::Request {
    ma::devlink::Message message;
    std::map<std::uint16_t, std::string> texts;
    std::map<std::uint16_t, std::uint32_t> offsets;

    explicit Request(std::span<const std::uint8_t> bytes) : message(ma::devlink::readMessages(bytes).at(0)) {
        for (const auto& [type, payload] : ma::devlink::readAttributes(message.attributes())) {
            texts[type] = reinterpret_cast<const char*>(payload.data());
            offsets[type] = static_cast<std::uint32_t>(payload.data() - bytes.data() - 4);
        }
    }
};

FakeKernel::FakeKernel() {
    for (const char* folder : {"/lib/firmware", "/var/lib"})
        putFolder(folder);
}

FakeDevice& FakeKernel::add(const std::string& address, const std::string& interface) {
    const std::string folder = "/sys/bus/pci/devices/" + address;
    put(folder + "/class", "0x020000");
    put(folder + "/vendor", "0x1af4");
    put(folder + "/device", "0x1041");
    put(folder + "/subsystem_vendor", "0x1af4");
    put(folder + "/subsystem_device", "0x1100");
    drop(folder + "/driver");
    std::filesystem::create_symlink("../../../bus/pci/drivers/fake", in(folder + "/driver"));
    if (!interface.empty()) putFolder(folder + "/net/" + interface);
    return devices[address];
}

void FakeKernel::put(const std::string& path, const std::string& content) const {
    putFolder(path.substr(0, path.rfind('/')));
    m_root.write(path.substr(1), content);
}

void FakeKernel::putFolder(const std::string& path) const {
    std::filesystem::create_directories(in(path));
}

void FakeKernel::drop(const std::string& path) const {
    std::filesystem::remove_all(in(path));
}

std::string FakeKernel::may(const std::string& operation, const std::string& path) const {
    const auto failure = failures.find(operation);
    if (failure != failures.end())
        throw std::system_error(failure->second, std::generic_category(), operation);
    return in(path);
}

os::Descriptor FakeKernel::openNetlink() {
    may("openNetlink");
    int ends[2] = {-1, -1};
    if (::socketpair(AF_UNIX, SOCK_SEQPACKET | SOCK_CLOEXEC, 0, ends) != 0)
        throw std::system_error(errno, std::generic_category(), "socketpair");
    const std::lock_guard lock(m_mutex);
    m_sockets.erase(ends[0]);
    m_sockets.emplace(ends[0], Socket{os::Descriptor(ends[1])});
    return os::Descriptor(ends[0]);
}

void FakeKernel::joinGroup(const os::Descriptor& socket, std::uint32_t group) {
    may("joinGroup");
    const std::lock_guard lock(m_mutex);
    if (group == kGroup) m_sockets.at(socket.number()).isListening = true;
}

void FakeKernel::deliver(Socket& socket, const Datagram& datagram) const {
    Datagram sent = datagram;
    if (mangle) mangle(sent);
    // A reader who is too slow loses what has no room.
    if (::send(socket.far.number(), sent.data(), sent.size(), MSG_DONTWAIT | MSG_NOSIGNAL) < 0 &&
        errno == EAGAIN)
        socket.hasOverrun = true;
}

void FakeKernel::answer(int socket, const Datagram& datagram) {
    const std::lock_guard lock(m_mutex);
    deliver(m_sockets.at(socket), datagram);
}

void FakeKernel::notify(std::uint8_t command, const std::string& address, const FakeDevice::Status* status) {
    Writer content;
    content.text(DEVLINK_ATTR_BUS_NAME, "pci").text(DEVLINK_ATTR_DEV_NAME, address);
    if (status != nullptr) {
        if (!status->text.empty()) content.text(DEVLINK_ATTR_FLASH_UPDATE_STATUS_MSG, status->text);
        content.value(DEVLINK_ATTR_FLASH_UPDATE_STATUS_DONE, status->done)
            .value(DEVLINK_ATTR_FLASH_UPDATE_STATUS_TOTAL, status->total);
    }
    const Datagram datagram = familyMessage(kFamily, command, 0, content);
    const std::lock_guard lock(m_mutex);
    for (auto& [number, socket] : m_sockets)
        if (socket.isListening) deliver(socket, datagram);
}

std::optional<std::size_t> FakeKernel::receive(const os::Descriptor& socket, std::span<std::uint8_t> buffer,
                                               std::chrono::milliseconds patience) {
    {
        const std::lock_guard lock(m_mutex);
        if (std::exchange(m_sockets.at(socket.number()).hasOverrun, false))
            throw std::system_error(ENOBUFS, std::generic_category(), "receive");
    }
    return LinuxMachine::receive(socket, buffer, patience);
}

void FakeKernel::send(const os::Descriptor& socket, std::span<const std::uint8_t> message) {
    may("send");
    const Request request(message);
    if (request.message.type == GENL_ID_CTRL)
        resolveFamily(socket.number(), request);
    else
        handle(socket.number(), request);
}

void FakeKernel::acknowledge(int socket, const Request& request, int error, const std::string& text,
                             std::uint16_t attribute, std::uint32_t value) {
    Writer content;
    content.number(-error);
    content.number(std::uint32_t{20}).number(request.message.type).number(std::uint16_t{5});
    content.number(request.message.sequence).number(std::uint32_t{0});
    if (!text.empty()) content.text(NLMSGERR_ATTR_MSG, text);
    if (attribute != 0) content.value(attribute, value);
    constexpr std::uint16_t kFlags = NLM_F_CAPPED | NLM_F_ACK_TLVS;
    answer(socket, message(NLMSG_ERROR, kFlags, request.message.sequence, content.take()));
}

void FakeKernel::resolveFamily(int socket, const Request& request) {
    if (!hasDevlink) return acknowledge(socket, request, ENOENT);
    const Datagram other =
        Writer().text(CTRL_ATTR_MCAST_GRP_NAME, "other").value(CTRL_ATTR_MCAST_GRP_ID, kGroup + 1).take();
    const Datagram group =
        Writer().value(CTRL_ATTR_MCAST_GRP_ID, kGroup).text(CTRL_ATTR_MCAST_GRP_NAME, "config").take();
    Writer content;
    content.text(CTRL_ATTR_FAMILY_NAME, "devlink").value(CTRL_ATTR_FAMILY_ID, kFamily);
    content.attribute(CTRL_ATTR_MCAST_GROUPS | NLA_F_NESTED,
                      Writer().attribute(1 | NLA_F_NESTED, other).attribute(2 | NLA_F_NESTED, group).take());
    answer(socket, familyMessage(GENL_ID_CTRL, CTRL_CMD_NEWFAMILY, request.message.sequence, content));
    acknowledge(socket, request, 0);
}

std::recursive_mutex& FakeKernel::lockOf(const std::string& address) {
    const std::lock_guard lock(m_mutex);
    ++requests;
    return m_deviceLocks[address];
}

void FakeKernel::handle(int socket, const Request& request) {
    const std::lock_guard lock(lockOf(request.texts.at(DEVLINK_ATTR_DEV_NAME)));
    const bool isFlash = request.message.command() == DEVLINK_CMD_FLASH_UPDATE;
    const bool isReset = request.message.command() == DEVLINK_CMD_RELOAD;
    if ((isFlash || isReset) && !isPermitted) return acknowledge(socket, request, EPERM);
    const auto device = devices.find(request.texts.at(DEVLINK_ATTR_DEV_NAME));
    if (device == devices.end()) return acknowledge(socket, request, ENODEV);
    if (isFlash) return flash(socket, request, device->second);
    if (isReset) return reset(socket, request, device->second);
    if (request.message.command() == DEVLINK_CMD_GET) return tellDevice(socket, request, device->second);
    tellInfo(socket, request, device->second);
}

void FakeKernel::tellInfo(int socket, const Request& request, const FakeDevice& device) {
    if (!device.hasInfo) return acknowledge(socket, request, EOPNOTSUPP);
    if (device.infoError != 0) return acknowledge(socket, request, device.infoError);
    Writer content;
    content.text(DEVLINK_ATTR_INFO_DRIVER_NAME, device.driver);
    if (!device.serial.empty()) content.text(DEVLINK_ATTR_INFO_SERIAL_NUMBER, device.serial);
    if (!device.boardSerial.empty()) content.text(DEVLINK_ATTR_INFO_BOARD_SERIAL_NUMBER, device.boardSerial);
    const auto versions = [&](std::uint16_t kind, const std::map<std::string, std::string>& all) {
        for (const auto& [name, version] : all)
            content.attribute(kind | NLA_F_NESTED, Writer()
                                                       .text(DEVLINK_ATTR_INFO_VERSION_NAME, name)
                                                       .text(DEVLINK_ATTR_INFO_VERSION_VALUE, version)
                                                       .take());
    };
    versions(DEVLINK_ATTR_INFO_VERSION_FIXED, device.fixed);
    versions(DEVLINK_ATTR_INFO_VERSION_RUNNING, device.running);
    versions(DEVLINK_ATTR_INFO_VERSION_STORED, device.stored);
    answer(socket, familyMessage(kFamily, request.message.command(), request.message.sequence, content));
    acknowledge(socket, request, 0);
}

// Of the resets that others have caused the kernel lists every kind, whether the driver offers it or not.
void FakeKernel::tellDevice(int socket, const Request& request, const FakeDevice& device) {
    const auto counts = [](std::uint8_t action) {
        return Writer()
            .attribute(DEVLINK_ATTR_RELOAD_ACTION_INFO | NLA_F_NESTED,
                       Writer().value(DEVLINK_ATTR_RELOAD_ACTION, action).take())
            .take();
    };
    const auto offered = static_cast<std::uint8_t>(
        device.offersActivation ? DEVLINK_RELOAD_ACTION_FW_ACTIVATE : DEVLINK_RELOAD_ACTION_DRIVER_REINIT);
    Writer content;
    content.attribute(DEVLINK_ATTR_DEV_STATS | NLA_F_NESTED,
                      Writer()
                          .attribute(DEVLINK_ATTR_RELOAD_STATS | NLA_F_NESTED, counts(offered))
                          .attribute(DEVLINK_ATTR_REMOTE_RELOAD_STATS | NLA_F_NESTED,
                                     counts(DEVLINK_RELOAD_ACTION_FW_ACTIVATE))
                          .take());
    answer(socket, familyMessage(kFamily, DEVLINK_CMD_NEW, request.message.sequence, content));
    acknowledge(socket, request, 0);
}

void FakeKernel::reset(int socket, const Request& request, FakeDevice& device) {
    const std::string action(1, static_cast<char>(DEVLINK_RELOAD_ACTION_FW_ACTIVATE));
    if (!device.offersActivation || request.texts.at(DEVLINK_ATTR_RELOAD_ACTION) != action)
        return acknowledge(socket, request, EOPNOTSUPP,
                           "Requested reload action is not supported by the driver");
    if (device.duringReset) device.duringReset();
    if (device.activationError == 0 && device.activates) device.running = device.stored;
    if (device.isAcknowledged) acknowledge(socket, request, device.activationError);
}

// The order of the refusals is the kernel's.
void FakeKernel::flash(int socket, const Request& request, FakeDevice& device) {
    if (!device.hasFlash) return acknowledge(socket, request, EOPNOTSUPP);
    if (!request.texts.contains(DEVLINK_ATTR_FLASH_UPDATE_FILE_NAME))
        return acknowledge(socket, request, EINVAL, "", NLMSGERR_ATTR_MISS_TYPE,
                           DEVLINK_ATTR_FLASH_UPDATE_FILE_NAME);
    std::string component;
    if (const auto asked = request.texts.find(DEVLINK_ATTR_FLASH_UPDATE_COMPONENT);
        asked != request.texts.end()) {
        component = asked->second;
        if (!device.components.contains(component))
            return acknowledge(socket, request, EINVAL, "selected component is not supported by this device",
                               NLMSGERR_ATTR_OFFS, request.offsets.at(DEVLINK_ATTR_FLASH_UPDATE_COMPONENT));
    }
    const std::string path = kFirmware + request.texts.at(DEVLINK_ATTR_FLASH_UPDATE_FILE_NAME);
    const std::string noFile = "failed to locate the requested firmware file";
    const std::uint32_t offset = request.offsets.at(DEVLINK_ATTR_FLASH_UPDATE_FILE_NAME);
    if (path == kFirmware) return acknowledge(socket, request, EINVAL, noFile, NLMSGERR_ATTR_OFFS, offset);
    const auto content = readFile(path);
    if (!content) return acknowledge(socket, request, ENOENT, noFile, NLMSGERR_ATTR_OFFS, offset);

    const std::string address = request.texts.at(DEVLINK_ATTR_DEV_NAME);
    notify(DEVLINK_CMD_FLASH_UPDATE, address);
    for (const FakeDevice::Status& status : device.statuses)
        notify(DEVLINK_CMD_FLASH_UPDATE_STATUS, address, &status);
    if (device.duringFlash) device.duringFlash();
    flashed.push_back(component + ':' + *content);
    flashedFiles.push_back(path);
    if (device.error == 0 && !device.stored.empty()) device.stored["fw"] = device.storedAfterwards;
    if (device.tellsEnd) notify(DEVLINK_CMD_FLASH_UPDATE_END, address);
    if (device.isAcknowledged) acknowledge(socket, request, device.error, device.errorText);
}

}  // namespace test
