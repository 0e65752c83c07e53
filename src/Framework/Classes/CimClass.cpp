// SPDX-License-Identifier: Apache-2.0
#include "Framework/Classes/CimClass.h"

#include <new>

#include "Framework/Model/CimType.h"

namespace core {

namespace {

/// Clients may ask for the declaration of whatever they can enumerate.
ClassChain undeclared(const std::string& name) {
    auto declaration = std::make_shared<ClassDeclaration>();
    declaration->name = name;
    return {declaration};
}

}  // namespace

utils::SafeList<CimInstance*>::Iterator CimClass::getInstances() {
    return joinInstances({});
}

void CimClass::createInstance(CimInstance*) {}

void CimClass::enableIndications() {}

void CimClass::disableIndications() {}

CimClass::~CimClass() = default;

namespace {

/// One by one from the end: a vector's destructor promises no order, and later class objects may use earlier
/// ones.
void destroyFromTheEnd(std::vector<std::unique_ptr<ServedClass>>& served) {
    while (!served.empty())
        served.pop_back();
}

}  // namespace

CimClasses::~CimClasses() QUENX_NO_THREAD_SAFETY_ANALYSIS {
    // Without the lock, which nobody can want any more, and which a child may have got locked.
    destroyFromTheEnd(m_served);
}

void CimClasses::append(ServedClass served) {
    // Read once, here: requests look classes up by name all the time.
    served.name = served.object->getClassName();
    served.chain = served.info == nullptr ? undeclared(served.name) : declarationsOf(*served.info);
    for (const auto* level = served.info; level != nullptr; level = level->superclass) {
        for (const CimClassInfo* mentioned : level->mentioned)
            served.mentioned.push_back(declarationsOf(*mentioned));
    }
    // On the heap, since look-ups give out pointers that later additions must not move.
    auto kept = std::make_unique<ServedClass>(std::move(served));
    const utils::Mutex::AutoLocker lock(m_mutex);
    m_served.push_back(std::move(kept));
}

const ServedClass* CimClasses::find(std::string_view className) const {
    const utils::Mutex::AutoLocker lock(m_mutex);
    for (const auto& served : m_served) {
        if (sameName(served->name, className)) return served.get();
    }
    return nullptr;
}

std::vector<const ServedClass*> CimClasses::getAll() const {
    const utils::Mutex::AutoLocker lock(m_mutex);
    std::vector<const ServedClass*> all;
    all.reserve(m_served.size());
    for (const auto& served : m_served)
        all.push_back(served.get());
    return all;
}

void CimClasses::abandon() noexcept QUENX_NO_THREAD_SAFETY_ANALYSIS {
    // In a list that is never destroyed, and that leak checkers find.
    static auto* const abandoned = new (std::nothrow) std::vector<std::unique_ptr<ServedClass>>;
    for (auto& served : m_served) {
        try {
            if (abandoned != nullptr) abandoned->emplace_back().swap(served);
        } catch (const std::bad_alloc&) {
            // Then it is only let go of.
        }
        static_cast<void>(served.release());
    }
    m_served.clear();
}

void CimClasses::clear() {
    std::vector<std::unique_ptr<ServedClass>> released;
    {
        const utils::Mutex::AutoLocker lock(m_mutex);
        released.swap(m_served);
    }
    destroyFromTheEnd(released);
}

}  // namespace core
