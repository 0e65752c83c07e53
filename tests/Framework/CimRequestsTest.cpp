#include "Framework/CimRequests.h"

#include <gtest/gtest.h>

#include "Framework/RequestScope.h"
#include "Support/TestModel.h"

namespace {

using core::Argument;
using core::CimError;
using core::CimPath;
using core::CimStatus;
using core::CimType;
using core::CimValue;

class CimRequestsTest : public ::testing::Test {
  protected:
    CimRequestsTest() {
        m_agent.links().instances.add(new test::Link(m_a, m_b));
        m_agent.links().instances.add(new test::Link(m_c, m_a));
        m_agent.links().instances.add(new test::Link(m_a, m_b));  // the same again
    }

    template <class Operation>
    CimStatus statusOf(Operation&& operation) {
        try {
            operation();
        } catch (const CimError& error) {
            m_error = error.what();
            return error.status();
        }
        return CimStatus{0};
    }

    static std::string join(const std::vector<CimPath>& paths) {
        std::string ids;
        for (const CimPath& path : paths) {
            EXPECT_EQ(path.getNamespace(), "root/test");
            ids += std::get<std::string>(path.getKeys().front().value);
        }
        return ids;
    }

    test::GadgetAgent m_agent;
    core::CimRequests m_requests{"root/test"};
    test::Gadget& m_a = *m_agent.add("a", 1);
    test::Gadget& m_b = *m_agent.add("b", 2);
    test::Gadget& m_c = *m_agent.add("c", 3);
    std::string m_error;
};

TEST_F(CimRequestsTest, ReadsInstances) {
    EXPECT_EQ(join(m_requests.enumerateInstanceNames("TEST_THING")), "abc");
    EXPECT_EQ(m_requests.enumerateInstances("Test_Gadget").size(), 3U);
    EXPECT_EQ(statusOf([&] { m_requests.enumerateInstances("Unknown"); }), CimStatus::InvalidClass);
    EXPECT_EQ(statusOf([&] { m_requests.getInstance(CimPath(std::string("what is this"))); }),
              CimStatus::InvalidParameter);
    const auto whole = m_requests.getInstance(CimPath::of(m_b));
    EXPECT_EQ(whole.path.toString(), "root/test:Test_Gadget.ID=\"b\",Number=2");
    ASSERT_EQ(whole.properties.size(), 5U);  // of several of one name the most derived
    EXPECT_FALSE(whole.properties[0].value.isNull());
    const auto part = m_requests.getInstance(CimPath::of(m_b), core::PropertyFilter({"caption", "Nonsense"}));
    ASSERT_EQ(part.properties.size(), 1U);
    EXPECT_EQ(std::get<std::string>(*part.properties[0].value.scalar()), "Gadget b");
    const auto link = m_requests.enumerateInstances("Test_Link").front();
    EXPECT_EQ(link.find("From")->referenceClass, "Test_Gadget");
    EXPECT_EQ(std::get<CimPath>(*link.find("From")->value.scalar()).getNamespace(), "root/test");
}

TEST_F(CimRequestsTest, WalksAssociations) {
    const auto names = [&](core::AssociationFilter by) {
        return join(m_requests.associatorNames(CimPath::of(m_a), by));
    };
    EXPECT_EQ(names({"", "", "From", ""}), "b");
    EXPECT_EQ(names({"", "", "", "from"}), "c");
    EXPECT_EQ(names({"Test_Link", "Test_Thing", "", ""}), "bc");
    EXPECT_EQ(names({"Test_Link", "Test_Link", "", ""}), "");
    EXPECT_EQ(names({"Test_Gadget", "", "", ""}), "");
    EXPECT_EQ(m_requests.referenceNames(CimPath::of(m_a), {}).size(), 2U);
    EXPECT_EQ(m_requests.references(CimPath::of(m_a), {"Test_Link", "", "To", ""}).size(), 1U);

    // However many instances are at the far ends, their class is enumerated once.
    const int before = m_agent.gadgets().enumerations;
    EXPECT_EQ(m_requests.associators(CimPath::of(m_a), {}).size(), 2U);
    EXPECT_EQ(m_agent.gadgets().enumerations, before + 1);

    m_b.setDeleted(true);
    EXPECT_EQ(m_requests.associators(CimPath::of(m_a), {}).size(), 1U);
}

TEST_F(CimRequestsTest, CompletesAndChecksArguments) {
    const auto text = [](const char* value) { return CimValue::of(CimType::String, std::string(value)); };
    const auto call = [&](const std::vector<Argument>& arguments, const char* method = "work") {
        return m_requests.invokeMethod(CimPath::of(m_a), method, arguments);
    };
    const auto refusal = [&](const std::vector<Argument>& arguments, const char* method = "work") {
        return statusOf([&] { call(arguments, method); });
    };
    // What is given for an output reaches the method, but the job is the method's own.
    const auto result =
        call({{"text", text("x")},
              {"NUMBERS", CimValue::arrayOf(CimType::Uint32, {std::uint64_t{2}, std::uint64_t{3}})},
              {"Echo", text("given ")},
              {"Job", CimValue::of(CimType::Reference, CimPath::of(m_b))}});
    EXPECT_EQ(result.returnValue, 5U);
    ASSERT_EQ(result.outputs.size(), 2U);
    EXPECT_EQ(result.outputs[0].name, "Echo");
    EXPECT_EQ(std::get<std::string>(*result.outputs[0].value.scalar()), "given x");
    EXPECT_EQ(result.outputs[1].name, "Job");
    EXPECT_TRUE(std::get<CimPath>(*result.outputs[1].value.scalar()).names(m_a));

    EXPECT_EQ(call({{"Text", text("x")}}).returnValue, 0U);  // Numbers is optional
    EXPECT_EQ(refusal({}), CimStatus::Failed);
    EXPECT_EQ(m_error, "Text is missing");
    EXPECT_EQ(refusal({{"Text", text("x")}, {"Other", text("y")}}), CimStatus::InvalidParameter);
    EXPECT_EQ(refusal({{"Text", text("x")}, {"TEXT", text("y")}}), CimStatus::InvalidParameter);
    EXPECT_EQ(refusal({{"Text", CimValue::of(CimType::Uint16, std::uint64_t{1})}}), CimStatus::TypeMismatch);
    EXPECT_EQ(refusal({}, "NotImplemented"), CimStatus::MethodNotAvailable);
    EXPECT_EQ(refusal({}, "Nonsense"), CimStatus::MethodNotFound);
}

TEST_F(CimRequestsTest, DeletesOnlyWhatCanBeDeleted) {
    const core::RequestScope scope;
    const CimPath link = m_requests.enumerateInstanceNames("Test_Link").front();
    m_requests.deleteInstance(CimPath::of(m_b));
    EXPECT_EQ(join(m_requests.enumerateInstanceNames("Test_Gadget")), "ac");
    EXPECT_EQ(statusOf([&] { m_requests.deleteInstance(CimPath::of(m_b)); }), CimStatus::NotFound);
    EXPECT_EQ(statusOf([&] { m_requests.getInstance(CimPath::of(m_b)); }), CimStatus::NotFound);
    EXPECT_EQ(statusOf([&] { m_requests.deleteInstance(link); }), CimStatus::NotSupported);
    EXPECT_EQ(statusOf([&] { m_requests.deleteInstance(CimPath("Unknown", {})); }), CimStatus::InvalidClass);
}

TEST_F(CimRequestsTest, DeclaresWhatEachClassAdds) {
    const auto chain = m_requests.getClass("test_gadget");
    ASSERT_EQ(chain.size(), 2U);
    std::string added;
    for (const auto& property : chain[0]->properties)
        added += property.name + (property.isKey ? "! " : " ");
    EXPECT_EQ(added, "ID! Number! Made ");

    EXPECT_EQ(m_requests.enumerateClasses("", false).size(), 2U);
    EXPECT_EQ(m_requests.enumerateClasses("Test_Thing", false).size(), 1U);
    EXPECT_EQ(m_requests.enumerateClasses("", true).size(), 3U);
    EXPECT_EQ(statusOf([&] { m_requests.getClass("Unknown"); }), CimStatus::NotFound);
    EXPECT_EQ(statusOf([&] { m_requests.enumerateClasses("Unknown", true); }), CimStatus::InvalidClass);
}

}  // namespace
