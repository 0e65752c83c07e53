// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <dlfcn.h>

#include <string>

namespace os {

/// A library of the system that is loaded where it is first needed, since it is not on every machine, or
/// takes longer to load than most programs to run. Stays loaded. Used from one thread.
class LoadedLibrary {
  public:
    /// @param file  with the number of the binary interface that this is compiled with, such as libm.so.6
    explicit LoadedLibrary(const char* file) : m_library(::dlopen(file, RTLD_NOW | RTLD_LOCAL)) {
        if (m_library == nullptr) noteProblem(file);
    }

    /// Sets the pointer to the function of that name; leaves it alone where there is none.
    template <class Function>
    void find(const char* name, Function& function) {
        if (m_library == nullptr) return;
        void* const found = ::dlsym(m_library, name);
        if (found == nullptr) return noteProblem(name);
        function = reinterpret_cast<Function>(found);
    }

    /// What could not be loaded or found first, in the loader's words; empty where everything could.
    const std::string& problem() const { return m_problem; }

  private:
    void noteProblem(const char* what) {
        const char* const why = ::dlerror();
        if (m_problem.empty()) m_problem = why == nullptr ? what : why;
    }

    void* const m_library;
    std::string m_problem;
};

}  // namespace os
