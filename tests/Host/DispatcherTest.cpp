// SPDX-License-Identifier: Apache-2.0
#include <sstream>
#include <thread>

#include "Host/DispatcherFixture.h"
#include "Support/SyslogCapture.h"
#include "Utils/Utils.h"

namespace {

using namespace test;

TEST_F(DispatcherTest, ReadsInstancesAndTheirNeighbours) {
    EXPECT_EQ(call("EnumerateInstanceNames", {{"classname", ClassName{"TEST_THING"}}}).paths.size(), 3U);
    const auto whole = call("getinstance", {{"InstanceName", gadget("b", " 0x2 ")},
                                            {"IncludeClassOrigin", "true"},
                                            {"LocalOnly", ParameterValue()}});
    EXPECT_EQ(whole.instances.at(0).properties.size(), 5U);
    EXPECT_EQ(whole.origins->at("test_gadget").at("caption"), "Test_Thing");
    EXPECT_EQ(whole.origins->at("test_gadget").at("made"), "Test_Gadget");

    const auto shallow =
        call("EnumerateInstances", {{"ClassName", ClassName{"Test_Thing"}},
                                    {"DeepInheritance", "FALSE"},
                                    {"PropertyList", std::vector<std::string>{"MADE", "id"}}});
    ASSERT_EQ(shallow.instances.at(0).properties.size(), 1U);
    EXPECT_EQ(shallow.instances[0].properties[0].name, "ID");
    const auto none = call(
        "GetInstance", {{"InstanceName", gadget("b", "2")}, {"PropertyList", std::vector<std::string>()}});
    EXPECT_TRUE(none.instances.at(0).properties.empty());

    const ParameterValue a = gadget("a", "1");
    const std::tuple<std::size_t, const char*, ParameterValue> filters[] = {
        {1, "Role", "from"},
        {0, "Role", "To"},
        {1, "ResultRole", "TO"},
        {0, "ResultRole", "From"},
        {0, "AssocClass", ClassName{"Test_Thing"}},
        {0, "ResultClass", ClassName{"Test_Link"}}};
    for (const auto& [count, name, value] : filters)
        EXPECT_EQ(call("AssociatorNames", {{"ObjectName", a}, {name, value}}).paths.size(), count) << name;
    // The path comes back in a request, with the keys of its references as texts.
    const auto names = call("ReferenceNames", {{"ObjectName", a}}).paths;
    ASSERT_EQ(names.size(), 1U);
    const auto links = call("GetInstance", {{"InstanceName", link()}}).instances;
    EXPECT_TRUE(names[0].isSameObjectAs(links.at(0).path));

    // However many instances are at the far ends, their class is enumerated once.
    m_agent.links().instances.add(new test::Link(m_c, m_a));
    m_agent.links().instances.add(new test::Link(m_a, m_b));  // the same again
    const int before = m_agent.gadgets().enumerations;
    EXPECT_EQ(call("Associators", {{"ObjectName", a}}).instances.size(), 2U);
    EXPECT_EQ(m_agent.gadgets().enumerations, before + 1);
    EXPECT_EQ(call("References", {{"ObjectName", a}}).instances.size(), 2U);
}

TEST_F(DispatcherTest, StreamsWhatItAnswers) {
    test::Gadget* odd = m_agent.add("<\x1F\xC3\xBC>", 7);
    odd->Codes = {};
    odd->Made = utils::Time(90061002003ULL);
    m_agent.add("x")->ID.setNull();
    m_agent.add("a", 1)->Codes = {5, 6};  // the same again
    const ClassName gadgets{"Test_Gadget"};
    const std::vector<std::string> few{"MADE", "none", "codes"};
    const char* const enumerate = "enumerateinstances";
    const char* const get = "getInstance";
    const std::pair<const char*, Given> table[] = {
        {enumerate, {{"ClassName", gadgets}}},
        {enumerate, {{"ClassName", ClassName{"Test_Thing"}}, {"DeepInheritance", "FALSE"}}},
        {enumerate, {{"ClassName", gadgets}, {"PropertyList", few}}},
        {enumerate, {{"ClassName", gadgets}, {"PropertyList", std::vector<std::string>()}}},
        {enumerate, {{"ClassName", gadgets}, {"IncludeClassOrigin", "TRUE"}}},
        {enumerate, {{"ClassName", ClassName{"Test_Link"}}}},
        {enumerate, {{"ClassName", ClassName{"Unknown"}}}},
        {get, {{"InstanceName", gadget("b", "2")}}},
        {get, {{"InstanceName", gadget("b", "2")}, {"PropertyList", few}}},
        {get, {{"InstanceName", gadget("b", "2")}, {"IncludeClassOrigin", "TRUE"}}},
        {get, {{"InstanceName", gadget("b", "3")}}},
        {get, {{"InstanceName", link()}}},
    };
    for (const auto& [operation, parameters] : table) {
        const cimxml::Request request{"<1>", cimxml::IntrinsicCall{operation, m_namespace, parameters}};
        host::AnswerCharge charge = m_dispatcher.charge(m_caller.user);
        EXPECT_EQ(utils::joined(m_dispatcher.answer(request, m_caller, charge), ""),
                  cimxml::writeResponse(m_dispatcher.dispatch(request, m_caller, charge)));
    }
    for (unsigned int i = 0; i < 2000; ++i)
        m_agent.add("more", i);
    host::AnswerCharge charge = m_dispatcher.charge(m_caller.user);
    const cimxml::Request all{"1", cimxml::IntrinsicCall{"EnumerateInstances", m_namespace, table[0].second}};
    const std::string text = utils::joined(m_dispatcher.answer(all, m_caller, charge), "");
    EXPECT_NE(text.find("<ERROR CODE=\"27\""), std::string::npos) << text.size();
}

TEST_F(DispatcherTest, AnswersEachMistakeByItsStatus) {
    const ClassName unknown{"Unknown"};
    const ClassName known{"Test_Gadget"};
    const CimPath a = gadget("a", "1");
    const std::tuple<int, const char*, Given> table[] = {
        {4, "GetInstance", {}},
        {4, "GetInstance", {{"InstanceName", a}, {"instancename", a}}},
        {4, "GetInstance", {{"InstanceName", a}, {"Unknown", "x"}}},
        {4, "GetInstance", {{"InstanceName", a}, {"LocalOnly", "maybe"}}},
        {5, "GetInstance", {{"InstanceName", CimPath("Unknown", {{"ID", std::string("a")}})}}},
        {4, "GetInstance", {{"InstanceName", CimPath("Test_Gadget", {{"ID", std::string("a")}})}}},
        {4, "GetInstance", {{"InstanceName", gadget("a", "many")}}},
        {6, "GetInstance", {{"InstanceName", gadget("a", "2")}}},
        {5, "EnumerateInstances", {{"ClassName", unknown}}},
        {5, "EnumerateClasses", {{"ClassName", unknown}}},
        {5, "EnumerateClassNames", {{"ClassName", unknown}}},
        {5, "CreateInstance", {{"NewInstance", cimxml::InstanceBody{"Unknown", {}}}}},
        {6, "ModifyInstance", {{"ModifiedInstance", cimxml::InstanceBody{"Test_Gadget", gadget("x", "1")}}}},
        {7, "ModifyInstance", {{"ModifiedInstance", cimxml::InstanceBody{"Test_Gadget", a}}}},
        {7, "DeleteInstance", {{"InstanceName", link()}}},
        {7, "Associators", {{"ObjectName", known}}},
        {4, "Associators", {{"ObjectName", a}, {"AssocClass", unknown}}},
        {4, "References", {{"ObjectName", a}, {"ResultClass", unknown}}},
        {6, "GetQualifier", {{"QualifierName", "Unknown"}}},
        {4, "ExecQuery", {{"Query", "SELECT"}}},
        {4, "ExecQuery", {{"QueryLanguage", "WQL"}}},
        {14, "ExecQuery", {{"QueryLanguage", "WQL"}, {"Query", "SELECT"}}},
        {7, "OpenQueryInstances", {{"FilterQuery", "SELECT"}}},
        {7, "SetProperty", {{"PropertyName", "x"}}},
        {7, "Nonsense", {}},
        {25, "OpenEnumerateInstances", {{"ClassName", known}, {"FilterQuery", "x"}}},
        {25, "OpenEnumerateInstances", {{"ClassName", known}, {"FilterQueryLanguage", "x"}}},
        {26, "OpenEnumerateInstances", {{"ClassName", known}, {"ContinueOnError", "TRUE"}}},
        {0, "OpenEnumerateInstances", {{"ClassName", known}, {"OperationTimeout", "100"}}},
        {22, "OpenEnumerateInstances", {{"ClassName", known}, {"OperationTimeout", "0"}}},
        {22, "OpenEnumerateInstances", {{"ClassName", known}, {"OperationTimeout", "101"}}},
        {21, "PullInstancesWithPath", {{"EnumerationContext", "x"}, {"MaxObjectCount", "1"}}},
        {21, "CloseEnumeration", {{"EnumerationContext", "x"}}},
    };
    for (const auto& [expected, operation, parameters] : table)
        EXPECT_EQ(status(operation, parameters), expected) << operation << parameters.size();
    std::istringstream needy(
        "GetClass EnumerateInstances EnumerateInstanceNames DeleteInstance CreateInstance ModifyInstance "
        "Associators AssociatorNames References ReferenceNames GetQualifier OpenEnumerateInstances "
        "OpenEnumerateInstancePaths OpenAssociatorInstances OpenAssociatorInstancePaths "
        "OpenReferenceInstances "
        "OpenReferenceInstancePaths PullInstancesWithPath PullInstancePaths PullInstances CloseEnumeration");
    for (std::string operation; needy >> operation;)
        EXPECT_EQ(status(operation, {}), 4) << operation;
    m_caller.isAdministrator = false;
    EXPECT_EQ(status("DeleteInstance", {{"InstanceName", a}}), 2);
    EXPECT_EQ(statusIn(invoke(a, "Work", {})), 2);
    m_namespace = "root/unknown";
    EXPECT_EQ(status("Nonsense", {}), 3);
    m_dispatcher.shutDown();
    EXPECT_EQ(status("EnumerateClassNames", {}), 28);
    EXPECT_EQ(statusIn(invoke(a, "Work", {})), 28);
}

TEST_F(DispatcherTest, ShowsClasses) {
    const cimxml::Parameter gadget{"ClassName", ClassName{"test_gadget"}};
    const cimxml::Parameter whole{"LocalOnly", "FALSE"};
    const std::pair<const char*, Given> table[] = {
        {"class-by-itself", {gadget}},
        {"class-with-what-it-inherits", {gadget, whole}},
        {"class-with-origins",
         {gadget, whole, {"IncludeQualifiers", "FALSE"}, {"IncludeClassOrigin", "TRUE"}}},
        {"class-with-one-property",
         {{"ClassName", ClassName{"Test_Link"}}, {"PropertyList", std::vector<std::string>{"to"}}}}};
    for (const auto& [name, parameters] : table) {
        const std::string text = cimxml::writeResponse(send("GetClass", parameters));
        EXPECT_EQ(test::linesOf(text), test::readSample("responses/" + std::string(name) + ".xml"));
        EXPECT_EQ(cimxml::writeResponse(cimxml::readResponse(text)), text) << "all of it is read";
    }

    EXPECT_EQ(call("EnumerateClassNames", {}).classNames,
              (std::vector<std::string>{"Test_Link", "Test_Thing"}));
    EXPECT_EQ(call("EnumerateClassNames", {{"DeepInheritance", "true"}}).classNames.size(), 3U);
    EXPECT_EQ(call("EnumerateClasses", {{"ClassName", ClassName{"Test_Thing"}}}).classes.size(), 1U);
    EXPECT_EQ(call("GetQualifier", {{"QualifierName", "key"}}).qualifiers.at(0).name, "Key");
    EXPECT_GT(call("EnumerateQualifiers", {}).qualifiers.size(), 5U);
}

TEST_F(DispatcherTest, CallsMethods) {
    const CimPath a = gadget("a", "1");
    const core::Argument text = argument("text", "hello");
    const core::Argument numbers = arrayOf("Numbers", {"5", " 0x10 "});
    // What is given for an output reaches the method, but the job is the method's own.
    const cimxml::Response response =
        invoke(a, "work", {numbers, text, argument("ECHO", "given "), argument("Job", gadget("b", "2"))});
    const auto& result = std::get<core::MethodResult>(response.content);
    EXPECT_EQ(response.name, "work");
    EXPECT_EQ(result.returnValue, 21U);
    EXPECT_EQ(output(result, "Echo"), "given hello");
    EXPECT_EQ(output(result, "Job"), "root/cimv2:Test_Gadget.ID=\"a\",Number=1");

    const std::pair<int, CimPath> objects[] = {{0, a},  // an optional input may be left out
                                               {6, gadget("a", "9")},
                                               {6, CimPath("Unknown", {})},
                                               {16, CimPath("Test_Gadget", {})}};
    for (const auto& [expected, object] : objects)
        EXPECT_EQ(statusIn(invoke(object, "Work", {text})), expected) << object.toString();
    EXPECT_EQ(statusIn(invoke(a, "Play", {})), 17);
    EXPECT_EQ(statusIn(invoke(a, "NotImplemented", {})), 16);
    // One element of an array may come alone.
    EXPECT_EQ(statusIn(invoke(a, "Work", {text, argument("Numbers", "7")})), 0);
    for (const core::Argument& bad : {text, argument("Unknown", "x")})
        EXPECT_EQ(statusIn(invoke(a, "Work", {text, bad})), 4);
}

TEST_F(DispatcherTest, TakesOnlyArgumentsOfTheDeclaredKind) {
    using core::CimType;
    const CimPath a = gadget("a", "1");
    const auto statusWith = [&](const core::Argument& numbers) {
        return statusIn(invoke(a, "Work", {argument("Text", "x"), numbers}));
    };
    // Without a stated type the declaration decides; some clients state the width that the value needs.
    for (const auto type : {std::optional<CimType>(), std::optional(CimType::Uint16),
                            std::optional(CimType::Uint8), std::optional(CimType::Sint64)}) {
        EXPECT_EQ(statusWith(arrayOf("Numbers", {"5"}, type)), 0);
        for (const char* bad : {"", "x", "65536", "-1", "1.5"})
            EXPECT_EQ(statusWith(argument("Numbers", bad, type)), 4) << bad;
    }
    for (const auto type : {CimType::String, CimType::Boolean, CimType::Real32, CimType::Datetime})
        EXPECT_EQ(statusWith(arrayOf("Numbers", {"1"}, type)), 4) << core::typeName(type);
    EXPECT_EQ(statusWith(argument("Numbers", gadget("b", "2"))), 4);

    for (const core::Argument& bad : {arrayOf("Text", {"x"}), argument("Text", "5", CimType::Uint16),
                                      argument("Numbers", "5")})  // the last leaves Text out
        EXPECT_EQ(statusIn(invoke(a, "Work", {bad})), 4);
    // The provider says what is missing, in its own words; its own failures are not the client's.
    const cimxml::Response missing = invoke(a, "Work", {{"Text", core::CimValue()}});
    EXPECT_EQ(statusIn(missing), 4);
    EXPECT_EQ(std::get<cimxml::ErrorResult>(missing.content).description,
              "SMASHv2:EUnspecifiedError:Text is missing");
    EXPECT_EQ(statusIn(invoke(a, "Work", {argument("Text", "fail")})), 1);
}

TEST_F(DispatcherTest, PullsToTheEnd) {
    const auto open = [&](const std::string& count) {
        return call("OpenEnumerateInstances",
                    {{"ClassName", ClassName{"Test_Gadget"}}, {"MaxObjectCount", count}});
    };
    EXPECT_EQ(output(open("10"), "EndOfSequence"), "TRUE");

    const auto first = open("0");
    EXPECT_TRUE(first.instances.empty());
    EXPECT_EQ(output(first, "EndOfSequence"), "FALSE");
    const std::string context = output(first, "EnumerationContext");
    const Given pull{{"EnumerationContext", context}, {"MaxObjectCount", "2"}};
    // What is deleted meanwhile is still delivered: the enumeration holds values.
    EXPECT_EQ(status("DeleteInstance", {{"InstanceName", gadget("a", "1")}}), 0);
    const auto two = call("PullInstancesWithPath", pull);
    ASSERT_EQ(two.instances.size(), 2U);
    EXPECT_EQ(std::get<std::string>(*two.instances[0].find("ID")->value.scalar()), "a");

    EXPECT_EQ(status("PullInstancePaths", pull), 21);
    m_caller.user = "other";
    EXPECT_EQ(status("PullInstancesWithPath", pull), 21);
    EXPECT_EQ(status("CloseEnumeration", {{"EnumerationContext", context}}), 21);
    m_caller.user = "admin";
    const auto last = call("PullInstancesWithPath", pull);
    EXPECT_EQ(last.instances.size(), 1U);
    EXPECT_EQ(output(last, "EndOfSequence"), "TRUE");
    EXPECT_EQ(status("PullInstancesWithPath", pull), 21);

    const std::string kept = output(open("1"), "EnumerationContext");
    open("1");
    EXPECT_EQ(status("OpenEnumerateInstancePaths", {{"ClassName", ClassName{"Test_Gadget"}}}), 27);
    m_caller.user = "other";  // has as many, but not more than all together
    open("1");
    EXPECT_EQ(status("OpenEnumerateInstancePaths", {{"ClassName", ClassName{"Test_Gadget"}}}), 27);
    m_caller.user = "admin";
    EXPECT_EQ(status("CloseEnumeration", {{"EnumerationContext", kept}}), 0);
    const auto paths =
        call("OpenReferenceInstancePaths", {{"InstanceName", gadget("b", "2")}, {"MaxObjectCount", "5"}});
    EXPECT_EQ(paths.paths.size(), 1U);
}

TEST_F(DispatcherTest, BoundsTheMemoryOfAnswers) {
    for (unsigned int i = 0; i < 250; ++i)
        m_agent.add("many", 100 + i);
    const Given all{{"ClassName", ClassName{"Test_Gadget"}}};
    const std::string context = output(call("OpenEnumerateInstances", all), "EnumerationContext");
    // What an enumeration keeps counts until it has been read.
    EXPECT_THROW(send("EnumerateInstances", all), host::OverBudget);
    EXPECT_EQ(call("EnumerateInstanceNames", all).paths.size(), 253U);
    const Given pull{{"EnumerationContext", context}, {"MaxObjectCount", "200"}};
    EXPECT_EQ(call("PullInstancesWithPath", pull).instances.size(), 200U);
    EXPECT_EQ(call("EnumerateInstances", all).instances.size(), 253U);
    EXPECT_EQ(call("PullInstancesWithPath", pull).instances.size(), 53U);
    for (unsigned int i = 0; i < 500; ++i)
        m_agent.add("more", i);
    EXPECT_EQ(status("EnumerateInstances", all), 27);  // waiting would not help
}

TEST_F(DispatcherTest, LeavesOneAuditLineForEachChangeAndRefusal) {
    const test::LogLevelGuard level(1);
    test::SyslogCapture::clear();
    const CimPath a = gadget("a", "1");
    invoke(a, "Work", {argument("Text", "x' Numbers='9"), arrayOf("Numbers", {"5", "7"})});
    send("GetInstance", {{"InstanceName", a}});
    send("NoSuchOperation", {});
    send("deleteinstance", {{"InstanceName", a}});
    // Whatever a name or a text holds, it can pose as nothing else, and no line is long.
    m_caller = {"x\" outcome=\"done\"\n%m%s\\\xE2\x80\xAE", false, "localhost", "192.0.2.1"};
    invoke(a, "Work", {});
    m_caller.user = std::string(5000, 'u');
    const std::string text(2000, 't');
    invoke(a, text, std::vector(50, arrayOf(text, std::vector<core::CimScalar>(50, text))));

    const auto lines = test::SyslogCapture::lines();
    ASSERT_EQ(lines.size(), 4U);
    const std::string who = R"([audit] user="admin" address="192.0.2.1" operation=)";
    const std::string target = R"( target="root/cimv2:test_gadget.number=\"1\",id=\"a\"" )";
    const std::string name = R"(x\" outcome=\"done\"\x0a%m%s\\\xe2\x80\xae)";
    EXPECT_EQ(lines[0].text, who + R"("Work")" + target +
                                 R"(arguments="Text='x\' Numbers=\'9' Numbers='5,7'" )" +
                                 R"(outcome="returned 12, Job=root/cimv2:Test_Gadget.ID=\"a\",Number=1")");
    EXPECT_EQ(lines[1].text, who + R"("deleteinstance")" + target + R"(arguments="" outcome="done")");
    EXPECT_EQ(lines[2].text, "[audit] user=\"" + name + R"(" address="192.0.2.1" operation="Work")" + target +
                                 R"(arguments="" outcome="denied: user )" + name +
                                 R"( may only read" reason="QX-0502")");
    EXPECT_LT(lines[3].text.size(), 1400U);
    EXPECT_NE(lines[3].text.find("user=\"" + std::string(64, 'u') + R"(\..." address="192.0.2.1")"),
              std::string::npos);
    const std::string cut = "=\"denied: user " + std::string(256 - 13, 'u') + R"(\..." reason="QX-0502")";
    EXPECT_TRUE(lines[3].text.ends_with(cut)) << lines[3].text;
}

TEST_F(DispatcherTest, GivesWhatItHasTakenOutOfAnEnumeration) {
    for (unsigned int i = 0; i < 40; ++i)
        m_agent.add(std::string(3000, '"'), i);
    const Given all{{"ClassName", ClassName{"Test_Gadget"}}};
    EXPECT_THROW(send("EnumerateInstances", all), host::OverBudget) << "a quote takes six bytes of text";
    const std::string context = output(call("OpenEnumerateInstances", all), "EnumerationContext");
    EXPECT_EQ(call("PullInstancesWithPath", {{"EnumerationContext", context}, {"MaxObjectCount", "100"}})
                  .instances.size(),
              43U);
}

TEST_F(DispatcherTest, RepeatsNoLongTextOfTheRequest) {
    const std::string quotes(200000, '"');
    for (const char* space : {"root/cimv2", "root/other"}) {
        CimPath path("test_gadget", {{"number", "1"}, {"id", quotes}});
        path.setNamespace(space);
        EXPECT_LT(description(send("GetInstance", {{"InstanceName", path}})).size(), 500U) << space;
    }
    std::string umlauts = "x";
    for (int i = 0; i < 3000; ++i)
        umlauts += "\u00e4";
    const auto unknown = send("EnumerateInstances", {{"ClassName", ClassName{umlauts}}});
    EXPECT_EQ(description(unknown).size(), 1999U) << "half a character would end the answer";
}

TEST_F(DispatcherTest, CarriesOutNothingForAnotherNamespace) {
    CimPath elsewhere = gadget("a", "1");
    elsewhere.setNamespace("root/other");
    // Where a message has a name alone, a client of another kind sends the whole path.
    const auto statusOf = [&](const char* operation, const char* parameter) {
        const cimxml::Request request{
            "1", cimxml::IntrinsicCall{operation, "ROOT/cimv2", {{parameter, elsewhere}}}};
        host::AnswerCharge charge = m_dispatcher.charge("admin");
        return statusIn(m_dispatcher.dispatch(request, m_caller, charge));
    };
    EXPECT_EQ(statusOf("GetInstance", "InstanceName"), 6);
    EXPECT_EQ(statusOf("DeleteInstance", "InstanceName"), 6);
    EXPECT_EQ(statusOf("Associators", "ObjectName"), 6);
    elsewhere.setNamespace("ROOT/CIMV2");
    EXPECT_EQ(statusOf("GetInstance", "InstanceName"), 0);
}

TEST_F(DispatcherTest, CountsTheRefusalsOfAFlood) {
    const test::LogLevelGuard level(1);
    test::SyslogCapture::clear();
    m_caller.isAdministrator = false;
    for (int i = 0; i < 25; ++i)
        invoke(gadget("a", "1"), "Work", {});
    m_caller = {"other", true, "localhost", "192.0.2.1"};
    invoke(gadget("a", "1"), "Work", {});
    EXPECT_EQ(test::SyslogCapture::count("[audit]"), 21U);
    host::AuditTrail trail;
    const auto now = host::AuditTrail::Clock::now();
    for (int i = 0; i < 25; ++i)
        trail.refused({{i < 5 ? "a" : "b", "192.0.2.1"}, "Work", "t", "denied: x"}, {}, now);
    for (int i = 0; i < 20; ++i)
        trail.refused({{"a", "192.0.2.1"}, "Work", "t", "denied: x"}, {}, now);
    trail.writeNumbers(now + std::chrono::seconds(59));
    EXPECT_EQ(test::SyslogCapture::count("[audit]"), 61U);
    trail.writeNumbers(now + std::chrono::seconds(60));
    EXPECT_EQ(test::SyslogCapture::lines().back().text,
              "[audit] user=\"a\" address=\"192.0.2.1\" operation=\"Work\" target=\"\" arguments=\"\" "
              "outcome=\"denied: 5 more within a minute\"");
    // Nor does the number wait for somebody to come by.
    host::AuditTrail quick(std::chrono::milliseconds(1));
    test::SyslogCapture::clear();
    for (int i = 0; i < 21; ++i)
        quick.refused({{"b", "192.0.2.1"}, "Work", "t", "denied: x"}, {}, now);
    while (!test::SyslogCapture::contains("denied: 1 more"))
        std::this_thread::yield();
}

}  // namespace
