// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Support/TempFolder.h"
#include "Utils/Os/Linux/SMASHv2Config.h"

namespace test {

/// The environment of a test program, and so of each program that it starts. Neither the caller's variables
/// and file mode mask nor the configuration of the machine change what the tests see: there are no adapters,
/// the providers' settings are the defaults, and the home is a folder of the tests' own. Only the variables
/// that direct the instruments (sanitizers, coverage) and the place of temporary files are kept.
class ChosenEnvironment {
  public:
    ChosenEnvironment();

  private:
    TempFolder m_home;
    utils::SMASHv2Config m_configuration{m_home / "quenx-cimprovider.conf"};
};

}  // namespace test
