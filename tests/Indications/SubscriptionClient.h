// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <gtest/gtest.h>

#include <pugixml.hpp>
#include <string>
#include <utility>
#include <vector>

#include "CimXml/WireCheck.h"
#include "System/RawConnection.h"
#include "System/RunningDaemon.h"

namespace test {

/// What an operation answered.
struct CimAnswer {
    int error = 0;  ///< CIM status
    std::string description;
    pugi::xml_document document;

    /// Both in one text.
    std::string said() const { return std::to_string(error) + " " + description; }
    pugi::xml_node result() const { return document.select_node("//IRETURNVALUE").node(); }
};

/// Sends CIM-XML as texts, in whatever form a test wants it.
class SubscriptionClient {
  public:
    using Properties = std::vector<std::pair<std::string, std::string>>;

    static constexpr const char* kAdmin = "Authorization: Basic YWRtaW46YWRtaW4=";
    static constexpr const char* kGuest = "Authorization: Basic Z3Vlc3Q6Z3Vlc3Q=";

    explicit SubscriptionClient(const RunningDaemon& daemon) : m_port(daemon.httpPort()) {}

    std::string namespaceName = "interop";
    std::string login = kAdmin;

    CimAnswer call(const std::string& operation, const std::string& parameters) const {
        const RawConnection connection(m_port, "127.0.0.1");
        connection.send(
            httpRequest("<?xml version=\"1.0\"?><CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><MESSAGE "
                        "ID=\"1\" PROTOCOLVERSION=\"1.0\"><SIMPLEREQ><IMETHODCALL NAME=\"" +
                            operation + "\">" + namespacePath() + parameters +
                            "</IMETHODCALL></SIMPLEREQ></MESSAGE></CIM>",
                        login));
        const std::string answer = connection.receive();
        EXPECT_EQ(statusOf(answer), 200) << answer;
        const std::string body = answer.substr(answer.find("\r\n\r\n") + 4);
        EXPECT_EQ(faultsOf(body), "");
        CimAnswer result;
        EXPECT_TRUE(result.document.load_string(body.c_str()));
        const pugi::xml_node error = result.document.select_node("//ERROR").node();
        result.error = error.attribute("CODE").as_int();
        result.description = error.attribute("DESCRIPTION").value();
        return result;
    }

    static std::string parameter(const std::string& name, const std::string& content) {
        return "<IPARAMVALUE NAME=\"" + name + "\">" + content + "</IPARAMVALUE>";
    }
    static std::string className(const std::string& name) {
        return parameter("ClassName", "<CLASSNAME NAME=\"" + name + "\"/>");
    }
    static std::string properties(const Properties& given) {
        std::string xml;
        for (const auto& [name, value] : given)
            xml += value.starts_with("<PROPERTY") ? value : property(name, "string", value);
        return xml;
    }
    static std::string property(const std::string& name, const std::string& type, const std::string& value) {
        return "<PROPERTY NAME=\"" + name + "\" TYPE=\"" + type + "\"><VALUE>" + escaped(value) +
               "</VALUE></PROPERTY>";
    }
    static std::string reference(const std::string& name, const std::string& path) {
        return "<PROPERTY.REFERENCE NAME=\"" + name + "\"><VALUE.REFERENCE>" + path +
               "</VALUE.REFERENCE></PROPERTY.REFERENCE>";
    }
    /// The path as a reference within the namespace.
    std::string local(const std::string& path) const {
        return "<LOCALINSTANCEPATH>" + namespacePath() + path + "</LOCALINSTANCEPATH>";
    }
    std::string namespacePath() const {
        std::string xml = "<LOCALNAMESPACEPATH>";
        for (std::size_t begin = 0; begin != std::string::npos;) {
            const std::size_t slash = namespaceName.find('/', begin);
            xml += "<NAMESPACE NAME=\"" + namespaceName.substr(begin, slash - begin) + "\"/>";
            begin = slash == std::string::npos ? slash : slash + 1;
        }
        return xml + "</LOCALNAMESPACEPATH>";
    }

    CimAnswer create(const std::string& name, const std::string& properties) const {
        return call("CreateInstance", parameter("NewInstance", "<INSTANCE CLASSNAME=\"" + name + "\">" +
                                                                   properties + "</INSTANCE>"));
    }
    /// The path of what has been made, as an INSTANCENAME; expects success.
    std::string made(const std::string& name, const std::string& properties) const {
        const CimAnswer answer = create(name, properties);
        EXPECT_EQ(answer.error, 0) << answer.description;
        return xmlOf(answer.result().first_child());
    }
    std::string madeDestination(const std::string& url, const std::string& name = "d") const {
        return made("CIM_ListenerDestinationCIMXML", keys("CIM_ListenerDestinationCIMXML", name) +
                                                         property("PersistenceType", "uint16", "3") +
                                                         property("Destination", "string", url));
    }
    std::string madeFilter(const std::string& query, const std::string& name = "f") const {
        return made("CIM_IndicationFilter", filterProperties(query, "WQL", name));
    }
    std::string madeSubscription(const std::string& filter, const std::string& destination) const {
        return made("CIM_IndicationSubscription",
                    reference("Filter", local(filter)) + reference("Handler", local(destination)));
    }
    static std::string filterProperties(const std::string& query, const std::string& language,
                                        const std::string& name) {
        return keys("CIM_IndicationFilter", name) +
               "<PROPERTY.ARRAY NAME=\"SourceNamespaces\" TYPE=\"string\"><VALUE.ARRAY><VALUE>root/cimv2"
               "</VALUE></VALUE.ARRAY></PROPERTY.ARRAY>" +
               property("Query", "string", query) + property("QueryLanguage", "string", language);
    }
    static std::string keys(const std::string& className, const std::string& name) {
        return properties({{"SystemCreationClassName", "CIM_ComputerSystem"},
                           {"SystemName", "http://what.the.client/thinks"},
                           {"CreationClassName", className},
                           {"Name", name}});
    }
    static std::string keyPath(const std::string& className, const std::string& name) {
        std::string xml = "<INSTANCENAME CLASSNAME=\"" + className + "\">";
        for (const auto& [key, value] : Properties{{"SystemCreationClassName", "CIM_System"},
                                                   {"SystemName", "127.0.0.1"},
                                                   {"CreationClassName", className},
                                                   {"Name", name}})
            xml += "<KEYBINDING NAME=\"" + key + "\"><KEYVALUE>" + value + "</KEYVALUE></KEYBINDING>";
        return xml + "</INSTANCENAME>";
    }

    CimAnswer remove(const std::string& path) const {
        return call("DeleteInstance", parameter("InstanceName", path));
    }
    CimAnswer get(const std::string& path) const {
        return call("GetInstance", parameter("InstanceName", path));
    }
    /// The value of a property of an instance; "null" where it has none.
    std::string value(const std::string& path, const std::string& property) const {
        const CimAnswer answer = get(path);
        EXPECT_EQ(answer.error, 0) << answer.description;
        const pugi::xml_node found =
            answer.result().child("INSTANCE").find_child_by_attribute("NAME", property.c_str());
        EXPECT_TRUE(found) << property;
        const pugi::xml_node value =
            found.find_node([](const pugi::xml_node& each) { return std::string(each.name()) == "VALUE"; });
        return value ? value.text().get() : "null";
    }
    /// How many instances of the class there are, by an operation that takes one.
    std::size_t count(const std::string& name, const std::string& operation = "EnumerateInstances") const {
        const CimAnswer answer = call(operation, className(name));
        EXPECT_EQ(answer.error, 0) << name << ": " << answer.description;
        const auto children = answer.result().children();
        return static_cast<std::size_t>(std::distance(children.begin(), children.end()));
    }
    CimAnswer modify(const std::string& path, const std::string& name, const std::string& properties) const {
        return call(
            "ModifyInstance",
            parameter("ModifiedInstance", "<VALUE.NAMEDINSTANCE>" + path + "<INSTANCE CLASSNAME=\"" + name +
                                              "\">" + properties + "</INSTANCE></VALUE.NAMEDINSTANCE>"));
    }

    static std::string xmlOf(const pugi::xml_node& node) {
        struct Writer : pugi::xml_writer {
            std::string text;
            void write(const void* data, std::size_t size) override {
                text.append(static_cast<const char*>(data), size);
            }
        } writer;
        node.print(writer, "", pugi::format_raw);
        return writer.text;
    }

  private:
    static std::string escaped(const std::string& text) {
        std::string xml;
        for (const char each : text)
            xml += each == '<' ? "&lt;" : each == '&' ? "&amp;" : std::string(1, each);
        return xml;
    }

    const int m_port;
};

}  // namespace test
