// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cerrno>
#include <map>
#include <set>
#include <string>
#include <system_error>
#include <vector>

#include "MidAPI/Devlink/Machine.h"

namespace test {

/// A machine of which a test says every file. It has no sockets and no locks.
class MachineInMemory : public ma::devlink::Machine {
  public:
    std::map<std::string, std::string> files;
    std::map<std::string, std::string> links;
    std::set<std::string> writableFolders;
    std::string fails;  ///< the operation, of those that change something, that fails with ENOSPC
    std::vector<std::string> calls;  ///< those operations, with what they were for

    std::optional<std::string> readFile(const std::string& path) override { return find(files, path); }
    std::optional<std::string> readLink(const std::string& path) override { return find(links, path); }
    utils::StringArray listFolder(const std::string& path) override {
        std::set<std::string> names;
        for (const auto* entries : {&files, &links}) {
            for (auto entry = entries->lower_bound(path + '/'); entry != entries->end(); ++entry) {
                if (!entry->first.starts_with(path + '/')) break;
                const std::string rest = entry->first.substr(path.size() + 1);
                names.insert(rest.substr(0, rest.find('/')));
            }
        }
        return {names.begin(), names.end()};
    }
    bool folderExists(const std::string& path) override { return !listFolder(path).empty(); }
    bool folderIsWritable(const std::string& path) override { return writableFolders.contains(path); }

    os::Descriptor openNetlink() override { throw noSuch(); }
    void joinGroup(const os::Descriptor&, std::uint32_t) override { throw noSuch(); }
    void send(const os::Descriptor&, std::span<const std::uint8_t>) override { throw noSuch(); }
    std::optional<std::size_t> receive(const os::Descriptor&, std::span<std::uint8_t>,
                                       std::chrono::milliseconds) override {
        throw noSuch();
    }
    std::unique_ptr<os::FileLock> lock(const std::string&, std::chrono::milliseconds) override {
        throw noSuch();
    }

    void makeFolder(const std::string& path) override { call("makeFolder", path); }
    os::Descriptor createFile(const std::string& path) override {
        call("createFile", path);
        m_open = path;
        files[path] = "";
        return os::Descriptor(-1);
    }
    void writeFile(const os::Descriptor&, std::span<const std::uint8_t> bytes) override {
        call("writeFile", m_open);
        files[m_open].append(bytes.begin(), bytes.end());
    }
    void syncFile(const os::Descriptor&) override { call("syncFile", m_open); }
    void syncFolder(const std::string& path) override { call("syncFolder", path); }
    void removeFile(const std::string& path) override {
        call("removeFile", path);
        files.erase(path);
    }

  private:
    static std::optional<std::string> find(const std::map<std::string, std::string>& entries,
                                           const std::string& path) {
        const auto found = entries.find(path);
        return found == entries.end() ? std::nullopt : std::optional(found->second);
    }
    static std::system_error noSuch() { return {ENOTSUP, std::generic_category(), "not in memory"}; }
    void call(const std::string& operation, const std::string& path) {
        calls.push_back(operation + ' ' + path);
        if (operation == fails) throw std::system_error(ENOSPC, std::generic_category(), operation);
    }

    std::string m_open;
};

}  // namespace test
