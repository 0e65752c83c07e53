// SPDX-License-Identifier: Apache-2.0
#include "CimXml/WireCheck.h"

#include <filesystem>
#include <regex>
#include <set>
#include <string_view>

#include "Support/Program.h"
#include "Support/TempFolder.h"

namespace test {

namespace {

namespace fs = std::filesystem;

const fs::path kFolder = QUENX_CIM_XML_TEST_DIR;

/// Elements that close themselves, where a common client fails on it.
std::string selfClosed(std::string_view message) {
    const std::set<std::string_view> allowed{"NAMESPACE", "CLASSNAME", "ERROR", "SCOPE"};
    for (std::size_t end = message.find("/>"); end != message.npos; end = message.find("/>", end + 1)) {
        const std::size_t start = message.rfind('<', end) + 1;
        const std::string_view name = message.substr(start, message.find_first_of(" /", start) - start);
        if (!allowed.contains(name)) return std::string(name);
    }
    return "";
}

}  // namespace

std::string readSample(const std::string& name) {
    const auto bytes = readTestFile(kFolder / "samples" / name);
    return {bytes.begin(), bytes.end()};
}

std::set<std::string> sampleNames(const std::string& folder) {
    std::set<std::string> names;
    for (const auto& entry : fs::directory_iterator(kFolder / "samples" / folder))
        if (entry.is_regular_file()) names.insert(folder + entry.path().filename().string());
    return names;
}

std::string linesOf(const std::string& message) {
    return std::regex_replace(message, std::regex("><"), ">\n<");
}

std::string faultsOf(const std::string& message) {
    if (!message.starts_with("<?xml version=\"1.0\" encoding=\"utf-8\"?>")) return "no XML declaration";
    for (const char* refused : {"<!", "&#"}) {
        if (message.find(refused) != std::string::npos) return std::string(refused) + " in the message";
    }
    const std::string element = selfClosed(message);
    if (!element.empty()) return element + " closes itself";
    const TempFolder folder;
    // xmllint takes the document type as a URI, which a plain name is wherever its folder may be.
    const std::string script = "cd \"$0\" && xmllint --noout --dtdvalid cimxml.dtd \"$1\"";
    const ProgramResult result =
        run({"/bin/sh", "-c", script, kFolder.string(), folder.write("message", message)});
    return result.status == 0 ? "" : "xmllint says: " + result.out + result.error;
}

}  // namespace test
