#include "System/Quenxctl.h"

#include <filesystem>
#include <nlohmann/json.hpp>

namespace test {

namespace {

std::string adapter(const std::string& name, const std::string& pci, const std::string& id,
                    const std::string& components, const std::string& more) {
    return "[[adapter]]\nname = \"" + name + "\"\npci_address = \"" + pci + "\"\npci_id = \"" + id +
           "\"\nmac = \"52:54:00:00:00:1" + name.back() + "\"\ncomponents = [" + components + "]\n" + more +
           "\n";
}

}  // namespace

void Quenxctl::describeAdapters(const std::string& more) {
    const std::string both = R"({ type = "IMG_PXE", revision = 0 }, { type = "IMG_UEFI", revision = 0 })";
    const std::string flash = "flash_file = \"" + image_ + "\"\n";
    folder_.write(
        "adapters.toml",
        adapter("eth0", "0000:03:00.0", "1af4:1041", both, flash + more) +
            adapter("eth1", "0000:03:00.1", "1af4:1041", both, flash) +
            adapter("eth3", "0000:05:00.0", "1af4:1041", both, "updatable = false") +
            adapter("eth4", "0000:06:00.0", "1af4:1041", R"({ type = "IMG_iSCSI", revision = 1 })", ""));
}

std::vector<std::string> Quenxctl::command(const std::vector<std::string>& arguments) const {
    std::vector<std::string> all = {QUENXCTL, "--adapters", folder_ / "adapters.toml"};
    all.insert(all.end(), arguments.begin(), arguments.end());
    return all;
}

ProgramResult Quenxctl::quenxctl(const std::vector<std::string>& arguments,
                                 const std::vector<std::string>& environment) const {
    return run(command(arguments), environment);
}

void Quenxctl::expectError(const std::vector<std::string>& arguments, int status,
                           const std::string& part) const {
    const ProgramResult result = quenxctl(arguments);
    EXPECT_EQ(result.status, status) << part << "\n" << result.out << result.error;
    EXPECT_TRUE(contains(result.error, part)) << result.error << "\nwanted: " << part;
}

std::string Quenxctl::offerFirmware() {
    std::filesystem::create_directory(folder_ / "firmware");
    return folder_.write("provider.conf", "FWFilePath=" + (folder_ / "firmware") + "\n");
}

std::string Quenxctl::firmwareOf(const std::string& adapter) const {
    const ProgramResult result = quenxctl({"adapters", "--json"});
    const auto document = nlohmann::json::parse(result.out, nullptr, false);
    if (document.is_discarded()) return "no document: " + result.out + result.error;
    for (const auto& one : document["adapters"]) {
        if (one["name"] != adapter) continue;
        std::string text;
        for (const auto& component : one["components"]) {
            text += (text.empty() ? "" : ", ") + component["type"].get<std::string>() + " " +
                    std::to_string(component["version"].get<int>());
        }
        return text;
    }
    return "no such adapter";
}

}  // namespace test
