// SPDX-License-Identifier: Apache-2.0
#include "Indications/Indication.h"

#include <gtest/gtest.h>

#include <pugixml.hpp>

#include "CimXml/WireCheck.h"
#include "CimXml/WireError.h"
#include "Indications/QueryObjects.h"

namespace {

using core::CimType;
using core::CimValue;
using indications::Indication;
using indications::Query;

const std::string kNasty = "a ]]> & \"b\" <c> \xC3\xA4";

core::InstanceSnapshot job(std::uint64_t state) {
    auto made = std::make_shared<core::InstanceValue>();
    made->path = core::CimPath("root/cimv2:CIM_ConcreteJob.InstanceID=\"Quenx:1\"");
    made->properties = {
        {"InstanceID", CimValue::of(CimType::String, std::string("Quenx:1")), true, {}},
        {"JobState", CimValue::of(CimType::Uint16, state), false, {}},
        {"ErrorDescription", CimValue::of(CimType::String, kNasty), false, {}},
        {"OperationalStatus", CimValue::arrayOf(CimType::Uint16, {std::uint64_t{2}}), false, {}}};
    return made;
}

core::ClassChain chainOf(const std::string& name) {
    for (const core::ClassChain& chain : test::vocabulary().sources)
        if (core::sameName(chain.front()->name, name)) return chain;
    return {};
}

Indication indication(const core::InstanceSnapshot& before, const core::InstanceSnapshot& after) {
    return {{before, after, 1'000'000}, "Quenx:7", "server", chainOf};
}

/// A message as a client reads it.
class Received {
  public:
    explicit Received(const std::string& message) {
        EXPECT_EQ(test::faultsOf(message), "") << message;
        EXPECT_TRUE(m_document.load_string(message.c_str()));
        m_instance = m_document.select_node("//EXPPARAMVALUE[@NAME='NewIndication']/INSTANCE").node();
    }
    std::string className() const { return m_instance.attribute("CLASSNAME").value(); }
    std::string text(const std::string& property) const {
        return m_instance.find_child_by_attribute("NAME", property.c_str()).child("VALUE").text().get();
    }
    /// A property of an embedded instance.
    std::string text(const std::string& embedded, const std::string& property) const {
        const auto holder = m_instance.find_child_by_attribute("NAME", embedded.c_str());
        if (std::string(holder.attribute("EmbeddedObject").value()) != "object") return "not embedded";
        pugi::xml_document inner;
        EXPECT_TRUE(inner.load_string(holder.child("VALUE").text().get()));
        const auto found = inner.child("INSTANCE").find_child_by_attribute("NAME", property.c_str());
        return found ? found.child("VALUE").text().get() : "missing";
    }

  private:
    pugi::xml_document m_document;
    pugi::xml_node m_instance;
};

Received received(const Indication& indication, const Query& query) {
    return Received(cimxml::writeExport(indication.exported(query, "a filter", {"context", 41}), "1007"));
}

TEST(IndicationTest, ArrivesWithBothInstancesWhole) {
    const Received all = received(indication(job(4), job(10)), Query("SELECT * FROM CIM_Indication"));
    EXPECT_EQ(all.className(), "CIM_InstModification");
    EXPECT_EQ(all.text("SourceInstance", "JobState"), "10");
    EXPECT_EQ(all.text("PreviousInstance", "JobState"), "4");
    EXPECT_EQ(all.text("SourceInstance", "ErrorDescription"), kNasty);
    EXPECT_EQ(all.text("IndicationTime"), "19700101000001.000000+000");
    EXPECT_EQ(all.text("IndicationFilterName") + ' ' + all.text("SequenceContext"), "a filter context");
    EXPECT_EQ(all.text("SequenceNumber") + ' ' + all.text("IndicationIdentifier"), "41 Quenx:7");
    const core::CimPath path(all.text("SourceInstanceModelPath"));
    EXPECT_TRUE(path.isSameObjectAs(job(4)->path));
    EXPECT_EQ(path.getHost(), all.text("SourceInstanceHost"));
}

TEST(IndicationTest, GivesEachSubscriberWhatItsQuerySelects) {
    const Indication event = indication(job(4), job(7));
    const Received some = received(event, Query("SELECT SourceInstance.JobState FROM CIM_InstModification"));
    EXPECT_EQ(some.text("SourceInstance", "JobState"), "7");
    EXPECT_EQ(some.text("SourceInstance", "ErrorDescription"), "missing");
    EXPECT_EQ(some.text("PreviousInstance", "JobState"), "not embedded");
    EXPECT_EQ(some.text("SequenceNumber"), "41");
    EXPECT_EQ(some.text("SourceInstanceHost"), "");
    // And the next one all of it.
    EXPECT_EQ(
        received(event, Query("SELECT * FROM CIM_Indication")).text("SourceInstance", "ErrorDescription"),
        kNasty);
}

TEST(IndicationTest, IsOfTheClassThatTheEventMakes) {
    const auto made = indication(nullptr, job(2));
    const auto deleted = indication(job(7), nullptr);
    const auto isMatched = [](const Indication& event, const std::string& rest) {
        return event.matches(Query("SELECT * FROM " + rest));
    };
    EXPECT_TRUE(
        isMatched(made, "CIM_InstCreation WHERE SourceInstance ISA CIM_Job AND PreviousInstance IS NULL"));
    EXPECT_FALSE(isMatched(made, "CIM_InstModification"));
    EXPECT_TRUE(isMatched(deleted, "CIM_InstDeletion WHERE SourceInstance.JobState = 7"));
    EXPECT_TRUE(isMatched(deleted, "CIM_InstIndication WHERE SourceInstanceHost = 'server'"));
    EXPECT_FALSE(isMatched(deleted, "CIM_InstDeletion WHERE SourceInstance ISA CIM_Port"));
    EXPECT_TRUE(isMatched(indication(job(4), job(7)),
                          "CIM_InstModification WHERE SourceInstance.JobState <> PreviousInstance.JobState"));
}

TEST(IndicationTest, KnowsWhatListenersAnswer) {
    const auto answer = [](const std::string& content) {
        return "<?xml version=\"1.0\"?><CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.4\"><MESSAGE ID=\"1\" "
               "PROTOCOLVERSION=\"1.4\"><SIMPLEEXPRSP><EXPMETHODRESPONSE NAME=\"ExportIndication\">" +
               content + "</EXPMETHODRESPONSE></SIMPLEEXPRSP></MESSAGE></CIM>";
    };
    EXPECT_FALSE(cimxml::readExportAnswer(answer("")).has_value());
    EXPECT_FALSE(cimxml::readExportAnswer(answer("<IRETURNVALUE></IRETURNVALUE>")).has_value());
    const auto error = cimxml::readExportAnswer(answer("<ERROR CODE=\"1\" DESCRIPTION=\"full\"/>"));
    ASSERT_TRUE(error.has_value());
    EXPECT_EQ(error->description, "full");
    EXPECT_THROW(cimxml::readExportAnswer(answer("<ERROR CODE=\"x\"/>")), cimxml::WireError);
    EXPECT_THROW(cimxml::readExportAnswer("<html/>"), cimxml::WireError);
}

}  // namespace
