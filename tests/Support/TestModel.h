// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <string>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Model/CimInstance.h"
#include "Framework/Model/CimProperty.h"

namespace test {

/// The root of the test classes; a property that its subclass repeats, one that it makes a key, one that it
/// leaves.
class Thing : public core::CimInstance {
  public:
    static const core::CimClassInfo classInfo;
    Thing() { declareClass(classInfo); }
    core::CimPropertyString ID{"ID", this};
    core::CimPropertyString Caption{"Caption", this};
    core::CimPropertyUint16_arr Codes{"Codes", this};
};

/// A thing with every kind of key, methods, and a count of the living.
class Gadget : public Thing {
  public:
    static const core::CimClassInfo classInfo;
    static std::atomic<int> living;
    Gadget();
    explicit Gadget(const std::string& id, unsigned int number = 0);
    ~Gadget() override { --living; }
    std::string getClassName() const override { return "Test_Gadget"; }

    /// Returns the sum of Numbers, hands its Text back as Echo, and itself as the job. Throws for a null
    /// Text as for a client's mistake, and for the Text "fail" as for a failure of its own.
    unsigned int Work(core::CimPropertyList& in, core::CimPropertyList& out, core::CimInstance*& job);

    core::CimPropertyString ID{"ID", this};
    core::CimPropertyUint32 Number{"Number", this};
    core::CimPropertyString Caption{"Caption", this};
    core::CimPropertyUint16_arr Codes{"Codes", this};
    core::CimPropertyDatetime Made{"Made", this};
};

/// An association between two gadgets.
class Link : public core::CimInstance {
  public:
    static const core::CimClassInfo classInfo;
    Link();
    Link(const Gadget& from, const Gadget& to);
    std::string getClassName() const override { return "Test_Link"; }

    class Reference : public core::CimPropertyRef {
      public:
        Reference(const char* name, core::CimInstance* owner) : CimPropertyRef(name, owner) {
            setReferenceClass(Gadget::classInfo.name);
        }
        using CimPropertyRef::assign;
    };
    Reference From{"From", this};
    Reference To{"To", this};
};

/// A class object with a public list.
template <class T>
class ListedClass : public core::CimClass {
  public:
    using Instance = T;
    std::string getClassName() override { return T::classInfo.name; }
    utils::SafeList<core::CimInstance*>::Iterator getInstances() override {
        ++enumerations;
        return instances.getElements(false);
    }
    core::InstanceList instances;
    std::atomic<int> enumerations{0};
};

/// Gadgets can be deleted.
class GadgetClass : public ListedClass<Gadget> {
  public:
    int DeleteInstance(core::CimPath& path);
};

/// An agent that serves gadgets and links. Registers itself, and leaves when destroyed.
class GadgetAgent : public core::CimAgent {
  public:
    GadgetAgent();
    ~GadgetAgent() override { leaveBroker(); }

    GadgetClass& gadgets() { return *m_gadgets; }
    ListedClass<Link>& links() { return *m_links; }
    /// Adds a gadget and returns it; it stays owned by the list.
    Gadget* add(const std::string& id, unsigned int number = 0);

  private:
    GadgetClass* m_gadgets;
    ListedClass<Link>* m_links;
};

}  // namespace test
