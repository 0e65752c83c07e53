// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Backends.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <map>

#include "MidAPI/ma.h"
#include "Support/SimulatedAdapters.h"
#include "Support/TestRoms.h"

namespace {

class BackendsTest : public testing::Test {
  protected:
    using Values = std::map<std::string, std::string>;

    BackendsTest() {
        for (const char* name : kVariables)
            if (const char* value = std::getenv(name)) m_before.emplace(name, value);
    }
    ~BackendsTest() override {
        choose(m_before);
        ma::setBackend(m_backend);
    }
    /// These variables, and no others of those that choose adapters. No backend is chosen then.
    static void choose(const Values& values) {
        for (const char* name : kVariables) {
            const auto value = values.find(name);
            if (value == values.end())
                ::unsetenv(name);
            else
                ::setenv(name, value->second.c_str(), 1);
        }
        ma::setBackend(nullptr);
    }

  private:
    static constexpr const char* kVariables[] = {"QUENX_BACKEND", "QUENX_ADAPTERS", "QUENX_ADAPTER_STATE"};
    const std::shared_ptr<ma::Backend> m_backend = ma::setBackend(nullptr);
    Values m_before;
};

/// What is in use after the choice: what it says of its search, or the error.
std::string searchOf(const ma::BackendChoice& choice) try {
    ma::selectBackend(choice);
    return ma::describeSearch();
} catch (const ma::AdapterError& error) {
    return error.what();
}

TEST_F(BackendsTest, AreChosenByWhatIsSaidThenByTheEnvironment) {
    const test::TempFolder folder;
    const std::string five = folder.write("five.toml", test::kTestAdapters);
    const std::string none = folder.write("none.toml", "");
    const std::string missing = folder / "missing.toml";
    const std::string wrong = folder.write("wrong.toml", "adapter = 1");
    const std::string ofFive = "Simulated adapters were looked for in " + five + ", which describes 5.";
    const std::string kinds = "; it must be devlink, simulator or auto";
    const std::string isEmpty = ": it is empty; give it a value or unset it";
    const std::string isTwo = "simulated adapters are described in " + five +
                              ", but the backend is to be devlink; name only one of them";
    const std::string noFile = "there is no adapter description ";
    const std::string nameOne = "; name a readable file";
    const struct {
        Values variables;
        ma::BackendChoice choice;
        std::string expected;
    } table[] = {
        {{{"QUENX_ADAPTERS", five}}, {}, ofFive},
        {{{"QUENX_ADAPTERS", five}}, {.backend = "auto"}, ofFive},
        {{{"QUENX_ADAPTERS", five}},
         {.description = none},
         "Simulated adapters were looked for in " + none + ", which describes 0."},
        {{{"QUENX_BACKEND", "simulator"}, {"QUENX_ADAPTERS", five}}, {}, ofFive},
        {{{"QUENX_BACKEND", "simulation"}}, {}, "QUENX_BACKEND: there is no backend \"simulation\"" + kinds},
        {{}, {.backend = "simulation"}, "there is no backend \"simulation\"" + kinds},
        {{{"QUENX_BACKEND", "devlink"}}, {.description = five}, ofFive},
        // What was meant to name simulated adapters never leads to real ones.
        {{{"QUENX_ADAPTERS", ""}}, {}, "QUENX_ADAPTERS" + isEmpty},
        {{{"QUENX_ADAPTERS", missing}}, {}, "QUENX_ADAPTERS: " + noFile + missing + nameOne},
        {{{"QUENX_ADAPTERS", wrong}},
         {.backend = "auto"},
         "QUENX_ADAPTERS: " + wrong + ", line 1: adapter description: \"adapter\" must be a list of tables"},
        {{{"QUENX_BACKEND", ""}, {"QUENX_ADAPTERS", five}}, {}, "QUENX_BACKEND" + isEmpty},
        {{{"QUENX_ADAPTER_STATE", ""}}, {.description = five}, "QUENX_ADAPTER_STATE" + isEmpty},
        {{{"QUENX_ADAPTERS", five}}, {.description = missing}, noFile + missing + nameOne},
        {{}, {.description = ""}, noFile + nameOne},
        {{{"QUENX_BACKEND", "devlink"}, {"QUENX_ADAPTERS", five}}, {}, "QUENX_ADAPTERS: " + isTwo},
        {{}, {.backend = "devlink", .description = five}, isTwo},
    };
    for (const auto& [variables, choice, expected] : table) {
        choose(variables);
        EXPECT_EQ(expected, searchOf(choice));
    }
}

TEST_F(BackendsTest, StayUntilTheNextOneIsThere) {
    const test::SimulatedAdapters adapters;
    choose({{"QUENX_ADAPTERS", adapters.folder() / "late.toml"},
            {"QUENX_ADAPTER_STATE", adapters.stateDirectory()}});
    // A mistake is told at each call until it is mended.
    EXPECT_THROW(ma::enumerateAdapters(), ma::AdapterError);
    EXPECT_THROW(ma::enumerateAdapters(), ma::AdapterError);
    adapters.folder().write("late.toml", test::kTestAdapters);
    EXPECT_EQ(5U, ma::enumerateAdapters().size());
    EXPECT_THROW(ma::selectBackend({.description = adapters.folder() / "none.toml"}), ma::AdapterError);
    EXPECT_EQ(5U, ma::enumerateAdapters().size());
    EXPECT_EQ("simulator", ma::getAdapterInfo("eth0").backend);
    const auto prepared = test::prepareImage("eth0", test::madeRom({{utils::FirmwareType::PXE, 9}}));
    EXPECT_TRUE(test::writeImage("eth0", prepared.image).done);
    EXPECT_EQ("IMG_PXE 9, IMG_UEFI 0", test::describeRom(adapters->flashContent("eth0")))
        << "the state is that of the variable";
}

}  // namespace
