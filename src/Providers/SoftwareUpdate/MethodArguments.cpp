#include "Providers/SoftwareUpdate/MethodArguments.h"

#include "Framework/Model/CimProperties.h"
#include "Framework/Model/CimPropertyRef.h"
#include "Providers/SoftwareUpdate/UpdateExceptions.h"
#include "Utils/Utils.h"

namespace MethodArguments {

namespace {

template <class Kind = core::CimProperty>
Kind& require(const core::CimPropertyList& arguments, const char* name) {
    auto* argument = dynamic_cast<Kind*>(arguments.getPropertyByName(name));
    if (argument == nullptr) throw utils::EUnspecifiedError(utils::formatStr("Expected %s argument", name));
    return *argument;
}

}  // namespace

void requirePresent(const core::CimPropertyList& arguments, std::initializer_list<const char*> names) {
    for (const char* name : names)
        require(arguments, name);
}

void requireNotNull(const core::CimPropertyList& arguments, std::initializer_list<const char*> names) {
    for (const char* name : names) {
        if (!isNull(arguments, name)) continue;
        throw utils::EUnspecifiedError(
            utils::formatStr("%s argument is set to NULL. It is not allowed", name));
    }
}

bool isNull(const core::CimPropertyList& arguments, const char* name) {
    return require(arguments, name).IsNull();
}

std::string text(const core::CimPropertyList& arguments, const char* name) {
    return require<core::CimPropertyString>(arguments, name).get();
}

std::vector<unsigned short> codes(const core::CimPropertyList& arguments, const char* name) {
    return require<core::CimPropertyUint16_arr>(arguments, name).get();
}

std::vector<std::string> texts(const core::CimPropertyList& arguments, const char* name) {
    return require<core::CimPropertyString_arr>(arguments, name).get();
}

core::CimPath path(const core::CimPropertyList& arguments, const char* name) {
    return require<core::CimPropertyRef>(arguments, name).getPath();
}

void setCodes(const core::CimPropertyList& arguments, const char* name, std::vector<unsigned short> codes) {
    require<core::CimPropertyUint16_arr>(arguments, name) = std::move(codes);
}

}  // namespace MethodArguments
