// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "Utils/Export.h"

namespace os {
struct FileLook;
}

namespace utils {

/// The location of an image: a scheme and a source path. Nothing is percent-decoded.
class QUENX_EXPORT Uri {
  public:
    /// The indexes of the scheme words. Number 1 has none and never matches.
    enum class SupportedURISchemes { Unknown = 0, Reserved = 1, Data, File, Ftp, Http, Https, Nfs, Tftp };

    /// Parses the text; a malformed one leaves the scheme unknown. An empty one is not parsed at all.
    explicit Uri(std::string text);
    virtual ~Uri();

    Uri(const Uri&) = default;
    Uri& operator=(const Uri&) = default;

    /// Sets scheme and path. "file:///opt/fw/a.rom" gives /opt/fw/a.rom; a host name is only the head
    /// of the path. A malformed text leaves the path as it was.
    void parseUri(std::string text);

    /// True if this build can read such locations.
    bool IsUriSupported() const;

    /// True if it is a local file whose size can be had.
    bool IsUriAccesible() const;
    /// The same for a path that has been looked at.
    bool IsUriAccesible(const os::FileLook& look) const;

    std::string getSourcePath() const { return m_sourcePath; }
    SupportedURISchemes getScheme() const { return m_scheme; }

  private:
    bool isLocalFile() const;

    std::vector<SupportedURISchemes> m_supportedUri;
    SupportedURISchemes m_scheme = SupportedURISchemes::Unknown;
    std::string m_sourcePath;
};

}  // namespace utils
