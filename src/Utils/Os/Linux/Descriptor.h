// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <unistd.h>

namespace os {

/// Owns a file descriptor; a negative number is none. Not for use by two threads at once.
class Descriptor {
  public:
    explicit Descriptor(int number) noexcept : m_number(number) {}
    ~Descriptor() {
        if (m_number >= 0) ::close(m_number);
    }
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;
    int number() const noexcept { return m_number; }

  private:
    const int m_number;
};

}  // namespace os
