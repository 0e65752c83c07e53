// SPDX-License-Identifier: Apache-2.0
#include "Quenx_OperatingSystem.h"

#include <sys/sysinfo.h>
#include <sys/utsname.h>

#include <algorithm>
#include <filesystem>
#include <fstream>

namespace {

using core::CimDirection;
using core::CimType;

constexpr core::CimParameterInfo kCountProcesses[] = {
    {"Program", CimType::String, false, CimDirection::In, false, nullptr},
    {"Count", CimType::Uint32, false, CimDirection::Out, true, nullptr},
};
constexpr core::CimMethodInfo kMethods[] = {{"CountProcesses", CimType::Uint32, kCountProcesses}};
constexpr core::CimElementText kTexts[] = {
    {"CountProcesses", "Says how many processes of a program run.", "0=Completed;5=Invalid Parameter"},
    {"CountProcesses.Program", "The program's name, at most 15 characters of it."},
    {"CountProcesses.Count", "How many there are."},
};
constexpr unsigned int kCompleted = 0;
constexpr unsigned int kInvalidParameter = 5;

constexpr std::uint16_t kLinux = 36;
constexpr std::uint16_t kEnabled = 2;
constexpr std::uint16_t kOk = 2;
constexpr std::uint16_t kHealthOk = 5;

utsname systemNames() {
    utsname names{};
    uname(&names);
    return names;
}

std::string hostName() {
    return systemNames().nodename;
}

/// When the kernel was started, in seconds since 1970. It says so itself: computed from the time since then,
/// it would not be the same at each look.
std::uint64_t startTime() {
    std::ifstream file("/proc/stat");
    std::uint64_t time = 0;
    for (std::string word; file >> word;)
        if (word == "btime") file >> time;
    return time;
}

/// Calls the function with the name of each process's program, as the kernel keeps it.
template <class Function>
void forEachProcess(Function&& function) {
    std::error_code error;
    for (const auto& entry : std::filesystem::directory_iterator("/proc", error)) {
        const std::string id = entry.path().filename();
        if (!std::ranges::all_of(id, [](char digit) { return digit >= '0' && digit <= '9'; })) continue;
        std::string program;
        // One that has ended meanwhile has no name any more.
        if (std::getline(std::ifstream(entry.path() / "comm"), program)) function(program);
    }
}

}  // namespace

constinit const core::CimClassInfo Quenx_OperatingSystem::classInfo{
    "Quenx_OperatingSystem", &CIM_OperatingSystem::classInfo, false, kMethods, nullptr, kTexts};

Quenx_OperatingSystem::Quenx_OperatingSystem(const std::string& host) {
    // Keys never change, so the constructor sets them.
    CSCreationClassName = "CIM_ComputerSystem";
    CSName = host;
    CreationClassName = classInfo.name;
    Name = host;
    OSType = kLinux;
    addMethod("CountProcesses", &Quenx_OperatingSystem::countProcesses);
}

void Quenx_OperatingSystem::refresh() {
    // All questions come before the lock: readers of this instance are not to wait for the answers.
    const utsname names = systemNames();
    struct sysinfo system {};
    sysinfo(&system);
    const std::uint64_t started = startTime();
    std::uint32_t processes = 0;
    forEachProcess([&](const std::string&) { ++processes; });

    const core::RecursiveLocker lock(getMutex());
    ElementName = std::string(names.nodename);
    Version = std::string(names.release);
    NumberOfProcesses = processes;
    TotalVisibleMemorySize = std::uint64_t{system.totalram} * system.mem_unit / 1024;
    FreePhysicalMemory = std::uint64_t{system.freeram} * system.mem_unit / 1024;
    LastBootUpTime = utils::Time::fromEpoch(started * 1'000'000);
    EnabledState = kEnabled;
    HealthState = kHealthOk;
    OperationalStatus = {kOk};
}

unsigned int Quenx_OperatingSystem::countProcesses(core::CimPropertyList& in, core::CimPropertyList& out,
                                                   core::CimInstance*&) {
    // Names and types are checked before a method is called; whether a value makes sense, only it knows.
    const core::CimValue program = in.getPropertyByName("Program")->getValue();
    const auto* name = program.get<std::string>();
    if (name == nullptr || name->empty()) return kInvalidParameter;
    std::uint64_t count = 0;
    forEachProcess([&](const std::string& each) {
        if (each == *name) ++count;
    });
    out.getPropertyByName("Count")->setValue(core::CimValue::of(core::CimType::Uint32, count));
    return kCompleted;
}

core::InstanceList::Iterator Quenx_OperatingSystemClass::getInstances() {
    return serve({hostName()});
}

core::CimInstance* Quenx_OperatingSystemClass::findInstance(const core::CimPath& path) {
    return find({hostName()}, path);
}
