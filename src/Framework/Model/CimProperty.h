// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>
#include <limits>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include "Framework/Model/CimValue.h"
#include "Utils/Export.h"
#include "Utils/Time.h"

namespace core {

class CimInstance;
class RecursiveMutex;

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

    // For a reader that holds the owner's lock, and does not want a copy.
    bool isNull() const { return m_null; }
    /// How many single values it holds, and one of them, good while the lock is held. A reference has none
    /// that can be seen so; neither may be asked for of a null property.
    virtual std::size_t cellCount() const { return 0; }
    virtual CimCell cell(std::size_t index) const;

  protected:
    /// Both are called under the owner's lock, and only for a value that is not null.
    virtual void load(CimValue& value) const;
    virtual void store(const CimValue& value) = 0;

    void setReferenceClass(const char* name) { m_referenceClass = name; }

    /// Takes the owner's lock, where there is an owner.
    std::unique_lock<RecursiveMutex> lockOwner() const;

    /// Under the owner's lock. To be called after each change of the value.
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

/// A property with one value of type T. Starts null; assignment ends the null state.
template <class T, CimType Type>
class CimPropertyScalar : public CimProperty {
  public:
    CimPropertyScalar(const char* name, CimInstance* owner);

    CimPropertyScalar& operator=(T value);
    /// T() when null, an interval of 0 for a datetime.
    T get() const;

    std::size_t cellCount() const override { return 1; }
    CimCell cell(std::size_t index) const override;

  protected:
    void store(const CimValue& value) override;

    T m_value;
};

/// A property with an array of T. Starts null; push_back and assignment end the null state, clear leaves an
/// empty array.
template <class T, CimType Type>
class CimPropertyArray : public CimProperty {
  public:
    CimPropertyArray(const char* name, CimInstance* owner);

    void push_back(T value);
    void clear();
    CimPropertyArray& operator=(std::vector<T> values);
    /// Empty when null.
    std::vector<T> get() const;

    std::size_t cellCount() const override { return m_values.size(); }
    CimCell cell(std::size_t index) const override;

  protected:
    void store(const CimValue& value) override;

  private:
    std::vector<T> m_values;
};

// Before its first use: the one copy of the template, see below.
extern template class QUENX_EXPORT CimPropertyScalar<std::string, CimType::String>;

/// A text property, with a check of its length on requested values, which lets every length pass: a class
/// that wants bounds adds listeners of its own.
class QUENX_EXPORT CimPropertyString : public CimPropertyScalar<std::string, CimType::String> {
  public:
    /// Holds a requested text against a bound of its length in bytes; one to be modified as one to be
    /// verified.
    class QUENX_EXPORT LengthListener : public Listener {
      public:
        explicit LengthListener(std::size_t bound) : m_bound(bound) {}
        void onPropertyModify(CimProperty* current, CimProperty* requested) override;

      protected:
        const std::size_t m_bound;
    };
    /// Refuses a requested text that is longer than the bound.
    class QUENX_EXPORT CheckMaxLengthListener : public LengthListener {
      public:
        using LengthListener::LengthListener;
        void onPropertyVerify(CimProperty* current, CimProperty* requested) override;
    };
    /// Refuses a requested text that is shorter than the bound.
    class QUENX_EXPORT CheckMinLengthListener : public LengthListener {
      public:
        using LengthListener::LengthListener;
        void onPropertyVerify(CimProperty* current, CimProperty* requested) override;
    };

    CimPropertyString(const char* name, CimInstance* owner);

    CimPropertyString& operator=(std::string value);
    /// Copies the value, or the null state. The other is copied first, so two instances are never locked at
    /// once.
    CimPropertyString& operator=(const CimPropertyString& other);

  private:
    CheckMaxLengthListener m_maxLength{std::numeric_limits<std::size_t>::max()};
    CheckMinLengthListener m_minLength{0};
};

/// A reference to another instance; its text is the target's path. It keeps that path, taken when it was set,
/// so it can be served after the target has gone; the target itself is not kept alive, since it may belong to
/// a library that unloads first.
class QUENX_EXPORT CimPropertyRef : public CimProperty {
  public:
    CimPropertyRef(const char* name, CimInstance* owner);

    /// The target's path; one that names nothing when null.
    CimPath getPath() const;

  protected:
    /// Takes the instance's path. A null pointer makes the property null.
    void assign(const CimInstance* target);

    void load(CimValue& value) const override;
    void store(const CimValue& value) override;

  private:
    std::shared_ptr<const CimPath> m_path;
};

using CimPropertyString_arr = CimPropertyArray<std::string, CimType::String>;
using CimPropertyUint8 = CimPropertyScalar<unsigned char, CimType::Uint8>;
using CimPropertySint8 = CimPropertyScalar<signed char, CimType::Sint8>;
using CimPropertyUint16 = CimPropertyScalar<unsigned short, CimType::Uint16>;
using CimPropertyUint16_arr = CimPropertyArray<unsigned short, CimType::Uint16>;
using CimPropertyUint32 = CimPropertyScalar<unsigned int, CimType::Uint32>;
using CimPropertyUint64 = CimPropertyScalar<std::uint64_t, CimType::Uint64>;
using CimPropertyBoolean = CimPropertyScalar<bool, CimType::Boolean>;
using CimPropertyDatetime = CimPropertyScalar<utils::Time, CimType::Datetime>;

// The templates that cross libraries have their one copy, with vtable and type information, in the framework.
extern template class QUENX_EXPORT CimPropertyArray<std::string, CimType::String>;
extern template class QUENX_EXPORT CimPropertyArray<unsigned short, CimType::Uint16>;
extern template class QUENX_EXPORT CimPropertyScalar<unsigned char, CimType::Uint8>;
extern template class QUENX_EXPORT CimPropertyScalar<signed char, CimType::Sint8>;
extern template class QUENX_EXPORT CimPropertyScalar<unsigned short, CimType::Uint16>;
extern template class QUENX_EXPORT CimPropertyScalar<unsigned int, CimType::Uint32>;
extern template class QUENX_EXPORT CimPropertyScalar<std::uint64_t, CimType::Uint64>;
extern template class QUENX_EXPORT CimPropertyScalar<bool, CimType::Boolean>;
extern template class QUENX_EXPORT CimPropertyScalar<utils::Time, CimType::Datetime>;

}  // namespace core
