// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <dlfcn.h>
#include <gtest/gtest.h>

#include <string>

namespace test {

/// A provider library, loaded as a host does it and unloaded at the end of the scope. Sanitizer builds keep
/// it mapped, with its agent alive, so that a leak report has a file and a line.
class ProviderLibrary {
  public:
    explicit ProviderLibrary(const std::string& path)
        : m_handle(dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL | (isUnloadable() ? 0 : RTLD_NODELETE))) {
        EXPECT_NE(m_handle, nullptr) << dlerror();
    }
    ProviderLibrary(const ProviderLibrary&) = delete;
    ProviderLibrary& operator=(const ProviderLibrary&) = delete;
    ~ProviderLibrary() { EXPECT_TRUE(m_handle == nullptr || dlclose(m_handle) == 0); }

    /// Whether unloading really takes a library out of this process.
    static bool isUnloadable() {
#ifdef QUENX_SANITIZED
        return false;
#else
        return true;
#endif
    }

  private:
    void* m_handle;
};

}  // namespace test
