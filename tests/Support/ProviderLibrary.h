// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

namespace test {

/// A provider library, loaded as a host does it and unloaded at the end of the scope. Sanitizer builds keep
/// it mapped, with its agent alive, so that a leak report has a file and a line.
class ProviderLibrary {
  public:
    explicit ProviderLibrary(const std::string& path);
    ProviderLibrary(const ProviderLibrary&) = delete;
    ProviderLibrary& operator=(const ProviderLibrary&) = delete;
    ~ProviderLibrary();

    /// Whether unloading really takes a library out of this process.
    static bool isUnloadable();
    /// Whether a library of that path is mapped now.
    static bool isMapped(const std::string& path);

  private:
    void* m_handle;
};

}  // namespace test
