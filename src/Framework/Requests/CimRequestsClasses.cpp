// Class declarations.
#include <algorithm>
#include <map>

#include "Framework/Requests/CimRequests.h"
#include "Framework/Requests/RequestTools.h"
#include "Framework/Requests/ServedModel.h"

namespace core {

namespace {

/// Whether the chain's first class is what an enumeration below the class asks for.
bool isWanted(const ClassChain& chain, const std::string& className, bool deep) {
    const ClassDeclaration& first = *chain.front();
    if (className.empty()) return deep || first.superclass.empty();
    if (sameName(first.name, className)) return false;
    return deep ? derivesFrom(chain, className) : sameName(first.superclass, className);
}

}  // namespace

std::vector<ClassDeclaration> CimRequests::enumerateClasses(const std::string& className, bool deep) const {
    const ServedModel model(*m_broker);
    if (!className.empty()) model.requireClass(className);
    std::map<std::string, std::shared_ptr<const ClassDeclaration>> found;
    for (const ModelClass& each : model.all()) {
        const ClassChain& chain = each.served->chain;
        for (auto first = chain.begin(); first != chain.end(); ++first) {
            const ClassChain rest(first, chain.end());
            if (isWanted(rest, className, deep)) found.emplace((*first)->name, *first);
        }
    }
    std::vector<ClassDeclaration> result;
    for (const auto& [name, declaration] : found)
        result.push_back(*declaration);
    return result;
}

ClassChain CimRequests::getClass(const std::string& className) const {
    ClassChain chain = ServedModel(*m_broker).chainOf(className);
    if (chain.empty()) throw CimError(CimStatus::NotFound, "no class " + className + " is served");
    return chain;
}

}  // namespace core
