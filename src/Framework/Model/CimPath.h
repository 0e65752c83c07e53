// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "Utils/Export.h"

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
    CimPath();
    /// Parses the text form. Never throws on account of the text: one that does not parse names nothing, and
    /// toString() gives the text back.
    explicit CimPath(std::string text);
    CimPath(std::string className, std::vector<CimKey> keys);
    CimPath(const CimPath& other);
    CimPath(CimPath&& other) noexcept;
    CimPath& operator=(const CimPath& other);
    CimPath& operator=(CimPath&& other) noexcept;
    ~CimPath();

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
    /// To look at them, include CimValue.h: a key holds a value, and a value may hold a path.
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

  private:
    bool parse(std::string_view text);

    std::string m_host;
    std::string m_namespace;
    std::string m_className;
    std::vector<CimKey> m_keys;
    std::string m_unparsed;
};

}  // namespace core
