// SPDX-License-Identifier: Apache-2.0
#include "Host/Operations/Dispatcher.h"

#include <gtest/gtest.h>

#include "CimXml/Response.h"
#include "CimXml/WireCheck.h"
#include "Framework/Requests/CimRequests.h"
#include "Support/TestModel.h"

namespace {

using cimxml::ClassName;
using cimxml::IntrinsicResult;
using cimxml::ParameterValue;
using core::CimPath;
using core::CimStatus;

using Given = std::vector<cimxml::Parameter>;

/// A path as a message holds it: keys are texts.
CimPath gadget(const std::string& id, const std::string& number) {
    return {"test_gadget", {{"number", number}, {"id", id}}};
}

CimPath link() {
    return {"Test_Link", {{"From", gadget("a", "1")}, {"To", gadget("b", "2")}}};
}

class DispatcherTest : public ::testing::Test {
  protected:
    DispatcherTest()
        : m_dispatcher({std::make_shared<core::CimRequests>("root/cimv2")},
                       {2, std::chrono::seconds(60), std::chrono::seconds(100)}) {
        m_agent.links().instances.add(new test::Link(m_a, m_b));
    }

    cimxml::Response answer(std::variant<cimxml::IntrinsicCall, cimxml::MethodCall> call) {
        const cimxml::Response response = m_dispatcher.dispatch({"1", std::move(call)}, m_caller);
        EXPECT_EQ(test::faultsOf(cimxml::writeResponse(response)), "");
        return response;
    }

    cimxml::Response send(const std::string& operation, Given parameters) {
        return answer(cimxml::IntrinsicCall{operation, m_namespace, std::move(parameters)});
    }

    IntrinsicResult call(const std::string& operation, Given parameters) {
        const cimxml::Response response = send(operation, std::move(parameters));
        EXPECT_EQ(statusIn(response), 0) << operation;
        const auto* result = std::get_if<IntrinsicResult>(&response.content);
        return result == nullptr ? IntrinsicResult() : *result;
    }

    static int statusIn(const cimxml::Response& response) {
        const auto* failure = std::get_if<cimxml::ErrorResult>(&response.content);
        if (failure == nullptr) return 0;
        EXPECT_NE(failure->description, "");
        return static_cast<int>(failure->status);
    }

    int status(const std::string& operation, Given parameters) {
        return statusIn(send(operation, std::move(parameters)));
    }

    cimxml::Response invoke(CimPath object, const std::string& method,
                            std::vector<cimxml::RawArgument> arguments, bool isClass = false) {
        object.setNamespace(m_namespace);
        return answer(cimxml::MethodCall{method, object, isClass, std::move(arguments)});
    }

    template <class Result>
    static std::string output(const Result& result, const std::string& name) {
        for (const core::Argument& each : result.outputs) {
            if (each.name == name) return core::scalarText(each.value.type, *each.value.scalar());
        }
        return "none";
    }

    std::string m_namespace = "root/cimv2";
    host::Caller m_caller{"admin", true, "localhost"};
    test::GadgetAgent m_agent;
    test::Gadget& m_a = *m_agent.add("a", 1);
    test::Gadget& m_b = *m_agent.add("b", 2);
    test::Gadget& m_c = *m_agent.add("c", 3);
    host::Dispatcher m_dispatcher;
};

TEST_F(DispatcherTest, ReadsInstancesAndTheirNeighbours) {
    EXPECT_EQ(call("EnumerateInstanceNames", {{"classname", ClassName{"TEST_THING"}}}).paths.size(), 3U);
    const auto whole = call("getinstance", {{"InstanceName", gadget("b", " 0x2 ")},
                                            {"IncludeClassOrigin", "true"},
                                            {"LocalOnly", ParameterValue()}});
    ASSERT_EQ(whole.instances.size(), 1U);
    EXPECT_EQ(whole.instances[0].properties.size(), 5U);
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
    EXPECT_EQ(call("AssociatorNames", {{"ObjectName", a}, {"Role", "from"}}).paths.size(), 1U);
    EXPECT_EQ(call("AssociatorNames", {{"ObjectName", a}, {"Role", "To"}}).paths.size(), 0U);
    // The path comes back in a request, with the keys of its references as texts.
    const auto names = call("ReferenceNames", {{"ObjectName", a}}).paths;
    ASSERT_EQ(names.size(), 1U);
    EXPECT_TRUE(
        names[0].isSameObjectAs(call("GetInstance", {{"InstanceName", link()}}).instances.at(0).path));

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
    const struct {
        int status;
        const char* operation;
        Given parameters;
    } table[] = {
        {4, "GetInstance", {}},
        {4, "GetInstance", {{"InstanceName", ParameterValue()}}},
        {4, "GetInstance", {{"InstanceName", known}}},
        {4, "GetInstance", {{"InstanceName", a}, {"instancename", a}}},
        {4, "GetInstance", {{"InstanceName", a}, {"Unknown", "x"}}},
        {4, "GetInstance", {{"InstanceName", a}, {"LocalOnly", "maybe"}}},
        {5, "GetInstance", {{"InstanceName", CimPath("Unknown", {{"ID", std::string("a")}})}}},
        {4, "GetInstance", {{"InstanceName", CimPath("Test_Gadget", {{"ID", std::string("a")}})}}},
        {4, "GetInstance", {{"InstanceName", gadget("a", "many")}}},
        {6, "GetInstance", {{"InstanceName", gadget("a", "2")}}},
        {5, "EnumerateClasses", {{"ClassName", unknown}}},
        {5, "EnumerateClassNames", {{"ClassName", unknown}}},
        {5, "CreateInstance", {{"NewInstance", cimxml::InstanceBody{"Unknown", {}}}}},
        {6, "ModifyInstance", {{"ModifiedInstance", cimxml::InstanceBody{"Test_Gadget", gadget("x", "1")}}}},
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
        {22, "OpenEnumerateInstances", {{"ClassName", known}, {"OperationTimeout", "0"}}},
        {22, "OpenEnumerateInstances", {{"ClassName", known}, {"OperationTimeout", "101"}}},
        {21, "PullInstancesWithPath", {{"EnumerationContext", "x"}, {"MaxObjectCount", "1"}}},
        {21, "CloseEnumeration", {{"EnumerationContext", "x"}}},
    };
    for (const auto& row : table) {
        EXPECT_EQ(status(row.operation, row.parameters), row.status) << row.operation << &row - table;
    }
    m_namespace = "root/unknown";
    EXPECT_EQ(status("Nonsense", {}), 3);
}

TEST_F(DispatcherTest, ShowsClasses) {
    const auto local = call("GetClass", {{"ClassName", ClassName{"test_gadget"}}}).classes.at(0);
    EXPECT_EQ(local.superclass, "Test_Thing");
    EXPECT_EQ(local.properties.size(), 3U);
    const auto all = call("GetClass", {{"ClassName", ClassName{"Test_Gadget"}},
                                       {"LocalOnly", "false"},
                                       {"IncludeClassOrigin", "true"}})
                         .classes.at(0);
    ASSERT_EQ(all.properties.size(), 5U);
    for (const core::PropertyDeclaration& property : all.properties) {
        EXPECT_EQ(property.isPropagated, property.name == "Caption" || property.name == "Codes");
        const bool isNew = property.name == "Number" || property.name == "Made";
        EXPECT_EQ(property.origin, isNew ? "Test_Gadget" : "Test_Thing") << property.name;
    }

    const auto bare = call("GetClass", {{"ClassName", ClassName{"Test_Link"}},
                                        {"IncludeQualifiers", "false"},
                                        {"PropertyList", std::vector<std::string>{"to"}}})
                          .classes.at(0);
    EXPECT_TRUE(bare.qualifiers.empty());
    EXPECT_EQ(bare.properties.size(), 1U);
    EXPECT_EQ(call("EnumerateClassNames", {}).classNames,
              (std::vector<std::string>{"Test_Link", "Test_Thing"}));
    EXPECT_EQ(call("EnumerateClassNames", {{"DeepInheritance", "true"}}).classNames.size(), 3U);
    EXPECT_EQ(call("EnumerateClasses", {{"ClassName", ClassName{"Test_Thing"}}}).classes.size(), 1U);
    EXPECT_EQ(call("GetQualifier", {{"QualifierName", "key"}}).qualifiers.at(0).name, "Key");
    EXPECT_EQ(call("EnumerateQualifiers", {}).qualifiers.size(), core::qualifierDeclarations().size());
}

/// The qualifiers of an element in one text; a star marks those that come from a superclass.
std::string textOf(const std::vector<core::Qualifier>& qualifiers) {
    std::string text;
    for (const core::Qualifier& each : qualifiers)
        text += each.name + (each.isPropagated ? "* " : " ");
    return text;
}

TEST_F(DispatcherTest, ShowsTheQualifiersOfEveryElement) {
    const Given gadget{{"ClassName", ClassName{"Test_Gadget"}}};
    const auto local = call("GetClass", gadget).classes.at(0);
    EXPECT_EQ(textOf(local.qualifiers), "");
    EXPECT_EQ(textOf(local.properties.at(0).qualifiers), "Key Override ");
    const core::MethodDeclaration& work = local.methods.at(0);
    EXPECT_EQ(textOf(work.qualifiers), "Description ValueMap Values ");
    EXPECT_EQ(textOf(work.parameters.at(0).qualifiers), "In Out ");
    EXPECT_EQ(textOf(work.parameters.at(2).qualifiers), "In Description ValueMap Values ");

    // On the wire they are what they were, and what a superclass says is marked as such.
    const auto whole = send("GetClass", {gadget[0], {"LocalOnly", "FALSE"}});
    const auto read = cimxml::readResponse(cimxml::writeResponse(whole));
    const core::ClassDeclaration all = std::get<cimxml::IntrinsicResult>(read.content).classes.at(0);
    EXPECT_EQ(textOf(all.qualifiers), "Description* ");
    EXPECT_EQ(textOf(all.properties.at(0).qualifiers), "Key Override Description* ");
    EXPECT_EQ(textOf(all.properties.at(2).qualifiers), "Description* ValueMap* Values* ");
    EXPECT_EQ(textOf(all.methods.at(0).parameters.at(2).qualifiers), "In Description ValueMap Values ");
    const core::CimValue& values = core::findQualifier(all.properties[2].qualifiers, "valuemap")->value;
    EXPECT_EQ(std::get<std::string>(values.elements()->at(1)), "1..9");

    const auto link = call("GetClass", {{"ClassName", ClassName{"Test_Link"}}}).classes.at(0);
    EXPECT_EQ(textOf(link.qualifiers), "Association ");
    const auto bare = call("GetClass", {gadget[0], {"LocalOnly", "FALSE"}, {"IncludeQualifiers", "FALSE"}});
    EXPECT_EQ(textOf(bare.classes.at(0).properties.at(0).qualifiers), "");
    EXPECT_EQ(textOf(bare.classes.at(0).methods.at(0).parameters.at(0).qualifiers), "");
    EXPECT_TRUE(bare.classes.at(0).properties.at(0).isKey);
}

TEST_F(DispatcherTest, CallsMethods) {
    const CimPath a = gadget("a", "1");
    const cimxml::RawArgument text{"text", {{}, std::string("hello"), false}};
    const auto numbers = [](std::vector<std::string> values) {
        return cimxml::RawArgument{"Numbers", {{}, std::move(values), false}};
    };
    // What is given for an output reaches the method, but the job is the method's own.
    const cimxml::RawArgument echo{"ECHO", {{}, std::string("given "), false}};
    const cimxml::RawArgument job{"Job", {{}, gadget("b", "2"), false}};
    const cimxml::Response response = invoke(a, "work", {numbers({"5", " 0x10 "}), text, echo, job});
    const auto& result = std::get<core::MethodResult>(response.content);
    EXPECT_EQ(response.name, "work");
    EXPECT_EQ(result.returnValue, 21U);
    EXPECT_EQ(output(result, "Echo"), "given hello");
    EXPECT_EQ(output(result, "Job"), "root/cimv2:Test_Gadget.ID=\"a\",Number=1");
    // One element of an array may come alone, and an optional input may be left out.
    EXPECT_EQ(statusIn(invoke(a, "Work", {text, {"Numbers", {{}, std::string("7"), false}}})), 0);
    EXPECT_EQ(statusIn(invoke(a, "Work", {text})), 0);

    EXPECT_EQ(statusIn(invoke(gadget("a", "9"), "Work", {text})), 6);
    EXPECT_EQ(statusIn(invoke(CimPath("Unknown", {}), "Work", {text})), 6);
    EXPECT_EQ(statusIn(invoke(CimPath("Test_Gadget", {}), "Work", {text}, true)), 16);
    EXPECT_EQ(statusIn(invoke(CimPath("Test_Gadget", {{"ID", std::string("a")}}), "Work", {text})), 4);
    EXPECT_EQ(statusIn(invoke(a, "Play", {})), 17);
    EXPECT_EQ(statusIn(invoke(a, "NotImplemented", {})), 16);
    EXPECT_EQ(statusIn(invoke(a, "Work", {text, text})), 4);
    EXPECT_EQ(statusIn(invoke(a, "Work", {text, {"Unknown", {}}})), 4);
}

TEST_F(DispatcherTest, TakesOnlyArgumentsOfTheDeclaredKind) {
    const CimPath a = gadget("a", "1");
    const auto statusOf = [&](std::optional<core::CimType> stated, decltype(cimxml::RawValue::data) data) {
        const cimxml::RawArgument text{"Text", {{}, std::string("x"), false}};
        return statusIn(invoke(a, "Work", {text, {"Numbers", {stated, std::move(data), false}}}));
    };
    // Without a stated type the declaration decides; some clients state the width that the value needs.
    for (const auto type : {std::optional<core::CimType>(), std::optional(core::CimType::Uint16),
                            std::optional(core::CimType::Uint8), std::optional(core::CimType::Sint64)}) {
        EXPECT_EQ(statusOf(type, std::vector<std::string>{"5"}), 0);
        for (const std::string bad : {"", "x", "65536", "-1", "1.5"})
            EXPECT_EQ(statusOf(type, bad), 4) << bad;
    }
    for (const auto type : {core::CimType::String, core::CimType::Boolean, core::CimType::Real32,
                            core::CimType::Datetime, core::CimType::Reference})
        EXPECT_EQ(statusOf(type, std::vector<std::string>{"1"}), 4) << core::typeName(type);
    EXPECT_EQ(statusOf({}, gadget("b", "2")), 4);

    const auto workOn = [&](cimxml::RawValue text) { return invoke(a, "Work", {{"Text", std::move(text)}}); };
    EXPECT_EQ(statusIn(workOn({{}, std::vector<std::string>{"x"}, false})), 4);
    EXPECT_EQ(statusIn(workOn({core::CimType::Uint16, std::string("5"), false})), 4);
    // The provider says what is missing, in its own words; its own failures are none of the client's.
    const cimxml::Response missing = workOn({});
    EXPECT_EQ(statusIn(missing), 4);
    EXPECT_EQ(std::get<cimxml::ErrorResult>(missing.content).description,
              "SMASHv2:EUnspecifiedError:Text is missing");
    EXPECT_EQ(statusIn(invoke(a, "Work", {})), 4);
    EXPECT_EQ(statusIn(workOn({{}, std::string("fail"), false})), 1);
    EXPECT_EQ(statusIn(invoke(a, "Work", {{"Numbers", {{}, std::vector<std::string>{"5"}, true}}})), 4);
}

TEST_F(DispatcherTest, PullsToTheEnd) {
    const auto open = [&](const std::string& count) {
        return call("OpenEnumerateInstances",
                    {{"ClassName", ClassName{"Test_Gadget"}}, {"MaxObjectCount", count}});
    };
    const auto all = open("10");
    EXPECT_EQ(all.instances.size(), 3U);
    EXPECT_EQ(output(all, "EndOfSequence"), "TRUE");

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

    const auto kept = open("1");
    open("1");
    EXPECT_EQ(status("OpenEnumerateInstancePaths", {{"ClassName", ClassName{"Test_Gadget"}}}), 27);
    EXPECT_EQ(status("CloseEnumeration", {{"EnumerationContext", output(kept, "EnumerationContext")}}), 0);
    const auto paths =
        call("OpenReferenceInstancePaths", {{"InstanceName", gadget("b", "2")}, {"MaxObjectCount", "5"}});
    EXPECT_EQ(paths.paths.size(), 1U);
}

TEST_F(DispatcherTest, RefusesEverythingWhenShuttingDown) {
    m_dispatcher.shutDown();
    EXPECT_EQ(status("EnumerateClassNames", {}), 28);
    EXPECT_EQ(statusIn(invoke(gadget("a", "1"), "Work", {})), 28);
}

}  // namespace
