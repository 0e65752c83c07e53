// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "Control/Interface.h"
#include "Framework/Requests/Caller.h"
#include "Framework/Requests/CimOperations.h"
#include "Framework/Requests/NotedCall.h"
#include "Host/Control/Spool.h"
#include "Host/Operations/AuditTrail.h"
#include "Host/Operations/Operations.h"
#include "Host/Server/HttpRequest.h"

namespace host {

/// What the daemon serves beside CIM-XML, see Control/Interface.h. Thread-safe.
class Control {
  public:
    /// @param spool  where images are put that clients send
    Control(std::shared_ptr<core::CimOperations> operations, std::shared_ptr<AuditTrail> trail, Spool& spool)
        : m_operations(std::move(operations)), m_trail(std::move(trail)), m_spool(spool) {}

    static bool serves(std::string_view path) { return path.starts_with(control::kRoot); }

    /// What the head of a request alone is refused for: path, method, length, content type. Nothing when the
    /// body may be read.
    static std::optional<HttpAnswer> checkHead(const HttpHead& head);

  private:
    friend class ControlCall;

    const std::shared_ptr<core::CimOperations> m_operations;
    const std::shared_ptr<AuditTrail> m_trail;
    Spool& m_spool;
};

/// One request to these paths, on the thread of its connection. Leaves an audit line for each that changes
/// something, looks at an image, or is denied.
class ControlCall {
  public:
    /// @param head  checked, of the call; has to outlive it
    ControlCall(Control& control, const HttpHead& head, Caller caller);
    ~ControlCall();
    ControlCall(const ControlCall&) = delete;
    ControlCall& operator=(const ControlCall&) = delete;

    /// Its body is not needed any more: finish() has the refusal.
    bool isRefused() const { return m_refusal.has_value(); }
    /// A piece of the body.
    void take(const char* data, std::size_t size);
    /// The body is whole, or the call is refused: does what is asked for.
    HttpAnswer finish();

  private:
    friend class Control;
    struct Route;
    static const Route kRoutes[];
    static const Route* findRoute(std::string_view path);

    template <class Work>
    void guarded(Work work);
    core::Caller asker() const;
    /// Leaves the audit line. Once.
    void tell(unsigned int status) noexcept;
    HttpAnswer showStatus();
    HttpAnswer checkImage();
    HttpAnswer judgeImages();
    HttpAnswer releaseClaim();
    HttpAnswer storeImage();
    void beginUpload(const HttpHead& head);

    Control& m_control;
    const Caller m_caller;
    const Route& m_route;
    std::string m_target;  ///< for the audit line
    std::string m_outcome = "done";
    core::CallNotes m_notes;
    std::string m_body;
    std::unique_ptr<Upload> m_upload;
    std::optional<HttpAnswer> m_refusal;
    bool m_isAnswered = false;
};

}  // namespace host
