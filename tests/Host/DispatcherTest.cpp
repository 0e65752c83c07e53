// SPDX-License-Identifier: Apache-2.0
#include "Host/DispatcherFixture.h"
#include "Support/SyslogCapture.h"

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
        {14, "ExecQuery", {{"QueryLanguage", "WQL"}, {"Query", "SELECT"}}},
        {7, "OpenQueryInstances", {{"FilterQuery", "SELECT"}}},
        {7, "SetProperty", {{"PropertyName", "x"}}},
        {7, "Nonsense", {}},
        {25, "OpenEnumerateInstances", {{"ClassName", known}, {"FilterQuery", "x"}}},
        {26, "OpenEnumerateInstances", {{"ClassName", known}, {"ContinueOnError", "TRUE"}}},
        {22, "OpenEnumerateInstances", {{"ClassName", known}, {"OperationTimeout", "101"}}},
        {21, "PullInstancesWithPath", {{"EnumerationContext", "x"}, {"MaxObjectCount", "1"}}},
        {21, "CloseEnumeration", {{"EnumerationContext", "x"}}},
    };
    for (const auto& [expected, operation, parameters] : table)
        EXPECT_EQ(status(operation, parameters), expected) << operation << parameters.size();
    m_caller.isAdministrator = false;
    EXPECT_EQ(status("DeleteInstance", {{"InstanceName", a}}), 2);
    EXPECT_EQ(statusIn(invoke(a, "Work", {})), 2);
    m_namespace = "root/unknown";
    EXPECT_EQ(status("Nonsense", {}), 3);
    m_dispatcher.shutDown();
    EXPECT_EQ(status("EnumerateClassNames", {}), 28);
    EXPECT_EQ(statusIn(invoke(a, "Work", {})), 28);
}

/// An element of a class: a star marks what comes from a superclass, "@" the class that first declared it.
template <class Element>
std::string textOf(const Element& element) {
    std::string text = element.name;
    if constexpr (requires { element.origin; }) {
        if (element.isPropagated) text += "*";
        if (!element.origin.empty()) text += "@" + element.origin;
    }
    for (const core::Qualifier& each : element.qualifiers)
        text += " " + each.name + (each.isPropagated ? "*" : "");
    return text + "\n";
}

/// The class as a client reads it off the wire.
std::string classText(const cimxml::Response& response) {
    const cimxml::Response read = cimxml::readResponse(cimxml::writeResponse(response));
    const core::ClassDeclaration shown = std::get<IntrinsicResult>(read.content).classes.at(0);
    std::string text = textOf(shown);
    for (const core::PropertyDeclaration& property : shown.properties)
        text += textOf(property);
    for (const core::MethodDeclaration& method : shown.methods) {
        text += textOf(method);
        for (const core::ParameterDeclaration& parameter : method.parameters)
            text += " " + textOf(parameter);
    }
    return text;
}

TEST_F(DispatcherTest, ShowsClasses) {
    const cimxml::Parameter gadget{"ClassName", ClassName{"test_gadget"}};
    const cimxml::Parameter whole{"LocalOnly", "FALSE"};
    const std::pair<Given, const char*> table[] = {
        {{gadget},
         "Test_Gadget\nID Key Override\nNumber Key\nMade\nWork Description ValueMap Values\n"
         " Job In Out\n Text In\n Numbers In Description ValueMap Values\n Echo In Out\n"
         "NotImplemented\n"},
        {{gadget, whole},
         "Test_Gadget Description*\nID Key Override Description*\nCaption*\n"
         "Codes* Description* ValueMap* Values*\nNumber Key\nMade\n"
         "Work Description ValueMap Values\n Job In Out\n Text In\n"
         " Numbers In Description ValueMap Values\n Echo In Out\nNotImplemented\n"},
        {{gadget, whole, {"IncludeQualifiers", "FALSE"}, {"IncludeClassOrigin", "TRUE"}},
         "Test_Gadget\nID@Test_Thing\nCaption*@Test_Thing\nCodes*@Test_Thing\nNumber@Test_Gadget\n"
         "Made@Test_Gadget\nWork@Test_Gadget\n Job\n Text\n Numbers\n Echo\nNotImplemented@Test_Gadget\n"},
        {{{"ClassName", ClassName{"Test_Link"}}, {"PropertyList", std::vector<std::string>{"to"}}},
         "Test_Link Association\nTo Key\n"},
    };
    for (const auto& [parameters, expected] : table)
        EXPECT_EQ(classText(send("GetClass", parameters)), expected);

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
                                 R"(arguments="" outcome="denied: user )" + name + " may only read\"");
    EXPECT_LT(lines[3].text.size(), 1300U);
    EXPECT_NE(lines[3].text.find(std::string(64, 'u') + R"(\..." address="192.0.2.1")"), std::string::npos);
    EXPECT_TRUE(lines[3].text.ends_with(R"(uu\...")")) << lines[3].text;
}

}  // namespace
