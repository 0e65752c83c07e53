// SPDX-License-Identifier: Apache-2.0
#include "Utils/Uri.h"

#include <algorithm>
#include <array>
#include <string_view>

#include "Utils/Exception.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/PatientReading.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

namespace utils {

namespace {

constexpr std::array<std::string_view, 9> uriSchemaName = {"",     "",      "data", "file", "ftp",
                                                           "http", "https", "nfs",  "tftp"};

Uri::SupportedURISchemes findScheme(const std::string& word, const std::string& rest) {
    if (word.empty() || rest.compare(0, 2, "//") != 0) return Uri::SupportedURISchemes::Unknown;
    for (std::size_t i = 0; i < uriSchemaName.size(); ++i) {
        if (equalsIgnoringCase(word, uriSchemaName[i])) return static_cast<Uri::SupportedURISchemes>(i);
    }
    return Uri::SupportedURISchemes::Unknown;
}

bool hasSize(const std::string& path, const os::FileLook& look) {
    try {
        os::getFileSize(path, look);
        return true;
    } catch (...) {
        return false;
    }
}

}  // namespace

Uri::Uri(std::string text) : m_supportedUri{SupportedURISchemes::File} {
    QUENX_ASSERT_TEXT(!m_supportedUri.empty(), __FILE__, __LINE__, "(int)m_supportedUri.size() != 0");
    if (!text.empty()) parseUri(std::move(text));
}

Uri::~Uri() = default;

void Uri::parseUri(std::string text) {
    m_scheme = SupportedURISchemes::Unknown;
    // Split at every colon, not at the first: whether there is one at all decides about the log line.
    const StringArray pieces = split(text, ':');
    if (pieces.size() < 2) {
        QUENX_DEBUG("Incorrect URI format of '%s'", text.c_str());
        return;
    }
    m_scheme = findScheme(pieces[0], pieces[1]);
    if (m_scheme == SupportedURISchemes::Unknown) {
        QUENX_DEBUG("Uknown URI format of '%s'", text.c_str());
        return;
    }
    // What follows "scheme://", colons included.
    m_sourcePath = text.substr(pieces[0].size() + 3);
}

bool Uri::IsUriSupported() const {
    return std::find(m_supportedUri.begin(), m_supportedUri.end(), m_scheme) != m_supportedUri.end();
}

bool Uri::IsUriAccesible() const {
    if (!isLocalFile()) return false;
    // Opened, not only looked at: a file that the service may not read is not accessible.
    try {
        os::Patience patience;
        return hasSize(m_sourcePath, os::lookAtFile(m_sourcePath, -1, patience).value_or(os::FileLook()));
    } catch (...) {
        return false;
    }
}

bool Uri::IsUriAccesible(const os::FileLook& look) const {
    return isLocalFile() && hasSize(m_sourcePath, look);
}

bool Uri::isLocalFile() const {
    return IsUriSupported() && m_scheme == SupportedURISchemes::File;
}

}  // namespace utils
