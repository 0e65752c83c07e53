#include "Host/Server/CimHandler.h"

#include "CimXml/Request.h"
#include "CimXml/Response.h"
#include "CimXml/WireError.h"
#include "Utils/Log.h"

namespace host {

namespace {

/// The name by which the client reached us, for paths that it may come back with.
std::string hostOf(const HttpHead& head) {
    return head.host.empty() ? "localhost" : head.host;
}

}  // namespace

HttpAnswer answerBody(Dispatcher& dispatcher, const HttpHead& head, const Identity& identity,
                      std::string_view body) {
    try {
        const cimxml::Request request = cimxml::readRequest(body);
        cimxml::checkHeadersAgainst(head.cim, request);
        const Caller caller{identity.user, identity.isAdministrator, hostOf(head)};
        QUENX_DEBUG("%s of %s from %s", request.name().c_str(), identity.user.c_str(), head.address.c_str());
        const cimxml::Response response = dispatcher.dispatch(request, caller);
        return {200,
                {{"Content-Type", "application/xml; charset=\"utf-8\""}, {"CIMOperation", "MethodResponse"}},
                cimxml::writeResponse(response)};
    } catch (const cimxml::WireError& error) {
        QUENX_DEBUG("refused a request from %s: %s", head.address.c_str(), error.what());
        return HttpAnswer::withHeader(static_cast<unsigned int>(cimxml::httpStatus(error.fault())),
                                      "CIMError", cimxml::cimErrorHeader(error.fault()));
    }
}

}  // namespace host
