// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>

#include "Framework/Model/CimType.h"
#include "Framework/Model/CimValue.h"
#include "Utils/Export.h"

namespace core {

class CimInstance;

/// One property of an instance, or one argument of a method call.
///
/// A guarded cell: every operation locks the owning instance (re-entrant) for its duration, and never a
/// second one. Reads return copies. A property without an owner (an argument) belongs to one thread at a
/// time. Properties register themselves with their owner when built and leave it when destroyed; the name
/// must be a literal.
class QUENX_EXPORT CimProperty {
  public:
    /// Called when somebody asks for a new value. Throws to refuse it; the base versions accept everything.
    /// Listeners are linked into the property, not owned by it, and must outlive it.
    class QUENX_EXPORT Listener {
      public:
        virtual void onPropertyModify(CimProperty* current, CimProperty* requested);
        virtual void onPropertyVerify(CimProperty* current, CimProperty* requested);
        virtual ~Listener();

      private:
        friend class CimProperty;
        Listener* m_next = nullptr;
    };

    CimProperty(const char* name, CimInstance* owner, CimType type, bool isArray);
    CimProperty(const CimProperty&) = delete;
    CimProperty& operator=(const CimProperty&) = delete;

    virtual ~CimProperty();
    /// The value as text; empty when null.
    virtual std::string toString();
    virtual CimType getType();
    /// Takes the requested value after the listeners have seen it. Throws what a listener throws, or
    /// CimError (type mismatch) when the requested property is of another type; the value is then unchanged.
    virtual void modify(CimProperty* requested);
    /// As modify(), but only checks.
    virtual void verify(CimProperty* requested);

    void setNull();
    bool IsNull() const;

    /// Marks the property as a key of its class. Called once, in the owning class's constructor.
    void setKey() { m_key = true; }
    bool isKey() const { return m_key; }
    const char* getName() const { return m_name; }
    bool isArray() const { return m_array; }
    /// The class that a reference property refers to; null for the other types.
    const char* getReferenceClass() const { return m_referenceClass; }

    /// The value with its type, as the request layer sends it.
    CimValue getValue() const;
    /// Takes a value of the property's own type; CimError (type mismatch) for any other.
    void setValue(const CimValue& value);

    void addListener(Listener* listener);

  protected:
    /// Both are called under the owner's lock, and only for a value that is not null.
    virtual void load(CimValue& value) const = 0;
    virtual void store(const CimValue& value) = 0;

    void setReferenceClass(const char* name) { m_referenceClass = name; }

    /// Holds the owner's lock, where there is an owner.
    class QUENX_EXPORT Guard {
      public:
        explicit Guard(const CimProperty& property);
        ~Guard();
        Guard(const Guard&) = delete;
        Guard& operator=(const Guard&) = delete;

      private:
        const CimInstance* m_owner;
    };

    /// Both under the owner's lock. To be called after each change of the value.
    bool isNull() const { return m_null; }
    void changed(bool isNull = false);

  private:
    void check(const CimProperty& requested) const;

    bool m_null = true;  ///< under the owner's lock
    bool m_key = false;
    bool m_array;
    CimType m_type;
    const char* m_name;
    const char* m_referenceClass = nullptr;
    CimInstance* m_owner;
    Listener* m_listeners = nullptr;
};

}  // namespace core
