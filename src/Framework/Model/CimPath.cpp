// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/CimPath.h"

#include <algorithm>
#include <set>

#include "Framework/Model/CimInstance.h"
#include "Framework/Model/CimValue.h"
#include "Utils/Utils.h"

namespace core {

namespace {

bool isNameStart(char c) {
    return utils::isLetter(c) || c == '_';
}

bool isNameCharacter(char c) {
    return isNameStart(c) || utils::isDigit(c) || (c & 0x80) != 0;
}

bool isName(std::string_view text) {
    return !text.empty() && (isNameStart(text.front()) || (text.front() & 0x80) != 0) &&
           std::all_of(text.begin(), text.end(), isNameCharacter);
}

bool isQuotedType(const CimScalar& value) {
    return std::holds_alternative<std::string>(value) || std::holds_alternative<CimPath>(value) ||
           std::holds_alternative<utils::Time>(value);
}

std::string keyText(const CimScalar& value) {
    // The type is only looked at for how a number was declared, which its variant tells as well.
    const std::string text = scalarText(CimType::String, value);
    return isQuotedType(value) ? utils::quoted(text) : text;
}

/// Reads the list of keys behind the class name.
class KeyReader {
  public:
    explicit KeyReader(std::string_view text) : m_rest(text) {}

    std::optional<std::vector<CimKey>> read() {
        std::vector<CimKey> keys;
        std::set<std::string> seen;  // a client may send thousands of keys
        do {
            auto key = readKey();
            if (!key || !seen.insert(foldName(key->name)).second) return std::nullopt;
            keys.push_back(std::move(*key));
        } while (take(','));
        if (!m_rest.empty()) return std::nullopt;
        return keys;
    }

  private:
    bool take(char c) {
        if (m_rest.empty() || m_rest.front() != c) return false;
        m_rest.remove_prefix(1);
        return true;
    }

    std::optional<CimKey> readKey() {
        const std::string_view name = m_rest.substr(0, m_rest.find('='));
        if (!isName(name)) return std::nullopt;
        m_rest.remove_prefix(name.size());
        if (!take('=')) return std::nullopt;
        auto value = take('"') ? readQuoted() : readPlain();
        if (!value) return std::nullopt;
        return CimKey{std::string(name), std::move(*value)};
    }

    std::optional<CimScalar> readQuoted() {
        std::string text;
        while (!take('"')) {
            take('\\');
            if (m_rest.empty()) return std::nullopt;
            text += m_rest.front();
            m_rest.remove_prefix(1);
        }
        return CimScalar(std::move(text));
    }

    std::optional<CimScalar> readPlain() {
        const std::string_view text = m_rest.substr(0, m_rest.find(','));
        m_rest.remove_prefix(text.size());
        if (text.empty()) return std::nullopt;
        for (const CimType type : {CimType::Uint64, CimType::Sint64, CimType::Boolean, CimType::Real64}) {
            if (auto value = parseScalar(type, text)) return value;
        }
        return std::nullopt;
    }

    std::string_view m_rest;
};

}  // namespace

CimPath::CimPath() = default;
CimPath::CimPath(const CimPath&) = default;
CimPath::CimPath(CimPath&&) noexcept = default;
CimPath& CimPath::operator=(const CimPath&) = default;
CimPath& CimPath::operator=(CimPath&&) noexcept = default;
CimPath::~CimPath() = default;

CimPath::CimPath(std::string text) {
    if (parse(text)) return;
    *this = CimPath();
    m_unparsed = std::move(text);
}

CimPath::CimPath(std::string className, std::vector<CimKey> keys)
    : m_className(std::move(className)), m_keys(std::move(keys)) {}

bool CimPath::parse(std::string_view text) {
    if (text.starts_with("//")) {
        const auto end = text.find('/', 2);
        if (end == std::string_view::npos) return false;
        m_host = text.substr(2, end - 2);
        text.remove_prefix(end + 1);
    }
    // The namespace ends at the colon in front of the class; colons in quoted values come later than any
    // quote.
    const std::string_view head = text.substr(0, text.find('"'));
    const auto dot = head.find('.');
    const auto colon = head.substr(0, dot).rfind(':');
    if (colon != std::string_view::npos) {
        setNamespace(text.substr(0, colon));
        text.remove_prefix(colon + 1);
    }
    const auto classEnd = text.find('.');
    if (!isName(text.substr(0, classEnd))) return false;
    m_className = text.substr(0, classEnd);
    if (classEnd == std::string_view::npos) return true;
    auto keys = KeyReader(text.substr(classEnd + 1)).read();
    if (!keys) return false;
    m_keys = std::move(*keys);
    return true;
}

CimPath CimPath::of(const CimInstance& instance) {
    CimPath path(instance.getCreationClassName(), {});
    const RecursiveLocker lock(instance.getMutex());
    for (const CimProperty* property : instance.getKeys()) {
        const CimValue value = property->getValue();
        path.m_keys.push_back(
            {property->getName(), value.scalar() ? *value.scalar() : CimScalar(std::string())});
    }
    return path;
}

std::string CimPath::toString() const {
    if (!isValid()) return m_unparsed;
    std::string text;
    if (!m_host.empty()) text += "//" + m_host + "/";
    if (!m_namespace.empty()) text += m_namespace + ":";
    text += m_className;
    char separator = '.';
    for (const CimKey& key : m_keys) {
        text += separator;
        text += key.name + "=" + keyText(key.value);
        separator = ',';
    }
    return text;
}

void CimPath::setNamespace(std::string_view name) {
    while (name.starts_with('/'))
        name.remove_prefix(1);
    while (name.ends_with('/'))
        name.remove_suffix(1);
    m_namespace = name;
}

void CimPath::completeNamespace(std::string_view name) {
    if (isValid() && m_namespace.empty()) setNamespace(name);
    for (CimKey& key : m_keys) {
        if (auto* reference = std::get_if<CimPath>(&key.value)) reference->completeNamespace(name);
    }
}

bool CimPath::isSameObjectAs(const CimPath& other) const {
    if (!isValid() || !other.isValid() || m_keys.size() != other.m_keys.size()) return false;
    if (!sameName(m_className, other.m_className)) return false;
    if (!m_namespace.empty() && !other.m_namespace.empty() && !sameName(m_namespace, other.m_namespace))
        return false;
    return std::all_of(m_keys.begin(), m_keys.end(), [&](const CimKey& key) {
        const auto match =
            std::find_if(other.m_keys.begin(), other.m_keys.end(),
                         [&](const CimKey& candidate) { return sameName(candidate.name, key.name); });
        return match != other.m_keys.end() && sameValue(key.value, match->value);
    });
}

bool CimPath::isSameObjectAs(const CimInstance& instance) const {
    if (!isValid() || !sameName(m_className, instance.getCreationClassName())) return false;
    const RecursiveLocker lock(instance.getMutex());
    const std::vector<CimProperty*> properties = instance.getKeys();
    if (properties.size() != m_keys.size()) return false;
    return std::all_of(properties.begin(), properties.end(), [&](const CimProperty* property) {
        const auto key = std::find_if(m_keys.begin(), m_keys.end(), [&](const CimKey& candidate) {
            return sameName(candidate.name, property->getName());
        });
        if (key == m_keys.end()) return false;
        const CimValue value = property->getValue();
        return value.scalar() != nullptr && sameValue(key->value, *value.scalar());
    });
}

}  // namespace core
