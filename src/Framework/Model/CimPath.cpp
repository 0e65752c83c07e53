// SPDX-License-Identifier: Apache-2.0
// Object paths: their text form, and when two name the same object.
#include <algorithm>
#include <numeric>
#include <set>

#include "Framework/Model/CimValue.h"
#include "Utils/Utils.h"

namespace core {

namespace {

/// Bytes beyond ASCII belong to UTF-8, whose letters DSP0004 allows in names.
bool isNameStart(char c) {
    return utils::isLetter(c) || c == '_' || (c & 0x80) != 0;
}

bool isName(std::string_view text) {
    return !text.empty() && isNameStart(text.front()) &&
           std::ranges::all_of(text, [](char c) { return isNameStart(c) || utils::isDigit(c); });
}

std::string keyText(const CimScalar& value) {
    const std::string text = scalarText(value);
    const bool isQuoted = std::holds_alternative<std::string>(value) ||
                          std::holds_alternative<CimPath>(value) ||
                          std::holds_alternative<utils::Time>(value);
    return isQuoted ? utils::quoted(text) : text;
}

/// Reads the list of keys behind the class name.
class KeyReader {
  public:
    explicit KeyReader(std::string_view text) : m_rest(text) {}

    std::optional<std::vector<CimKey>> read() {
        std::vector<CimKey> keys;
        // A set, since a client may send thousands of keys.
        std::set<std::string> seen;
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
        // Nothing else tells how the number was declared; the first type that takes the text is the one that
        // writes it the same way again.
        for (const CimType type : {CimType::Uint64, CimType::Sint64, CimType::Boolean, CimType::Real64}) {
            if (auto value = parseScalar(type, text)) return value;
        }
        return std::nullopt;
    }

    std::string_view m_rest;
};

}  // namespace

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

std::string CimPath::toString() const {
    if (!isValid()) return m_unparsed;
    std::string text;
    if (!m_host.empty()) text.append("//").append(m_host).append("/");
    if (!m_namespace.empty()) text.append(m_namespace).append(":");
    text += m_className;
    char separator = '.';
    for (const CimKey& key : m_keys) {
        text += separator;
        text.append(key.name).append("=").append(keyText(key.value));
        separator = ',';
    }
    return text;
}

void CimPath::setNamespace(std::string_view name) {
    m_namespace = utils::trimOf(name, "/");
}

void CimPath::completeNamespace(std::string_view name) {
    if (isValid() && m_namespace.empty()) setNamespace(name);
    for (CimKey& key : m_keys) {
        if (auto* reference = std::get_if<CimPath>(&key.value)) reference->completeNamespace(name);
    }
}

void CimValue::completeNamespace(std::string_view name) {
    forEach([&](CimScalar& scalar) {
        if (auto* path = std::get_if<CimPath>(&scalar)) path->completeNamespace(name);
    });
}

std::size_t CimPath::hashOfKeys() const {
    // A sum, since keys come in any order.
    return std::accumulate(m_keys.begin(), m_keys.end(), std::size_t{0},
                           [](std::size_t sum, const CimKey& key) { return sum + hashOf(key.value); });
}

bool CimPath::isSameObjectAs(const CimPath& other) const {
    if (!isValid() || !other.isValid() || m_keys.size() != other.m_keys.size()) return false;
    if (!sameName(m_className, other.m_className)) return false;
    if (!m_namespace.empty() && !other.m_namespace.empty() && !sameName(m_namespace, other.m_namespace))
        return false;
    return std::all_of(m_keys.begin(), m_keys.end(), [&](const CimKey& key) {
        const CimKey* match = findByName(other.m_keys, key.name);
        return match != nullptr && sameValue(key.value, match->value);
    });
}

}  // namespace core
