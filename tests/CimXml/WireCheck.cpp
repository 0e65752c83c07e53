// SPDX-License-Identifier: Apache-2.0
#include "CimXml/WireCheck.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <filesystem>
#include <string_view>

#include "Support/TempFolder.h"

namespace test {

namespace {

namespace fs = std::filesystem;

const fs::path kFolder = QUENX_CIM_XML_TEST_DIR;

/// One word of a shell command.
std::string quoted(std::string word) {
    for (std::size_t at = word.find('\''); at != word.npos; at = word.find('\'', at + 4))
        word.replace(at, 1, "'\\''");
    return "'" + word + "'";
}

/// The output of `xmllint --dtdvalid`; empty when the message is valid.
std::string validate(const std::string& message) {
    const TempFolder folder;
    // xmllint takes the document type as a URI, which a plain name is wherever its folder may be.
    const std::string command = "cd " + quoted(kFolder) + " && xmllint --noout --dtdvalid cimxml.dtd " +
                                quoted(folder.write("message", message)) + " 2>&1; echo $?";
    FILE* pipe = ::popen(command.c_str(), "r");
    if (pipe == nullptr) return "no xmllint";
    std::string output;
    for (int byte = std::fgetc(pipe); byte != EOF; byte = std::fgetc(pipe))
        output += static_cast<char>(byte);
    ::pclose(pipe);
    return output == "0\n" ? "" : output;
}

/// Elements that close themselves, where a common client fails on it.
std::string selfClosed(std::string_view message) {
    constexpr std::array<std::string_view, 4> kAllowed{"NAMESPACE", "CLASSNAME", "ERROR", "SCOPE"};
    for (std::size_t end = message.find("/>"); end != message.npos; end = message.find("/>", end + 1)) {
        const std::size_t start = message.rfind('<', end) + 1;
        const std::string_view name = message.substr(start, message.find_first_of(" /", start) - start);
        if (std::find(kAllowed.begin(), kAllowed.end(), name) == kAllowed.end()) return std::string(name);
    }
    return "";
}

}  // namespace

std::string readSample(const std::string& name) {
    const auto bytes = readTestFile(kFolder / "samples" / name);
    return {bytes.begin(), bytes.end()};
}

std::vector<std::string> sampleNames() {
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(kFolder / "samples"))
        names.push_back(entry.path().filename());
    std::sort(names.begin(), names.end());
    return names;
}

std::string faultsOf(const std::string& message) {
    if (!message.starts_with("<?xml version=\"1.0\" encoding=\"utf-8\"?>")) return "no XML declaration";
    for (const char* refused : {"<!", "&#"}) {
        if (message.find(refused) != std::string::npos) return std::string(refused) + " in the message";
    }
    const std::string element = selfClosed(message);
    return element.empty() ? validate(message) : element + " closes itself";
}

}  // namespace test
