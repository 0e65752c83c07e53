// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/FakeKernel.h"

#include <fcntl.h>
#include <linux/devlink.h>
#include <linux/genetlink.h>
#include <linux/netlink.h>
#include <sys/socket.h>

#include <cerrno>
#include <cstring>
#include <system_error>

namespace test {

namespace {

constexpr std::uint16_t kFamily = 21;
constexpr std::uint32_t kGroup = 6;
const std::string kFirmware = "/lib/firmware/";

/// Puts messages together, by the layout alone: the fake shares no code with what it tests.
class Writer {
  public:
    template <class Number>
    Writer& number(Number value) {
        const auto* const bytes = reinterpret_cast<const std::uint8_t*>(&value);
        m_bytes.insert(m_bytes.end(), bytes, bytes + sizeof value);
        return *this;
    }
    Writer& attribute(std::uint16_t type, const Datagram& payload) {
        number(static_cast<std::uint16_t>(payload.size() + 4)).number(type);
        m_bytes.insert(m_bytes.end(), payload.begin(), payload.end());
        m_bytes.resize((m_bytes.size() + 3) / 4 * 4);
        return *this;
    }
    Writer& text(std::uint16_t type, const std::string& value) {
        Datagram payload(value.begin(), value.end());
        payload.push_back(0);
        return attribute(type, payload);
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
    Datagram result = Writer()
                          .number(static_cast<std::uint32_t>(16 + payload.size()))
                          .number(type)
                          .number(flags)
                          .number(sequence)
                          .number(std::uint32_t{0})
                          .take();
    result.insert(result.end(), payload.begin(), payload.end());
    return result;
}

Datagram familyMessage(std::uint16_t family, std::uint8_t command, std::uint32_t sequence, Writer& content) {
    Datagram payload{command, 1, 0, 0};
    const Datagram attributes = content.take();
    payload.insert(payload.end(), attributes.begin(), attributes.end());
    return message(family, 0, sequence, payload);
}

}  // namespace

/// What a request holds: every attribute of ours is a text, or is not looked at.
struct FakeKernel::Request {
    std::uint16_t family = 0;
    std::uint8_t command = 0;
    std::uint32_t sequence = 0;
    std::map<std::uint16_t, std::string> texts;
    std::map<std::uint16_t, std::uint32_t> offsets;

    explicit Request(std::span<const std::uint8_t> bytes) {
        std::memcpy(&family, bytes.data() + 4, sizeof family);
        std::memcpy(&sequence, bytes.data() + 8, sizeof sequence);
        command = bytes[16];
        for (std::size_t at = 20; at < bytes.size();) {
            std::uint16_t length = 0;
            std::uint16_t type = 0;
            std::memcpy(&length, &bytes[at], sizeof length);
            std::memcpy(&type, &bytes[at + 2], sizeof type);
            texts[type] = reinterpret_cast<const char*>(&bytes[at + 4]);
            offsets[type] = static_cast<std::uint32_t>(at);
            at += (length + 3U) / 4 * 4;
        }
    }
};

FakeDevice& FakeKernel::add(const std::string& address, const std::string& interface) {
    const std::string folder = "/sys/bus/pci/devices/" + address;
    files[folder + "/class"] = "0x020000";
    files[folder + "/vendor"] = "0x1af4";
    files[folder + "/device"] = "0x1041";
    files[folder + "/subsystem_vendor"] = "0x1af4";
    files[folder + "/subsystem_device"] = "0x1100";
    links[folder + "/driver"] = "../../../bus/pci/drivers/fake";
    if (!interface.empty()) folders.insert(folder + "/net/" + interface);
    return devices[address];
}

void FakeKernel::failIfTold(const std::string& operation) const {
    const auto failure = failures.find(operation);
    if (failure != failures.end())
        throw std::system_error(failure->second, std::generic_category(), operation);
}

std::string FakeKernel::lockPath(const std::string& path) const {
    return m_locks / path.substr(path.rfind('/') + 1);
}

std::optional<std::string> FakeKernel::readFile(const std::string& path) {
    if (reading) reading(path);
    const std::lock_guard lock(m_mutex);
    if (path.ends_with(".lock")) return ma::devlink::LinuxMachine().readFile(lockPath(path));
    const auto file = files.find(path);
    return file == files.end() ? std::nullopt : std::optional(file->second);
}

std::optional<std::string> FakeKernel::readLink(const std::string& path) {
    const auto link = links.find(path);
    return link == links.end() ? std::nullopt : std::optional(link->second);
}

utils::StringArray FakeKernel::listFolder(const std::string& path) {
    const std::lock_guard lock(m_mutex);
    const std::string prefix = path.ends_with('/') ? path : path + '/';
    std::set<std::string> names;
    const auto take = [&](const std::string& entry) {
        if (!entry.starts_with(prefix)) return;
        const std::string rest = entry.substr(prefix.size());
        names.insert(rest.substr(0, rest.find('/')));
    };
    for (const auto& [name, content] : files)
        take(name);
    for (const std::string& name : folders)
        take(name);
    return {names.begin(), names.end()};
}

bool FakeKernel::folderExists(const std::string& path) {
    return folders.contains(path) || !listFolder(path).empty();
}

bool FakeKernel::folderIsWritable(const std::string& path) {
    return folderExists(path) && !readOnly.contains(path);
}

os::Descriptor FakeKernel::openNetlink() {
    failIfTold("openNetlink");
    int ends[2] = {-1, -1};
    if (::socketpair(AF_UNIX, SOCK_SEQPACKET | SOCK_CLOEXEC, 0, ends) != 0)
        throw std::system_error(errno, std::generic_category(), "socketpair");
    const std::lock_guard lock(m_mutex);
    m_sockets.erase(ends[0]);
    m_sockets.emplace(ends[0], Socket{os::Descriptor(ends[1])});
    return os::Descriptor(ends[0]);
}

void FakeKernel::joinGroup(const os::Descriptor& socket, std::uint32_t group) {
    failIfTold("joinGroup");
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
    return ma::devlink::LinuxMachine().receive(socket, buffer, patience);
}

void FakeKernel::send(const os::Descriptor& socket, std::span<const std::uint8_t> message) {
    failIfTold("send");
    const Request request(message);
    if (request.family == GENL_ID_CTRL)
        resolveFamily(socket.number(), request);
    else
        handle(socket.number(), request);
}

void FakeKernel::acknowledge(int socket, const Request& request, int error, const std::string& text,
                             std::uint16_t attribute, std::uint32_t value) {
    Writer content;
    content.number(-error);
    content.number(std::uint32_t{20}).number(request.family).number(std::uint16_t{5});
    content.number(request.sequence).number(std::uint32_t{0});
    if (!text.empty()) content.text(NLMSGERR_ATTR_MSG, text);
    if (attribute != 0) content.value(attribute, value);
    constexpr std::uint16_t kFlags = NLM_F_CAPPED | NLM_F_ACK_TLVS;
    answer(socket, message(NLMSG_ERROR, kFlags, request.sequence, content.take()));
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
    answer(socket, familyMessage(GENL_ID_CTRL, CTRL_CMD_NEWFAMILY, request.sequence, content));
    acknowledge(socket, request, 0);
}

std::recursive_mutex& FakeKernel::lockOf(const std::string& address) {
    const std::lock_guard lock(m_mutex);
    ++requests;
    return m_deviceLocks[address];
}

void FakeKernel::handle(int socket, const Request& request) {
    const std::lock_guard lock(lockOf(request.texts.at(DEVLINK_ATTR_DEV_NAME)));
    const bool isFlash = request.command == DEVLINK_CMD_FLASH_UPDATE;
    const bool isReset = request.command == DEVLINK_CMD_RELOAD;
    if ((isFlash || isReset) && !isPermitted) return acknowledge(socket, request, EPERM);
    const auto device = devices.find(request.texts.at(DEVLINK_ATTR_DEV_NAME));
    if (device == devices.end()) return acknowledge(socket, request, ENODEV);
    if (isFlash) return flash(socket, request, device->second);
    if (isReset) return reset(socket, request, device->second);
    if (request.command == DEVLINK_CMD_GET) return tellDevice(socket, request, device->second);
    tellInfo(socket, request, device->second);
}

void FakeKernel::tellInfo(int socket, const Request& request, const FakeDevice& device) {
    if (!device.hasInfo) return acknowledge(socket, request, EOPNOTSUPP);
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
    versions(DEVLINK_ATTR_INFO_VERSION_RUNNING, device.running);
    versions(DEVLINK_ATTR_INFO_VERSION_STORED, device.stored);
    answer(socket, familyMessage(kFamily, request.command, request.sequence, content));
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
    answer(socket, familyMessage(kFamily, DEVLINK_CMD_NEW, request.sequence, content));
    acknowledge(socket, request, 0);
}

void FakeKernel::reset(int socket, const Request& request, FakeDevice& device) {
    const std::string action(1, static_cast<char>(DEVLINK_RELOAD_ACTION_FW_ACTIVATE));
    if (!device.offersActivation || request.texts.at(DEVLINK_ATTR_RELOAD_ACTION) != action)
        return acknowledge(socket, request, EOPNOTSUPP,
                           "Requested reload action is not supported by the driver");
    if (device.duringReset) device.duringReset();
    if (device.activationError == 0) device.running = device.stored;
    acknowledge(socket, request, device.activationError);
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

void FakeKernel::makeFolder(const std::string& path) {
    failIfTold("makeFolder");
    const std::lock_guard lock(m_mutex);
    folders.insert(path);
}

os::Descriptor FakeKernel::createFile(const std::string& path) {
    failIfTold("createFile");
    os::Descriptor file(::open("/dev/null", O_WRONLY | O_CLOEXEC));
    const std::lock_guard lock(m_mutex);
    if (!files.emplace(path, "").second)
        throw std::system_error(EEXIST, std::generic_category(), "createFile " + path);
    m_openFiles[file.number()] = path;
    return file;
}

void FakeKernel::writeFile(const os::Descriptor& file, std::span<const std::uint8_t> bytes) {
    failIfTold("writeFile");
    const std::lock_guard lock(m_mutex);
    files.at(m_openFiles.at(file.number())).append(bytes.begin(), bytes.end());
}

void FakeKernel::syncFile(const os::Descriptor&) {
    failIfTold("syncFile");
}

void FakeKernel::syncFolder(const std::string&) {
    failIfTold("syncFolder");
}

void FakeKernel::removeFile(const std::string& path) {
    failIfTold("removeFile");
    const std::lock_guard lock(m_mutex);
    files.erase(path);
}

std::unique_ptr<os::FileLock> FakeKernel::lock(const std::string& path, std::chrono::milliseconds) {
    failIfTold("lock");
    return std::make_unique<os::FileLock>(lockPath(path));
}

}  // namespace test
