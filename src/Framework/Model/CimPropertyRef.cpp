// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/CimPropertyRef.h"

#include "Framework/Model/CimInstance.h"

namespace core {

CimPropertyRef::CimPropertyRef(const char* name, CimInstance* owner)
    : CimProperty(name, owner, CimType::Reference, false) {}

std::string CimPropertyRef::toString() {
    return getPath().toString();
}

CimType CimPropertyRef::getType() {
    return CimProperty::getType();
}

void CimPropertyRef::modify(CimProperty* requested) {
    CimProperty::modify(requested);
}

void CimPropertyRef::verify(CimProperty* requested) {
    CimProperty::verify(requested);
}

CimPath CimPropertyRef::getPath() const {
    const Guard guard(*this);
    return isNull() ? CimPath() : *m_path;
}

void CimPropertyRef::setPath(CimPath path) {
    auto shared = std::make_shared<const CimPath>(std::move(path));
    const Guard guard(*this);
    m_path = std::move(shared);
    m_target.reset();
    changed();
}

std::shared_ptr<CimInstance> CimPropertyRef::getInstance() const {
    const Guard guard(*this);
    return isNull() ? nullptr : m_target.lock();
}

void CimPropertyRef::assign(const CimInstance* target) {
    if (target == nullptr) {
        setNull();
        return;
    }
    // Read the target before locking the owner: two instances are never locked at once.
    auto path = target->getPath();
    auto hold = std::const_pointer_cast<CimInstance>(target->weak_from_this().lock());
    const Guard guard(*this);
    m_path = std::move(path);
    m_target = hold;
    changed();
}

void CimPropertyRef::load(CimValue& value) const {
    value.data = CimScalar(*m_path);
}

void CimPropertyRef::store(const CimValue& value) {
    m_path = std::make_shared<const CimPath>(std::get<CimPath>(*value.scalar()));
    m_target.reset();
}

}  // namespace core
