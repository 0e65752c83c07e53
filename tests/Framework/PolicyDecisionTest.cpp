// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/PolicyDecision.h"

#include <gtest/gtest.h>

#include <memory>

#include "Framework/Model/CimError.h"
#include "Framework/Requests/Caller.h"
#include "Framework/Requests/NotedCall.h"
#include "Support/TempFolder.h"
#include "Utils/Os/Linux/PolicyFile.h"

namespace {

using core::PolicyDecision;
using Aim = core::PolicyDecision::Aim;

class PolicyDecisionTest : public ::testing::Test {
  protected:
    void write(const std::string& text) { m_folder.write("policy.toml", text); }
    /// What a caller is told who asks for a change; empty where he may.
    std::string saidTo(const std::string& principal, bool isFront = false, Aim aim = Aim::Change) const {
        core::Caller caller;
        caller.principal = principal;
        caller.isFront = isFront;
        const core::CallerScope scope(caller);
        const core::NotedCall noted;
        try {
            const PolicyDecision decision(aim);
            return "";
        } catch (const core::CimError& error) {
            EXPECT_EQ(error.status(), core::CimStatus::AccessDenied);
            return std::string(core::reasonCode(noted.notes().reason)) + " " + error.what();
        }
    }

    const test::TempFolder m_folder;
    const std::string m_path = m_folder / "policy.toml";
};

TEST_F(PolicyDecisionTest, LetsAdministratorsChange) {
    write("\nadministrators = ['alice']\n");
    const utils::PolicyFile file(m_path);
    EXPECT_EQ(saidTo("alice") + saidTo("bob", true) + saidTo("bob", false, Aim::Look), "");
    EXPECT_EQ(saidTo("bob"), "QX-0502 user \"bob\" may only read: \"administrators\" in " + m_path +
                                 ", line 2, has no such name");
    EXPECT_EQ(saidTo(""), "QX-0502 a caller without a name may only read: \"administrators\" in " + m_path +
                              ", line 2, is set");
    // Inside a look nothing was asked of who it is; inside a change it was.
    const core::CallerScope scope(core::Caller{});
    const PolicyDecision look(Aim::Look);
    EXPECT_NE(saidTo("bob"), "");
    write("");
    EXPECT_NE(saidTo("bob"), "") << "one decision keeps the policy that it began with";
    EXPECT_TRUE(PolicyDecision::policy().administrators);
}

TEST_F(PolicyDecisionTest, RefusesAllWhereThePolicyCannotBeObeyed) {
    EXPECT_EQ(saidTo("alice"), "") << "there is none";
    EXPECT_FALSE(PolicyDecision::policy().administrators);
    write("wrong = 1");
    {
        const utils::PolicyFile file(m_path);
        EXPECT_EQ(saidTo("alice"),
                  "QX-0501 nothing can be installed or deleted until the policy is mended: " + m_path +
                      ", line 1: the policy: unknown key \"wrong\"; the keys are administrators, history, "
                      "history_records, history_served, release_claim_after_check, keep_images, "
                      "image_directories, largest_image, trust or trust_keys");
    }
    const char* const usual = utils::systemPolicyFile.exchange(m_path.c_str());
    EXPECT_EQ(saidTo("alice", false, Aim::Look),
              "QX-0501 nothing can be installed or deleted here: there is a policy, " + m_path +
                  ", and the program that loaded this provider cannot obey it; use quenxctl, quenx-cimd or "
                  "libQuenx_Cmpi.so");
    utils::systemPolicyFile = usual;
}

}  // namespace
