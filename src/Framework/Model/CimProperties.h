// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <limits>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "Framework/Model/CimProperty.h"
#include "Utils/Time.h"

namespace core {

/// How the C++ type T of a property is held in a CimScalar.
template <class T>
struct CimHeld {
    using Type = std::conditional_t<std::is_signed_v<T>, std::int64_t, std::uint64_t>;
};
template <>
struct CimHeld<bool> {
    using Type = bool;
};
template <>
struct CimHeld<utils::Time> {
    using Type = utils::Time;
};
template <>
struct CimHeld<std::string> {
    using Type = std::string;
};

/// A property with one value of type T. Starts null; assignment ends the null state.
template <class T, CimType Type>
class CimPropertyScalar : public CimProperty {
  public:
    CimPropertyScalar(const char* name, CimInstance* owner) : CimProperty(name, owner, Type, false) {}

    CimPropertyScalar& operator=(T value) {
        const Guard guard(*this);
        m_value = std::move(value);
        changed();
        return *this;
    }
    /// T() when null.
    T get() const {
        const Guard guard(*this);
        return isNull() ? empty() : m_value;
    }

  protected:
    void load(CimValue& value) const override {
        value.data = CimScalar(static_cast<typename CimHeld<T>::Type>(m_value));
    }
    void store(const CimValue& value) override {
        m_value = static_cast<T>(std::get<typename CimHeld<T>::Type>(*value.scalar()));
    }

  private:
    static T empty() {
        if constexpr (std::is_same_v<T, utils::Time>) {
            return utils::Time(0ULL);  // a default-built Time is now, which no null property should show
        } else {
            return T();
        }
    }

    T m_value = empty();
};

/// A property with an array of T. Starts null; push_back and assignment end the null state, clear leaves an
/// empty array.
template <class T, CimType Type>
class CimPropertyArray : public CimProperty {
  public:
    CimPropertyArray(const char* name, CimInstance* owner) : CimProperty(name, owner, Type, true) {}

    void push_back(T value) {
        const Guard guard(*this);
        if (isNull()) m_values.clear();
        m_values.push_back(std::move(value));
        changed();
    }
    void clear() {
        const Guard guard(*this);
        m_values.clear();
        changed();
    }
    CimPropertyArray& operator=(std::vector<T> values) {
        const Guard guard(*this);
        m_values = std::move(values);
        changed();
        return *this;
    }
    /// Empty when null.
    std::vector<T> get() const {
        const Guard guard(*this);
        return isNull() ? std::vector<T>() : m_values;
    }

  protected:
    void load(CimValue& value) const override {
        std::vector<CimScalar> elements;
        elements.reserve(m_values.size());
        for (const T& element : m_values)
            elements.emplace_back(static_cast<typename CimHeld<T>::Type>(element));
        value.data = std::move(elements);
    }
    void store(const CimValue& value) override {
        std::vector<T> values;
        for (const CimScalar& element : *value.elements()) {
            values.push_back(static_cast<T>(std::get<typename CimHeld<T>::Type>(element)));
        }
        m_values = std::move(values);
    }

  private:
    std::vector<T> m_values;
};

/// A text property, with a check of its length on requested values: none is set unless setLengthBounds() is
/// called.
class QUENX_EXPORT CimPropertyString : public CimProperty {
  public:
    /// Refuses a requested text that is longer than the bound (in bytes).
    class QUENX_EXPORT CheckMaxLengthListener : public Listener {
      public:
        explicit CheckMaxLengthListener(std::size_t bound) : m_bound(bound) {}
        void onPropertyModify(CimProperty* current, CimProperty* requested) override;
        void onPropertyVerify(CimProperty* current, CimProperty* requested) override;

      private:
        friend class CimPropertyString;
        std::size_t m_bound;
    };
    /// Refuses a requested text that is shorter than the bound (in bytes).
    class QUENX_EXPORT CheckMinLengthListener : public Listener {
      public:
        explicit CheckMinLengthListener(std::size_t bound) : m_bound(bound) {}
        void onPropertyModify(CimProperty* current, CimProperty* requested) override;
        void onPropertyVerify(CimProperty* current, CimProperty* requested) override;

      private:
        friend class CimPropertyString;
        std::size_t m_bound;
    };

    CimPropertyString(const char* name, CimInstance* owner);

    CimPropertyString& operator=(std::string value);
    /// Copies the value, or the null state. The other is copied first, so two instances are never locked at
    /// once.
    CimPropertyString& operator=(CimPropertyString& other);
    CimPropertyString& operator=(const CimPropertyString& other);
    /// Empty when null.
    std::string get() const;

    void setLengthBounds(std::size_t shortest, std::size_t longest);

  protected:
    void load(CimValue& value) const override;
    void store(const CimValue& value) override;

  private:
    std::string m_value;
    CheckMaxLengthListener m_maxLength{std::numeric_limits<std::size_t>::max()};
    CheckMinLengthListener m_minLength{0};
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
