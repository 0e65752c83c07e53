// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <set>
#include <string>
#include <vector>

#include "MidAPI/Devlink/Machine.h"
#include "Support/TempFolder.h"
#include "Utils/Os/Linux/OwnFiles.h"

namespace test {

using Datagram = std::vector<std::uint8_t>;

/// A device that the fake kernel drives, and how it behaves.
struct FakeDevice {
    std::string driver = "fake";
    bool hasFlash = true;
    bool hasInfo = true;
    int infoError = 0;  ///< how the driver ends a question for it, errno value
    std::string serial;
    std::string boardSerial;
    std::map<std::string, std::string> fixed{};
    std::map<std::string, std::string> running{{"fw", "1.2.3"}};
    std::map<std::string, std::string> stored{{"fw", "1.2.3"}};
    std::set<std::string> components;  ///< that can be flashed by themselves

    /// What the driver tells during a flash: text, done, total.
    struct Status {
        std::string text;
        std::uint64_t done = 0;
        std::uint64_t total = 0;
    };
    std::vector<Status> statuses{{"Preparing to flash"}, {"Flashing", 1, 2}, {"Flashing done"}};
    std::string storedAfterwards = "1.3.0";  ///< the version "fw" of the image
    int error = 0;                           ///< how the driver ends a flash, errno value
    std::string errorText;
    bool tellsEnd = true;
    bool isAcknowledged = true;
    std::function<void()> duringFlash;  ///< called with the device's lock held, after the statuses

    bool offersActivation = false;
    int activationError = 0;  ///< how the driver ends a reset, errno value
    bool activates = true;    ///< a reset that does not end so brings the new firmware to run
    std::function<void()> duringReset;
};

/// A machine of a test's own: files below a folder of its own, and a kernel that answers devlink on the other
/// end of each socket. It does what it is asked for within the sending, as the real one does. Thread-safe but
/// for what a test changes itself.
class FakeKernel : public ma::devlink::LinuxMachine {
  public:
    /// Has the folders /lib/firmware and /var/lib.
    FakeKernel();

    /// A function of class 0x0200 with a driver and a device.
    FakeDevice& add(const std::string& address, const std::string& interface = "");
    /// Makes a file, and the folders on the way.
    void put(const std::string& path, const std::string& content) const;
    void putFolder(const std::string& path) const;
    /// Removes a file, or a folder with all that is in it.
    void drop(const std::string& path) const;
    std::string in(const std::string& path) const { return m_root.path() + path; }

    std::set<std::string> readOnly;             ///< folders
    std::string unreadable;                     ///< a folder that is there
    std::map<std::string, int> failures;        ///< operation and the errno value that it fails with
    std::map<std::string, FakeDevice> devices;  ///< by address
    bool foreignLock = false;                   ///< the locks are another user's
    bool hasDevlink = true;
    bool isPermitted = true;
    std::function<void(const std::string&)> reading;  ///< called before a file is read
    std::function<void(Datagram&)> mangle;            ///< changes what the kernel answers

    int requests = 0;                       ///< that were about a device
    std::vector<std::string> flashed;       ///< "COMPONENT:CONTENT" of each flash, in order
    std::vector<std::string> flashedFiles;  ///< the paths that they had
    /// Tells all who listen.
    void notify(std::uint8_t command, const std::string& address, const FakeDevice::Status* status = nullptr);

    std::optional<std::string> readFile(const std::string& path) override {
        if (reading) reading(path);
        return LinuxMachine::readFile(in(path));
    }
    std::optional<std::string> readLink(const std::string& path) override {
        return LinuxMachine::readLink(in(path));
    }
    std::optional<utils::StringArray> listFolder(const std::string& path) override {
        return path == unreadable ? std::nullopt : LinuxMachine::listFolder(in(path));
    }
    std::string kernelRelease() override { return "6.1.0"; }
    bool folderExists(const std::string& path) override { return LinuxMachine::folderExists(in(path)); }
    bool folderIsWritable(const std::string& path) override {
        return folderExists(path) && !readOnly.contains(path);
    }
    void makeFolder(const std::string& path) override { LinuxMachine::makeFolder(may("makeFolder", path)); }
    os::Descriptor createFile(const std::string& path) override {
        return LinuxMachine::createFile(may("createFile", path));
    }
    void writeFile(const os::Descriptor& file, std::span<const std::uint8_t> bytes) override {
        may("writeFile");
        LinuxMachine::writeFile(file, bytes);
    }
    // What is on the medium nobody looks at here, and it takes its time.
    void syncFile(const os::Descriptor&) override { may("syncFile"); }
    void syncFolder(const std::string&) override { may("syncFolder"); }
    void removeFile(const std::string& path) override { LinuxMachine::removeFile(may("removeFile", path)); }
    std::unique_ptr<os::FileLock> lock(const std::string& path, std::chrono::milliseconds) override {
        if (foreignLock) throw os::ForeignFile(path, 12, "cannot lock");
        return LinuxMachine::lock(may("lock", path), std::chrono::milliseconds(0));
    }

    os::Descriptor openNetlink() override;
    void joinGroup(const os::Descriptor& socket, std::uint32_t group) override;
    void send(const os::Descriptor& socket, std::span<const std::uint8_t> message) override;
    std::optional<std::size_t> receive(const os::Descriptor& socket, std::span<std::uint8_t> buffer,
                                       std::chrono::milliseconds patience) override;
    /// What it answers is there when the sending is over.
    std::chrono::milliseconds patience() const override { return std::chrono::milliseconds(1); }

  private:
    struct Socket {
        os::Descriptor far;  ///< the kernel's end
        bool isListening = false;
        bool hasOverrun = false;
    };
    struct Request;

    /// Fails where the test says so. Returns where the path really is.
    std::string may(const std::string& operation, const std::string& path = "") const;
    void deliver(Socket& socket, const Datagram& datagram) const;
    void answer(int socket, const Datagram& datagram);
    std::recursive_mutex& lockOf(const std::string& address);
    void handle(int socket, const Request& request);
    void resolveFamily(int socket, const Request& request);
    void tellInfo(int socket, const Request& request, const FakeDevice& device);
    void tellDevice(int socket, const Request& request, const FakeDevice& device);
    void reset(int socket, const Request& request, FakeDevice& device);
    void flash(int socket, const Request& request, FakeDevice& device);
    void acknowledge(int socket, const Request& request, int error, const std::string& text = "",
                     std::uint16_t attribute = 0, std::uint32_t value = 0);

    const TempFolder m_root;
    std::mutex m_mutex;
    // The kernel's own: whoever asks about a device waits for its flash. A test may ask within one.
    std::map<std::string, std::recursive_mutex> m_deviceLocks;
    std::map<int, Socket> m_sockets;
};

}  // namespace test
