// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <gtest/gtest.h>

#include <optional>

#include "Support/TempFolder.h"
#include "Utils/Os/Linux/SMASHv2Config.h"

namespace test {

/// The environment of a test program, and so of each program that it starts. Neither the caller's variables
/// and file mode mask nor the configuration of the machine change what the tests see: there are no adapters,
/// the providers' settings are the defaults, and the home is a folder of the tests' own. Only the variables
/// that direct the instruments (sanitizers, coverage) and the place of temporary files are kept.
class ChosenEnvironment : public ::testing::Environment {
  public:
    void SetUp() override;
    void TearDown() override;

  private:
    std::optional<TempFolder> m_home;
    std::optional<utils::SMASHv2Config> m_configuration;
};

}  // namespace test
