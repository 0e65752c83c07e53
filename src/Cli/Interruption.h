// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <csignal>

namespace cli {

/// While one exists, Ctrl-C, SIGTERM and a closed terminal do not end the program but are noted, and writing
/// into a closed pipe is an error and no signal: a program that ends takes the running update with it. One at
/// a time.
class Interruption {
  public:
    Interruption();
    ~Interruption();
    Interruption(const Interruption&) = delete;
    Interruption& operator=(const Interruption&) = delete;

    /// True once for every time (at least) that the user asked to stop.
    bool take();

  private:
    struct sigaction saved_[4] = {};
};

}  // namespace cli
