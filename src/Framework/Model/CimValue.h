// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <algorithm>
#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <variant>
#include <vector>

#include "Framework/Model/CimType.h"
#include "Utils/Export.h"
#include "Utils/Time.h"

/// Values and object paths. They contain each other: a path's key holds a value, a value may hold a path.
namespace core {

class CimInstance;
struct CimKey;

/// An object path: the name of a class, or of one instance by its keys (DSP0004 8.2, text form DSP0207).
///
/// The text form is `[//host/][namespace:]Class[.Key="text",Number=5,Flag=TRUE,Ref="ns:Class.K=\"v\""]`.
/// Inside a quoted value `\` and `"` are escaped by `\`. A value type: copies are independent, no
/// thread-safety of its own.
class QUENX_EXPORT CimPath {
  public:
    /// Names nothing; isValid() is false.
    CimPath() = default;
    /// Parses the text form. Never throws on account of the text: one that does not parse names nothing, and
    /// toString() gives the text back.
    explicit CimPath(std::string text);
    CimPath(std::string className, std::vector<CimKey> keys);

    /// The path of an instance: its creation class and the values of its key properties, without a namespace.
    static CimPath of(const CimInstance& instance);

    /// The text form; keys in the order in which they were given.
    std::string toString() const;

    /// False for a text that did not parse.
    bool isValid() const { return !m_className.empty(); }
    /// True when the path has keys, so names an instance and not a class.
    bool isInstancePath() const { return !m_keys.empty(); }

    const std::string& getClassName() const { return m_className; }
    const std::string& getNamespace() const { return m_namespace; }
    const std::string& getHost() const { return m_host; }
    const std::vector<CimKey>& getKeys() const { return m_keys; }

    /// Leading and trailing slashes are dropped.
    void setNamespace(std::string_view name);
    void setHost(std::string host) { m_host = std::move(host); }

    /// Sets the namespace here, and in references among the keys, where there is none.
    void completeNamespace(std::string_view name);

    /// The same object: class, key names and namespace without regard to case, values by type (numbers by
    /// value, texts exactly, references as paths), keys in any order. The host is ignored, and a missing
    /// namespace equals any. A path that names nothing equals none, itself included.
    bool isSameObjectAs(const CimPath& other) const;

    /// As above, against the instance's class and current key values, without building its path.
    bool isSameObjectAs(const CimInstance& instance) const;

    /// The same for paths that name the same object, unless one holds as a text what the other holds as a
    /// reference; of few others. Class and namespace are not in it.
    std::size_t hashOfKeys() const;

  private:
    bool parse(std::string_view text);

    std::string m_host;
    std::string m_namespace;
    std::string m_className;
    std::vector<CimKey> m_keys;
    std::string m_unparsed;
};

/// One value of one CIM type. Unsigned integers of all widths are held as uint64_t, signed ones as int64_t,
/// reals as double, string and char16 as text.
using CimScalar = std::variant<bool, std::uint64_t, std::int64_t, double, std::string, utils::Time, CimPath>;

/// A value that is no reference, seen where it is held; good while it stays there.
using CimCell = std::variant<bool, std::uint64_t, std::int64_t, double, std::string_view, utils::Time>;
/// A copy of what is seen, and the other way round. A reference cannot be seen so: std::bad_variant_access.
CimScalar scalarOf(const CimCell& cell);
QUENX_EXPORT CimCell cellOf(const CimScalar& value);

/// The text of the value, in the buffer unless it is a text already.
using CellBuffer = std::array<char, 40>;
QUENX_EXPORT std::string_view cellText(const CimCell& cell, CellBuffer& buffer);

/// One key of an object path.
struct CimKey {
    std::string name;
    CimScalar value;
};

/// Equal by type: numbers by value (2 equals 2 whether signed or not), texts exactly, references as paths; a
/// text and a reference are equal when the text parses to that path, a text and a datetime when it is that
/// datetime's text form, since object paths write all three in quotes.
QUENX_EXPORT bool sameValue(const CimScalar& left, const CimScalar& right);

/// The same for values that are the same by that, but for a text and a reference.
std::size_t hashOf(const CimCell& cell);
std::size_t hashOf(const CimScalar& value);

/// A typed value, an array of such, or null (DSP0004 5.2.5). An empty array is not null.
struct QUENX_EXPORT CimValue {
    CimType type = CimType::String;
    bool isArray = false;
    std::variant<std::monostate, CimScalar, std::vector<CimScalar>> data;

    static CimValue null(CimType type, bool isArray = false) { return {type, isArray, {}}; }
    static CimValue of(CimType type, CimScalar value) { return {type, false, std::move(value)}; }
    static CimValue arrayOf(CimType type, std::vector<CimScalar> values) {
        return {type, true, std::move(values)};
    }

    bool isNull() const { return data.index() == 0; }
    /// The single value; null pointer when null or an array.
    const CimScalar* scalar() const { return std::get_if<CimScalar>(&data); }
    /// The same; null pointer also when it is not a T.
    template <class T>
    const T* get() const {
        return scalar() == nullptr ? nullptr : std::get_if<T>(scalar());
    }
    /// Calls the function with the single value, or with each element.
    template <class Function>
    void forEach(Function&& function) {
        if (auto* single = std::get_if<CimScalar>(&data)) function(*single);
        if (auto* each = std::get_if<std::vector<CimScalar>>(&data)) std::ranges::for_each(*each, function);
    }
    /// Sets the namespace in the paths that it holds, where there is none.
    void completeNamespace(std::string_view name);
    /// The elements; null pointer when null or no array.
    const std::vector<CimScalar>* elements() const { return std::get_if<std::vector<CimScalar>>(&data); }
};

/// The value in its CIM text form: integers in decimal, booleans TRUE and FALSE, datetimes in 25 characters,
/// references as object paths, strings as they are (not quoted).
QUENX_EXPORT std::string scalarText(const CimScalar& value);
/// The same of any value: elements of an array with commas between them, "5,3"; empty for null. Elements that
/// begin after `enough` bytes are left out, since a client may send a megabyte of them.
QUENX_EXPORT std::string valueText(const CimValue& value, std::size_t enough = std::string::npos);

/// Reads a text as a value of the type. Integers in decimal or 0x..., within the range of the type; booleans
/// in any case; blanks around numbers and booleans are ignored. Nothing for any other text.
QUENX_EXPORT std::optional<CimScalar> parseScalar(CimType type, std::string_view text);

/// The value as the type wants it held, where that loses nothing (a signed 5 for a uint16, a text for a
/// reference); nothing where it does.
QUENX_EXPORT std::optional<CimScalar> convertScalar(CimType type, const CimScalar& value);

/// The CIM datetime text, always 25 characters (DSP0004 5.2.4): `yyyymmddHHMMSS.mmmmmm+000` for a timestamp,
/// `ddddddddHHMMSS.mmmmmm:000` for an interval (cut at 99999999 days).
QUENX_EXPORT std::string datetimeText(utils::Time time);

/// Reads the 25-character form; the offset from UTC is applied. Nothing for any other text, asterisks
/// included.
QUENX_EXPORT std::optional<utils::Time> parseDatetime(std::string_view text);

}  // namespace core
