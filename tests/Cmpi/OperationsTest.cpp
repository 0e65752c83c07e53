// SPDX-License-Identifier: Apache-2.0
// What clients get through the interface is what the request layer gives in process, value for value.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <numeric>
#include <set>

#include "Cmpi/LoadedFront.h"
#include "Framework/Requests/CimRequests.h"
#include "Support/SimulatedAdapters.h"
#include "Support/SyslogCapture.h"
#include "Support/TempFolder.h"
#include "Support/TestModel.h"
#include "Utils/Os/Linux/PolicyFile.h"

namespace {

using core::Argument;
using core::AssociationFilter;
using core::CimPath;
using core::CimType;
using core::CimValue;
using test::Answers;
using test::Request;

/// Equal exactly when the answers are.
std::string described(const Answers& answers) {
    std::string text;
    const auto add = [&text](const std::string& name, const CimValue& value) {
        text += name + " " + std::string(core::typeName(value.type)) + (value.isArray ? "[] " : " ");
        text += value.isNull() ? "null\n" : "'" + core::valueText(value) + "'\n";
    };
    for (const CimPath& path : answers.paths)
        text += path.toString() + "\n";
    for (const core::InstanceValue& instance : answers.instances) {
        text += instance.path.toString() + "\n";
        for (const core::PropertyValue& property : instance.properties)
            add(property.name, property.value);
    }
    for (const Argument& output : answers.called.outputs)
        add(output.name, output.value);
    add("returned", CimValue::of(answers.called.returnType, std::uint64_t{answers.called.returnValue}));
    return text;
}

std::string answerOf(const std::function<Answers()>& ask) try {
    return described(ask());
} catch (const core::CimError& error) {
    return "status " + std::to_string(static_cast<int>(error.status())) + ": " + error.what();
}

/// What comes in process; of other classes nothing, since managers ask for subclasses by themselves.
Answers inProcess(core::CimOperations& operations, const Request& request) {
    const auto& [op, path, by, filter, method, arguments] = request;
    const std::string& name = path.getClassName();
    const auto isOther = [&](const CimPath& each) { return !core::sameName(each.getClassName(), name); };
    Answers answers;
    if (op == "names") answers.paths = operations.enumerateInstanceNames(name);
    if (op == "instances") answers.instances = operations.enumerateInstances(name, filter);
    std::erase_if(answers.paths, isOther);
    std::erase_if(answers.instances, [&](const auto& each) { return isOther(each.path); });
    if (op == "get") answers.instances = {operations.getInstance(path, filter)};
    if (op == "delete") operations.deleteInstance(path);
    if (op == "invoke") answers.called = operations.invokeMethod(path, method, arguments);
    if (op == "associators") answers.instances = operations.associators(path, by, filter);
    if (op == "associatorNames") answers.paths = operations.associatorNames(path, by);
    if (op == "references") answers.instances = operations.references(path, by, filter);
    if (op == "referenceNames") answers.paths = operations.referenceNames(path, by);
    return answers;
}

/// The least and the greatest value of each type, and texts.
constexpr const char* kValues =
    R"(0 z ~ ä ߿ ࠀ 255 65535 4294967295 18446744073709551615 -128 127 -32768 32767 -2147483648 2147483647
       -9223372036854775808 9223372036854775807 -0.5 1e300 TRUE ä"q" 20240229235958.000000+000
       00000001000000.123000:000 Test_Gadget.ID="a\"\\b",Number=7)";

constexpr const char* kPaths =
    R"(Test_Gadget Test_Gadget.ID="a",Number=1 Test_Gadget.ID="a",Number="1" Test_Gadget.ID="a",Number=-1
       Test_Gadget.ID="a",Number="one" Test_Gadget.ID="a",Number=TRUE Test_Gadget.ID="a",Number=1.5
       TEST_GADGET.number=1,id="a" Test_Gadget.ID="c",Number=1 Test_Gadget.ID="a"
       Test_Gadget.ID="a",Other="a" Test_Gadget.ID="a",Number=1,Other=1 Test_Thing.ID="a"
       Test_Unknown.ID="a")";

std::vector<std::string> wordsOf(const char* text) {
    std::istringstream in(text);
    return {std::istream_iterator<std::string>(in), {}};
}

/// One character, and a real of 32 bits.
bool isHeld(CimType type, const core::CimScalar& value) {
    if (type == CimType::Char16)
        return std::filesystem::path(std::get<std::string>(value)).u16string().size() == 1;
    if (type != CimType::Real32) return true;
    return static_cast<double>(static_cast<float>(std::get<double>(value))) == std::get<double>(value);
}

/// A property of any type, with a value that does not change.
class FixedProperty : public core::CimProperty {
  public:
    FixedProperty(const std::string& name, core::CimInstance* owner, const CimValue& value)
        : CimProperty(name.c_str(), owner, value.type, value.isArray), m_value(value) {
        changed(value.isNull());
    }

  protected:
    void load(CimValue& value) const override { value = m_value; }
    void store(const CimValue&) override {}

  private:
    const CimValue m_value;
};

/// The provider on simulated adapters, and gadgets that are linked: "a" to "b", and "b" to itself.
class CmpiOperationsTest : public ::testing::Test {
  protected:
    CmpiOperationsTest() {
        test::Gadget* const a = m_gadgets.add("a", 1);
        test::Gadget* const b = m_gadgets.add("b \"'=,.", 4000000000U);
        m_gadgets.links().instances.add(new test::Link(*a, *b));
        m_gadgets.links().instances.add(new test::Link(*b, *b));
        // The providers stay loaded, for the look from within.
        m_fronts[0].ask({"names", m_a});
    }

    /// Both ways give the same, in both dialects.
    void expectSame(const std::vector<std::string>& operations, Request request) {
        for (const std::string& op : operations) {
            request.op = op;
            const std::string expected = answerOf([&] { return inProcess(m_requests, request); });
            m_answers.insert(expected + "\n");
            for (test::LoadedFront& front : m_fronts) {
                front.create();
                if (op == "delete") m_gadgets.add("a", 1);
                EXPECT_EQ(answerOf([&] { return front.ask(request); }), expected)
                    << op << request.path.toString();
            }
        }
    }

    const test::SimulatedAdapters m_adapters;
    test::GadgetAgent m_gadgets;
    core::CimRequests m_requests{"root/cimv2"};
    // The library is the same, so each has to be created again before it is asked.
    test::LoadedFront m_fronts[2] = {{QUENX_CMPI_LIBRARY, test::Dialect::Sfcb},
                                     {QUENX_CMPI_LIBRARY, test::Dialect::Pegasus}};
    std::set<std::string> m_answers;  // each that was expected
    const CimPath m_a{"Test_Gadget.ID=\"a\",Number=1"};
    const std::vector<std::string> m_walks{"associators", "associatorNames", "references", "referenceNames"};
};

TEST_F(CmpiOperationsTest, ReadsEveryInstanceOfEveryClassAndValuesOfEveryType) {
    std::deque<std::string> names;
    std::deque<FixedProperty> properties;
    test::Gadget* const owner = m_gadgets.add("everything", 2);
    const auto add = [&](const CimValue& value) {
        properties.emplace_back(names.emplace_back("P" + std::to_string(names.size())), owner, value);
    };
    for (int code = 0; code <= static_cast<int>(CimType::Reference); ++code) {
        const auto type = static_cast<CimType>(code);
        std::vector<core::CimScalar> values;
        for (const std::string& text : wordsOf(kValues)) {
            const auto value = core::parseScalar(type, text);
            if (value && isHeld(type, *value)) values.push_back(*value);
        }
        ASSERT_FALSE(values.empty()) << code;
        for (const core::CimScalar& value : values)
            add(CimValue::of(type, value));
        for (const CimValue& value : {CimValue::null(type), CimValue::arrayOf(type, values),
                                      CimValue::arrayOf(type, {}), CimValue::null(type, true)})
            add(value);
    }
    EXPECT_GT(properties.size(), 120U);
    std::size_t instances = 0;
    for (const core::ClassChain& chain : m_requests.enumerateClasses("", true)) {
        const CimPath ofClass(chain.front()->name, {});
        expectSame({"names", "instances"}, {"", ofClass});
        expectSame({"names"}, {"", CimPath(core::foldName(chain.front()->name), {})});
        for (const CimPath& path : inProcess(m_requests, {"names", ofClass}).paths) {
            ++instances;
            // With the keys, which older managers add.
            core::PropertyFilter some{{"CAPTION", "Codes", "p4", "None"}};
            for (const core::CimKey& key : path.getKeys())
                some->push_back(key.name);
            expectSame({"get"}, {"", path, {}, some});
            expectSame({"get"}, {"", path});
            expectSame(m_walks, {"", path});
        }
    }
    EXPECT_GT(instances, 40U);
}

TEST_F(CmpiOperationsTest, WalksAssociationsAsTheyAreNarrowed) {
    const CimPath b(R"(Test_Gadget.ID="b \"'=,.",Number=4000000000)");
    for (const char* association : {"", "TEST_link", "Test_Gadget"}) {
        for (const char* result : {"", "Test_Thing", "test_link"}) {
            for (const char* role : {"", "TO", "Elsewhere"}) {
                expectSame({"associators", "associatorNames"}, {"", b, {association, result, role, "from"}});
                expectSame({"references", "referenceNames"}, {"", b, {"", result, role, ""}});
            }
        }
    }
}

TEST_F(CmpiOperationsTest, AnswersForTheAssociationOfTheRegistrationAlone) {
    const CimPath port = m_requests.enumerateInstanceNames("Quenx_EthernetPort").front();
    m_fronts[0].create();
    for (const core::ClassChain& chain : m_requests.enumerateClasses("", true)) {
        if (!core::isAssociation(chain)) continue;
        const std::string& name = m_fronts[0].broker.parameters = chain.front()->name;
        for (const std::string& op : m_walks) {
            const bool isOfClass = op.starts_with("associator");
            const auto by = [&](const std::string& association) {
                return isOfClass ? AssociationFilter{association, "", "", ""}
                                 : AssociationFilter{"", association, "", ""};
            };
            const std::string expected = described(inProcess(m_requests, {op, port, by(name)}));
            EXPECT_EQ(described(m_fronts[0].ask({op, port})), expected) << name;
            EXPECT_EQ(described(m_fronts[0].ask({op, port, by(chain.back()->name)})), expected) << name;
            EXPECT_EQ(described(m_fronts[0].ask({op, port, by("Test_Thing")})), described({})) << name;
        }
    }
}

TEST_F(CmpiOperationsTest, CallsMethodsDeletesAndRefuses) {
    const auto text = [](const char* value) { return CimValue::of(CimType::String, std::string(value)); };
    const auto numbers = [](CimType type, std::vector<core::CimScalar> values) {
        return CimValue::arrayOf(type, std::move(values));
    };
    const std::vector<Argument> fine{
        {"Text", text("hello")},
        {"Numbers", numbers(CimType::Uint16, {std::uint64_t{5}, std::uint64_t{37}})}};
    for (const std::string& path : wordsOf(kPaths))
        expectSame({"get", "invoke", "delete"}, {"", CimPath(path), {}, {}, "Work", fine});
    expectSame({"get", "invoke", "delete"}, {});
    for (const core::CimScalar& id : {core::CimScalar(utils::Time(5ULL)), core::CimScalar(m_a)})
        expectSame({"get"}, {"", CimPath("Test_Gadget", {{"ID", id}, {"Number", std::int64_t{1}}})});
    const std::vector<Argument> table[] = {
        {},
        {{"Text", text("hello")}},
        {{"text", text("fail")}},
        {{"Text", CimValue::null(CimType::String)}},
        {{"Text", text("in")}, {"Echo", text("out")}, {"Numbers", CimValue::null(CimType::Uint16, true)}},
        {{"Text", text("x")}, {"Numbers", numbers(CimType::String, {std::string("7")}), true}},
        {{"Text", text("x")}, {"Numbers", numbers(CimType::String, {std::string("no")}), true}},
        {{"Text", text("x")}, {"Numbers", CimValue::of(CimType::Uint32, std::uint64_t{70000})}},
        {{"Text", text("x")}, {"Numbers", CimValue::of(CimType::Real64, 1.0)}},
        {{"Text", CimValue::of(CimType::Boolean, true)}},
        {{"Text", CimValue::of(CimType::Reference, m_a)}},
        {{"Text", text("x")}, {"Job", CimValue::of(CimType::Reference, m_a)}},
        {{"Text", text("x")}, {"Surplus", text("y")}},
    };
    for (const auto& arguments : table) {
        for (const char* method : {"WORK", "NotImplemented", "Unknown", ""})
            expectSame({"invoke"}, {"", m_a, {}, {}, method, arguments});
    }
    expectSame({"delete"}, {"", m_requests.enumerateInstanceNames("Test_Link").front()});
    const auto expected = test::readTestFile(QUENX_CMPI_TEST_DIR "/samples/answers");
    EXPECT_EQ(std::accumulate(m_answers.begin(), m_answers.end(), std::string()),
              std::string(expected.begin(), expected.end()));
}

TEST_F(CmpiOperationsTest, KnowsNothingOfOtherClassesAndServesEveryNamespace) {
    const CimPath other("Other_Class.Name=\"x\"");
    const AssociationFilter byOther{"Other_Class", "Other_Class", "", ""};
    const Request nothing[] = {
        {"instances", other},        {"names", CimPath("Test_Thing")}, {"instances", CimPath("Test_Thing")},
        {"associators", other},      {"referenceNames", other},        {"associators", m_a, byOther},
        {"references", m_a, byOther}};
    const std::pair<std::string, const char*> refused[] = {
        {"create", "status 7: instances of Test_Gadget cannot be created"},
        {"modify", "status 7: instances of Test_Gadget cannot be modified"},
        {"query", "status 7: queries are not supported"}};
    for (test::LoadedFront& front : m_fronts) {
        front.create();
        for (const Request& request : nothing)
            EXPECT_EQ(described(front.ask(request)), described({})) << request.path.toString();
        for (const auto& [op, answer] : refused)
            EXPECT_EQ(answerOf([&, op = op] { return front.ask({op, m_a}); }), answer);
        for (const std::string& op : m_walks) {
            std::string expected = described(inProcess(m_requests, {op, m_a}));
            EXPECT_EQ(described(front.ask({op, m_a}, "")), expected) << "what is served, where none is said";
            for (std::size_t at = 0; (at = expected.find("cimv2", at)) != std::string::npos;)
                expected.replace(at, 5, "interop");
            EXPECT_EQ(described(front.ask({op, m_a}, "root/interop")), expected);
        }
        // What a caller has left in the outputs.
        test::Call call(front.broker,
                        {"invoke", m_a, {}, {}, "Work", {{"Text", CimValue::of(CimType::String, "new")}}});
        call.out.entries.emplace_back("ECHO", CimValue::of(CimType::String, "old"));
        EXPECT_EQ(front.send(call).rc, cmpi::ReturnCode::Ok);
        const auto* echo = core::findByName(call.out.entries, "Echo");
        EXPECT_EQ(core::valueText(echo->value), "new");
    }
}

TEST_F(CmpiOperationsTest, AsksThePolicyForThePrincipal) {
    const std::string file = utils::systemPolicyFile.load();
    const Request unknown{"invoke", m_a, {}, {}, "Unknown"};
    for (test::LoadedFront& front : m_fronts) {
        front.create();
        const auto answerUnder = [&](const char* text, const Request& request) {
            std::ofstream(file) << text << "\n";
            return answerOf([&] { return front.ask(request); });
        };
        const std::string denied = "status 2: user \"root\" may only read: ";
        for (const Request& request : {unknown, Request{"delete", m_a}})
            EXPECT_EQ(answerUnder("administrators = ['alice']", request).substr(0, denied.size()), denied);
        EXPECT_EQ(answerUnder("administrators = ['root']", unknown).substr(0, 9), "status 17");
        front.broker.contexts.getEntry = nullptr;
        EXPECT_EQ(answerOf([&] { return front.ask(unknown); }).substr(0, 33),
                  "status 2: a caller without a name");
    }
    std::filesystem::remove(file);
}

TEST_F(CmpiOperationsTest, LeavesAuditLinesWithThePrincipal) {
    m_fronts[0].create();
    EXPECT_THROW(m_fronts[0].ask({"invoke", m_a, {}, {}, "Unknown"}), core::CimError);
    m_fronts[0].ask({"delete", m_a});
    const std::string begin = R"([audit] user="root" address="cmpi:RequestHandler" operation=)";
    for (const char* part :
         {R"("Unknown" target="root/cimv2:Test_G)", R"("DeleteInstance" target="root/cimv2:Test_G)"})
        EXPECT_TRUE(test::SyslogCapture::contains(begin + part)) << part;
    EXPECT_TRUE(test::SyslogCapture::says("has no method Unknown (CIM status 17)"));
}

}  // namespace
