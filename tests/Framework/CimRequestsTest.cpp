#include "Framework/CimRequests.h"

#include <gtest/gtest.h>

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
    CimRequestsTest() : m_requests("root/test") {
        m_a = m_agent.add("a", 1);
        m_b = m_agent.add("b", 2);
        m_c = m_agent.add("c", 3);
        m_agent.links().instances.add(new test::Link(*m_a, *m_b));
        m_agent.links().instances.add(new test::Link(*m_c, *m_a));
        m_agent.links().instances.add(new test::Link(*m_a, *m_b));  // the same again
    }

    static CimPath pathOf(const core::CimInstance* instance) { return CimPath::of(*instance); }

    template <class Operation>
    static CimStatus statusOf(Operation&& operation) {
        try {
            operation();
        } catch (const CimError& error) {
            EXPECT_STRNE(error.what(), "");
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
    core::CimRequests m_requests;
    test::Gadget* m_a;
    test::Gadget* m_b;
    test::Gadget* m_c;
};

TEST_F(CimRequestsTest, EnumeratesAClassAndItsSuperclasses) {
    for (const char* name : {"Test_Gadget", "TEST_THING"}) {
        EXPECT_EQ(join(m_requests.enumerateInstanceNames(name)), "abc");
        EXPECT_EQ(m_requests.enumerateInstances(name).size(), 3U);
    }
    EXPECT_EQ(m_requests.enumerateInstanceNames("Test_Link").size(), 2U);
    EXPECT_EQ(statusOf([&] { m_requests.enumerateInstances("Unknown"); }), CimStatus::InvalidClass);
}

TEST_F(CimRequestsTest, ReadsOneInstance) {
    const auto whole = m_requests.getInstance(pathOf(m_b));
    EXPECT_EQ(whole.path.toString(), "root/test:Test_Gadget.ID=\"b\",Number=2");
    EXPECT_EQ(whole.properties.size(), 5U);
    EXPECT_TRUE(whole.find("number")->isKey);
    const auto part = m_requests.getInstance(pathOf(m_b), core::PropertyFilter({"caption", "Nonsense"}));
    ASSERT_EQ(part.properties.size(), 1U);
    EXPECT_EQ(std::get<std::string>(*part.properties[0].value.scalar()), "Gadget b");

    const auto link = m_requests.enumerateInstances("Test_Link").front();
    EXPECT_EQ(link.find("From")->referenceClass, "Test_Gadget");
    EXPECT_EQ(std::get<CimPath>(*link.find("From")->value.scalar()).getNamespace(), "root/test");

    const auto statusFor = [&](const char* path) {
        return statusOf([&] { m_requests.getInstance(CimPath(std::string(path))); });
    };
    EXPECT_EQ(statusFor("Test_Gadget.ID=\"z\",Number=2"), CimStatus::NotFound);
    EXPECT_EQ(statusFor("Unknown.ID=\"z\""), CimStatus::InvalidClass);
    EXPECT_EQ(statusFor("what is this"), CimStatus::InvalidParameter);
}

TEST_F(CimRequestsTest, WalksAssociations) {
    const auto names = [&](const core::CimInstance* from, core::AssociationFilter by) {
        return join(m_requests.associatorNames(pathOf(from), by));
    };
    EXPECT_EQ(names(m_a, {}), "bc");
    EXPECT_EQ(names(m_a, {"", "", "From", ""}), "b");
    EXPECT_EQ(names(m_a, {"", "", "", "from"}), "c");
    EXPECT_EQ(names(m_a, {"Test_Link", "Test_Thing", "", ""}), "bc");
    EXPECT_EQ(names(m_a, {"Test_Link", "Test_Link", "", ""}), "");
    EXPECT_EQ(names(m_a, {"Test_Gadget", "", "", ""}), "");
    EXPECT_EQ(names(m_b, {}), "a");
    EXPECT_EQ(m_requests.associators(pathOf(m_a), {}).size(), 2U);
    EXPECT_EQ(m_requests.referenceNames(pathOf(m_a), {}).size(), 2U);
    EXPECT_EQ(m_requests.references(pathOf(m_a), {"Test_Link", "", "To", ""}).size(), 1U);

    // However many instances are at the far ends, their class is enumerated once.
    const int before = m_agent.gadgets().enumerations;
    EXPECT_EQ(m_requests.associators(pathOf(m_a), {}).size(), 2U);
    EXPECT_EQ(m_agent.gadgets().enumerations, before + 1);

    m_b->setDeleted(true);
    EXPECT_EQ(m_requests.associators(pathOf(m_a), {}).size(), 1U);
}

TEST_F(CimRequestsTest, CompletesAndChecksArguments) {
    const auto text = [](const char* value) { return CimValue::of(CimType::String, std::string(value)); };
    const auto call = [&](const std::vector<Argument>& arguments) {
        return m_requests.invokeMethod(pathOf(m_a), "work", arguments);
    };
    const auto result =
        call({{"text", text("hello")},
              {"NUMBERS", CimValue::arrayOf(CimType::Uint32, {std::uint64_t{2}, std::uint64_t{3}})}});
    EXPECT_EQ(result.returnValue, 5U);
    ASSERT_EQ(result.outputs.size(), 2U);
    EXPECT_EQ(result.outputs[0].name, "Echo");
    EXPECT_EQ(std::get<std::string>(*result.outputs[0].value.scalar()), "hello");
    EXPECT_EQ(result.outputs[1].name, "Job");
    EXPECT_TRUE(std::get<CimPath>(*result.outputs[1].value.scalar()).names(*m_a));

    EXPECT_EQ(call({{"Text", text("x")}}).returnValue, 0U);  // Numbers is optional
    const auto own = call({{"Text", text("x")}, {"Job", CimValue::of(CimType::Reference, pathOf(m_b))}});
    ASSERT_EQ(own.outputs.size(), 2U);  // the method's job alone, not the client's
    EXPECT_TRUE(std::get<CimPath>(*own.outputs[1].value.scalar()).names(*m_a));
    EXPECT_EQ(std::get<std::string>(
                  *call({{"Text", text("x")}, {"Echo", text("given ")}}).outputs[0].value.scalar()),
              "given x");
    try {
        call({});
        FAIL();
    } catch (const CimError& error) {
        EXPECT_EQ(error.status(), CimStatus::Failed);
        EXPECT_STREQ(error.what(), "Text is missing");
    }
    EXPECT_EQ(statusOf([&] {
                  call({{"Text", text("x")}, {"Other", text("y")}});
              }),
              CimStatus::InvalidParameter);
    EXPECT_EQ(statusOf([&] {
                  call({{"Text", text("x")}, {"TEXT", text("y")}});
              }),
              CimStatus::InvalidParameter);
    EXPECT_EQ(statusOf([&] {
                  call({{"Text", CimValue::of(CimType::Uint16, std::uint64_t{1})}});
              }),
              CimStatus::TypeMismatch);
    EXPECT_EQ(statusOf([&] { m_requests.invokeMethod(pathOf(m_a), "NotImplemented", {}); }),
              CimStatus::MethodNotAvailable);
    EXPECT_EQ(statusOf([&] { m_requests.invokeMethod(pathOf(m_a), "Nonsense", {}); }),
              CimStatus::MethodNotFound);
}

TEST_F(CimRequestsTest, DeletesOnlyWhatCanBeDeleted) {
    const CimPath link = m_requests.enumerateInstanceNames("Test_Link").front();
    m_requests.deleteInstance(pathOf(m_b));
    EXPECT_EQ(join(m_requests.enumerateInstanceNames("Test_Gadget")), "ac");
    const auto statusFor = [&](const CimPath& path) {
        return statusOf([&] { m_requests.deleteInstance(path); });
    };
    EXPECT_EQ(statusFor(CimPath(std::string("Test_Gadget.ID=\"b\",Number=2"))), CimStatus::NotFound);
    EXPECT_EQ(statusFor(link), CimStatus::NotSupported);
    EXPECT_EQ(statusFor(CimPath(std::string("Unknown.ID=1"))), CimStatus::InvalidClass);
}

TEST_F(CimRequestsTest, DeclaresWhatEachClassAdds) {
    const auto chain = m_requests.getClass("test_gadget");
    ASSERT_EQ(chain.size(), 2U);
    std::string added;
    for (const auto& property : chain[0]->properties)
        added += property.name + (property.isKey ? "! " : " ");
    EXPECT_EQ(added, "ID! Number! Made ");
    EXPECT_EQ(chain[0]->superclass, "Test_Thing");
    EXPECT_EQ(chain[1]->properties.size(), 3U);
    EXPECT_EQ(chain[0]->methods.front().parameters.size(), 4U);

    const auto link = m_requests.getClass("Test_Link");
    EXPECT_TRUE(link[0]->isAssociation);
    EXPECT_EQ(link[0]->properties[1].referenceClass, "Test_Gadget");
    EXPECT_EQ(m_requests.enumerateClasses("", false).size(), 2U);
    EXPECT_EQ(m_requests.enumerateClasses("", true).size(), 3U);
    EXPECT_EQ(m_requests.enumerateClasses("Test_Thing", false).size(), 1U);
    EXPECT_EQ(statusOf([&] { m_requests.getClass("Unknown"); }), CimStatus::NotFound);
    EXPECT_EQ(statusOf([&] { m_requests.enumerateClasses("Unknown", true); }), CimStatus::InvalidClass);
}

}  // namespace
