// SPDX-License-Identifier: Apache-2.0
#include "Support/ProviderLibrary.h"

#include <dlfcn.h>
#include <gtest/gtest.h>

namespace test {

ProviderLibrary::ProviderLibrary(const std::string& path)
    : m_handle(dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL | (isUnloadable() ? 0 : RTLD_NODELETE))) {
    EXPECT_NE(m_handle, nullptr) << dlerror();
}

ProviderLibrary::~ProviderLibrary() {
    if (m_handle == nullptr) return;
    EXPECT_EQ(dlclose(m_handle), 0);
}

bool ProviderLibrary::isUnloadable() {
#ifdef QUENX_SANITIZED
    return false;
#else
    return true;
#endif
}

bool ProviderLibrary::isMapped(const std::string& path) {
    void* const handle = dlopen(path.c_str(), RTLD_NOW | RTLD_NOLOAD);
    if (handle != nullptr) dlclose(handle);
    return handle != nullptr;
}

}  // namespace test
