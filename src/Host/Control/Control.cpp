// SPDX-License-Identifier: Apache-2.0
#include "Host/Control/Control.h"

#include <algorithm>
#include <nlohmann/json.hpp>

#include "Control/Sha256.h"
#include "Framework/Classes/RequestScope.h"
#include "Framework/Model/CimError.h"
#include "Framework/Requests/Audit.h"
#include "Framework/Requests/PolicyDecision.h"
#include "Host/Control/ControlAnswer.h"
#include "Providers/Schema/ProviderInterfaces.h"

namespace host {

namespace {

using Json = nlohmann::json;

constexpr std::size_t kLargestBody = std::size_t{64} << 10;  // of JSON

/// The service of this process. Good until the scope of the request ends.
update::ImageCheck& serviceOf(core::CimOperations& operations) {
    for (core::CimPath& path : operations.enumerateInstanceNames("Quenx_SoftwareInstallationService"))
        if (update::ImageCheck* service = update::findImageCheck(path)) return *service;
    throw ControlRefusal(501, "no software installation service is served here");
}

/// Who needs the adapter, or did.
const char* holderOf(const update::Claim& claim) {
    if (!claim.job.empty()) return control::kJobHolds;
    return claim.isAtWork ? control::kVerificationHolds : control::kCheckLeft;
}

HttpAnswer plainly(unsigned int status) {
    return HttpAnswer::withHeader(status, control::kHeader, control::kVersion);
}

}  // namespace

HttpAnswer controlAnswer(unsigned int status, const Json& body) {
    return {status,
            {{"Content-Type", "application/json"}, {control::kHeader, control::kVersion}},
            // Of a text that is not UTF-8 the odd bytes are replaced.
            {body.dump(-1, ' ', true, Json::error_handler_t::replace) + "\n"}};
}

HttpAnswer controlAnswer(const std::exception& error) {
    unsigned int status = 500;
    if (const auto* refusal = dynamic_cast<const ControlRefusal*>(&error)) status = refusal->status();
    if (dynamic_cast<const Json::exception*>(&error) != nullptr) status = 400;
    const auto* cim = dynamic_cast<const core::CimError*>(&error);
    if (cim != nullptr && cim->status() == core::CimStatus::AccessDenied) status = 403;
    return controlAnswer(status, {{"error", core::shownText(error)}});
}

/// A path, and what it takes.
struct ControlCall::Route {
    std::string_view path;  ///< one that ends with a slash is that of all below it
    std::string_view method;
    Privilege privilege;
    const char* operation;  ///< in the audit trail
    HttpAnswer (ControlCall::*run)();
};

const ControlCall::Route ControlCall::kRoutes[] = {
    {control::kStatus, "GET", Privilege::Read, "Status", &ControlCall::showStatus},
    {control::kCheck, "POST", Privilege::Administer, "CheckImage", &ControlCall::checkImage},
    {control::kTrust, "POST", Privilege::Administer, "JudgeImages", &ControlCall::judgeImages},
    {control::kRelease, "POST", Privilege::Administer, "ReleaseClaim", &ControlCall::releaseClaim},
    {control::kImages, "PUT", Privilege::Administer, "UploadImage", &ControlCall::storeImage}};

const ControlCall::Route* ControlCall::findRoute(std::string_view path) {
    const auto* found = std::ranges::find_if(kRoutes, [&](const Route& route) {
        return route.path.ends_with('/') ? path.starts_with(route.path) : path == route.path;
    });
    return found == std::end(kRoutes) ? nullptr : found;
}

std::optional<HttpAnswer> Control::checkHead(const HttpHead& head) {
    const ControlCall::Route* route = ControlCall::findRoute(head.path);
    if (route == nullptr) return plainly(404);
    if (head.method != route->method) {
        HttpAnswer answer = plainly(405);
        answer.headers.emplace_back("Allow", route->method);
        return answer;
    }
    if (head.isAmbiguous) return plainly(400);
    if (head.method == "GET") return std::nullopt;
    if (head.isChunked || head.contentLengths.empty()) return plainly(411);
    const auto length = contentLengthOf(head);
    if (!length) return plainly(400);
    if (head.method == "PUT") return std::nullopt;
    if (*length > kLargestBody) return plainly(413);
    // A browser sends this one only where a page of the same server asks for it.
    return head.contentType == "application/json" ? std::nullopt : std::optional(plainly(415));
}

ControlCall::ControlCall(Control& control, const HttpHead& head, Caller caller)
    : m_control(control), m_caller(std::move(caller)), m_route(*findRoute(head.path)) {
    guarded([&] {
        if (m_route.privilege == Privilege::Administer && !m_caller.isAdministrator) {
            core::NotedCall::noteReason(core::ReasonId::NotAdministrator);
            throw ControlRefusal(403, "user " + m_caller.user + " may only read");
        }
        if (m_route.method == "PUT") beginUpload(head);
    });
}

ControlCall::~ControlCall() {
    if (m_isAnswered) return;
    if (!m_refusal) m_outcome = "failed: the client went away before all had come";
    tell(m_refusal ? m_refusal->status : 0);
}

void ControlCall::tell(unsigned int status) noexcept try {
    m_isAnswered = true;
    if (m_route.privilege != Privilege::Administer) return;
    const core::AuditEvent event{asker(), m_route.operation, m_target, m_outcome, m_notes};
    if (status == 403)
        m_control.m_trail->refused(event, {});
    else
        core::audit(event);
} catch (const std::bad_alloc&) {
    // As in the rest of the log: a line that cannot be built is dropped.
}

core::Caller ControlCall::asker() const {
    return {.principal = m_caller.user, .address = m_caller.address, .front = "quenx-cimd"};
}

template <class Work>
void ControlCall::guarded(Work work) {
    const core::CallerScope scope(asker());
    const core::NotedCall noted;
    try {
        work();
    } catch (const std::exception& error) {
        m_refusal = controlAnswer(error);
        m_outcome = (m_refusal->status == 403 ? "denied: " : "failed: ") + core::shownText(error);
        m_upload.reset();
    }
    m_notes = noted.notes();
}

void ControlCall::take(const char* data, std::size_t size) {
    if (m_refusal) return;
    guarded([&] {
        if (m_upload)
            m_upload->add(data, size);
        else
            m_body.append(data, size);
    });
}

HttpAnswer ControlCall::finish() {
    HttpAnswer answer;
    if (!m_refusal) {
        guarded([&] {
            const core::RequestScope scope;
            answer = (this->*m_route.run)();
        });
    }
    if (m_refusal) answer = std::move(*m_refusal);
    answer.tellReason(m_notes.reason);
    tell(answer.status);
    return answer;
}

HttpAnswer ControlCall::showStatus() {
    const update::Claim claim = serviceOf(*m_control.m_operations).claim();
    if (claim.adapter.empty()) return controlAnswer(200, {{"claim", nullptr}});
    Json shown = {{"adapter", claim.adapter},
                  {"holder", holderOf(claim)},
                  {"isNeeded", claim.isAtWork},
                  {"user", nullptr},
                  {"job", nullptr},
                  {"since", core::datetimeText(claim.since)}};
    // As in the audit trail: who does what is nobody else's business.
    if (m_caller.isAdministrator && !claim.user.empty()) shown["user"] = claim.user;
    if (!claim.job.empty()) shown["job"] = claim.job;
    return controlAnswer(200, {{"claim", shown}});
}

HttpAnswer ControlCall::checkImage() {
    const Json order = Json::parse(m_body);
    m_target = order.at("target");
    const std::string uri = order.at("uri");
    const std::vector<std::uint16_t> options = order.at("options");
    const std::vector<std::string> values = order.at("values");
    const core::NotedCall noted;
    const unsigned int value =
        serviceOf(*m_control.m_operations).checkImage(uri, core::CimPath(m_target), options, values);
    m_outcome = core::outcomeOf(core::MethodResult{value, {}}) + ", URI=" + uri;
    Json answer = {{"returnValue", value}};
    if (const std::string& key = noted.notes().signedBy; !key.empty()) answer["signedBy"] = key;
    return controlAnswer(200, answer);
}

HttpAnswer ControlCall::judgeImages() {
    Json images = Json::array();
    update::ImageCheck& service = serviceOf(*m_control.m_operations);
    const std::vector<std::string> uris = Json::parse(m_body).at("uris");
    for (const std::string& uri : uris) {
        const update::ImageTrust trust = service.trustOf(uri);
        images.push_back({{"uri", uri},
                          {"asked", trust.isAsked},
                          {"key", trust.key},
                          {"reasonId", core::reasonCode(trust.reason)},
                          {"why", trust.why}});
    }
    return controlAnswer(200, {{"images", images}});
}

HttpAnswer ControlCall::releaseClaim() {
    m_target = Json::parse(m_body).at("adapter");
    switch (serviceOf(*m_control.m_operations).releaseClaim(m_target)) {
        case update::ClaimRelease::Freed:
            return controlAnswer(200, {{"released", true}});
        case update::ClaimRelease::NotHeld:
            m_outcome = "done: nothing held it";
            return controlAnswer(200, {{"released", false}});
        case update::ClaimRelease::AtWork:
            break;
    }
    throw ControlRefusal(409, "adapter " + m_target + " is being updated or checked just now");
}

void ControlCall::beginUpload(const HttpHead& head) {
    m_target = head.path.substr(control::kImages.size());
    const core::PolicyDecision decision;
    m_upload = m_control.m_spool.begin(m_target, *contentLengthOf(head), head.sum.value_or(""));
}

HttpAnswer ControlCall::storeImage() {
    const std::string path = m_upload->finish();
    return controlAnswer(200, {{"uri", "file://" + path}});
}

}  // namespace host
