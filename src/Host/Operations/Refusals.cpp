#include "Host/Operations/Handlers.h"

namespace host {

cimxml::IntrinsicResult notSupported(const OperationContext& context, const Parameters&) {
    throw core::CimError(core::CimStatus::NotSupported,
                         "operation " + std::string(context.operation) + " is not supported");
}

cimxml::IntrinsicResult refuseQuery(const OperationContext&, const Parameters& parameters) {
    throw core::CimError(core::CimStatus::QueryLanguageNotSupported,
                         "queries in " + parameters.text("QueryLanguage") + " are not supported");
}

}  // namespace host
