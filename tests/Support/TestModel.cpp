// SPDX-License-Identifier: Apache-2.0
#include "Support/TestModel.h"

#include <numeric>

#include "Framework/Model/CimError.h"
#include "Framework/Model/CimPropertyList.h"
#include "Utils/Exception.h"

namespace test {

namespace {

using core::CimDirection;
using core::CimType;

constexpr core::CimParameterInfo kWorkParameters[] = {
    {"Job", CimType::Reference, false, CimDirection::Out, false, "Test_Gadget"},
    {"Text", CimType::String, false, CimDirection::In, false, nullptr},
    {"Numbers", CimType::Uint16, true, CimDirection::In, true, nullptr},
    {"Echo", CimType::String, false, CimDirection::Out, false, nullptr},
};

constexpr core::CimMethodInfo kGadgetMethods[] = {
    {"Work", CimType::Uint32, kWorkParameters},
    {"NotImplemented", CimType::Uint32, {}},
};

constexpr core::CimElementText kThingTexts[] = {
    {"", "A thing."},
    {"ID", "What it is called."},
    {"Codes", "What is known of it.", "0=Unknown;1..9=Odd;..=Reserved"},
};

constexpr core::CimElementText kGadgetTexts[] = {
    {"Work", "Adds numbers.", "0=Nothing;..=The sum"},
    {"Work.Numbers", "What to add.", "7=Seven"},
};

}  // namespace

const core::CimClassInfo Thing::classInfo{"Test_Thing", nullptr, false, {}, core::makeSample<Thing>,
                                          kThingTexts};
const core::CimClassInfo Gadget::classInfo{"Test_Gadget",  &Thing::classInfo,        false,
                                           kGadgetMethods, core::makeSample<Gadget>, kGadgetTexts};
const core::CimClassInfo Link::classInfo{"Test_Link", nullptr, true, {}, core::makeSample<Link>};

std::atomic<int> Gadget::living{0};

Gadget::Gadget() {
    ++living;
    addMethod("Work", &Gadget::Work);
    ID.setKey();
    Number.setKey();
    declareClass(classInfo);
}

Gadget::Gadget(const std::string& id, unsigned int number) : Gadget() {
    ID = id;
    Number = number;
    Caption = "Gadget " + id;
}

unsigned int Gadget::Work(core::CimPropertyList& in, core::CimPropertyList& out, core::CimInstance*& job) {
    const auto* text = dynamic_cast<core::CimPropertyString*>(in.getPropertyByName("Text"));
    if (text == nullptr || text->IsNull()) throw utils::EUnspecifiedError("Text is missing");
    if (text->get() == "fail") throw std::runtime_error("out of order");
    const auto numbers = dynamic_cast<core::CimPropertyUint16_arr*>(in.getPropertyByName("Numbers"))->get();
    auto* echo = dynamic_cast<core::CimPropertyString*>(out.getPropertyByName("Echo"));
    *echo = echo->get() + text->get();
    job = this;
    return std::accumulate(numbers.begin(), numbers.end(), 0U);
}

Link::Link() {
    From.setKey();
    To.setKey();
    declareClass(classInfo);
}

Link::Link(const Gadget& from, const Gadget& to) : Link() {
    From.assign(&from);
    To.assign(&to);
}

int GadgetClass::DeleteInstance(core::CimPath& path) {
    auto* gadget = dynamic_cast<Gadget*>(core::GetCimBroker()->getInstanceByPath(path));
    if (gadget == nullptr) return core::kDeleteNotFound;
    gadget->setDeleted(true);
    return 0;
}

GadgetAgent::GadgetAgent() : CimAgent("Test Gadgets"), m_gadgets(new GadgetClass), m_links(nullptr) {
    core::GetCimBroker()->addAgent(this);
    m_classes.add(m_gadgets);
    m_links = new ListedClass<Link>;
    m_classes.add(m_links);
}

Gadget* GadgetAgent::add(const std::string& id, unsigned int number) {
    auto* gadget = new Gadget(id, number);
    m_gadgets->instances.add(gadget);
    return gadget;
}

}  // namespace test
