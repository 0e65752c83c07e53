#include "Host/Operations/InteropNamespace.h"

#include <gtest/gtest.h>

#include "Host/Operations/ProviderNamespace.h"
#include "Providers/Schema/CIM_ElementConformsToProfile.h"
#include "Providers/Schema/CIM_RegisteredProfile.h"
#include "Support/TestModel.h"

namespace {

using core::CimPath;

/// A profile and an element that conforms to it, as a provider serves them.
class Profile : public CIM_RegisteredProfile {
  public:
    Profile() { InstanceID = std::string("Test:Profile"); }
    std::string getClassName() const override { return "CIM_RegisteredProfile"; }
};

class Conforms : public CIM_ElementConformsToProfile {
  public:
    std::string getClassName() const override { return "CIM_ElementConformsToProfile"; }
};

class ProfileAgent : public core::CimAgent {
  public:
    ProfileAgent() : CimAgent("Profiles") {
        core::GetCimBroker()->addAgent(this);
        auto* profiles = new test::ListedClass<Profile>;
        m_classes.add(profiles);
        auto* conforms = new test::ListedClass<Conforms>;
        m_classes.add(conforms);
        auto* profile = new Profile;
        profiles->instances.add(profile);
        auto* link = new Conforms;
        link->ConformantStandard = profile;
        link->ManagedElement.setPath(CimPath("Test_Gadget.ID=\"a\",Number=1"));
        conforms->instances.add(link);
    }
    ~ProfileAgent() override { leaveBroker(); }
};

class InteropNamespaceTest : public ::testing::Test {
  protected:
    InteropNamespaceTest() { m_gadgets.add("a", 1); }

    std::vector<std::string> classesOf(const std::string& className) const {
        std::vector<std::string> names;
        for (const CimPath& path : m_interop.enumerateInstanceNames(className)) {
            EXPECT_EQ(path.getNamespace(), "root/interop");
            names.push_back(path.getClassName());
        }
        return names;
    }

    test::GadgetAgent m_gadgets;
    ProfileAgent m_profiles;
    host::InteropNamespace m_interop{"root/interop", std::make_shared<host::ProviderNamespace>("root/cimv2"),
                                     std::make_shared<host::InteropModel>(
                                         std::vector<std::string>{"root/cimv2", "root/interop"}, "host1")};
};

TEST_F(InteropNamespaceTest, ShowsTheObjectManagerNamespacesAndProfiles) {
    using Names = std::vector<std::string>;
    EXPECT_EQ(classesOf("CIM_ObjectManager"), Names{"CIM_ObjectManager"});
    EXPECT_EQ(classesOf("cim_namespace"), (Names{"CIM_Namespace", "CIM_Namespace"}));
    EXPECT_EQ(classesOf("CIM_RegisteredProfile"), Names{"CIM_RegisteredProfile"});
    EXPECT_EQ(classesOf("CIM_RegisteredSpecification"), Names{"CIM_RegisteredProfile"});
    EXPECT_EQ(classesOf("CIM_ManagedElement").size(), 4U);
    EXPECT_TRUE(classesOf("Test_Gadget").empty());

    const auto manager = m_interop.enumerateInstances("CIM_Service", std::nullopt).at(0);
    EXPECT_EQ(std::get<std::string>(*manager.find("SystemName")->value.scalar()), "host1");
    const auto narrowed =
        m_interop.getInstance(manager.path, core::PropertyFilter(std::vector<std::string>{"elementname"}));
    EXPECT_EQ(narrowed.properties.size(), 1U);
    EXPECT_THROW(m_interop.getInstance(CimPath("Test_Gadget.ID=\"a\",Number=1"), {}), core::CimError);
    EXPECT_THROW(m_interop.deleteInstance(manager.path), core::CimError);
}

TEST_F(InteropNamespaceTest, LeadsFromAProfileToTheImplementation) {
    const CimPath profile = m_interop.enumerateInstanceNames("CIM_RegisteredProfile").at(0);
    const CimPath service = m_interop.associatorNames(profile, {}).at(0);
    EXPECT_EQ(service.toString(), "root/cimv2:Test_Gadget.ID=\"a\",Number=1");
    EXPECT_EQ(m_interop.associators(profile, {}, {}).at(0).path.getNamespace(), "root/cimv2");
    const auto links = m_interop.references(profile, {}, {});
    ASSERT_EQ(links.size(), 1U);
    EXPECT_EQ(std::get<CimPath>(*links[0].find("ConformantStandard")->value.scalar()).getNamespace(),
              "root/interop");
    EXPECT_EQ(std::get<CimPath>(*links[0].find("ManagedElement")->value.scalar()).getNamespace(),
              "root/cimv2");
    EXPECT_TRUE(m_interop.getInstance(m_interop.referenceNames(profile, {}).at(0), {}).path.isInstancePath());
}

TEST_F(InteropNamespaceTest, DeclaresWhatItShows) {
    EXPECT_EQ(m_interop.getClass("CIM_ObjectManager").size(), 7U);
    EXPECT_EQ(m_interop.getClass("CIM_RegisteredProfile").back()->name, "CIM_ManagedElement");
    EXPECT_TRUE(m_interop.findClass("Test_Gadget").empty());
    EXPECT_TRUE(m_interop.knowsClass("Test_Gadget"));
    std::vector<std::string> top;
    for (const core::ClassChain& chain : m_interop.classes("", false))
        top.push_back(chain.front()->name);
    EXPECT_EQ(top, (std::vector<std::string>{"CIM_ManagedElement", "CIM_ElementConformsToProfile"}));
    EXPECT_EQ(m_interop.classes("CIM_EnabledLogicalElement", true).size(), 3U);
}

}  // namespace
