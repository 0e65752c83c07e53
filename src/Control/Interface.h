// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string_view>

/// What quenx-cimd serves beside CIM-XML, for quenxctl: paths of its own on the same addresses, with the same
/// users. Bodies are JSON but for images. Each answer has the header kHeader, by which a client tells it from
/// that of a server without these paths; a refusal is {"error": TEXT}. docs/object-manager.md describes them.
namespace control {

/// All paths begin with it.
inline constexpr std::string_view kRoot = "/quenx/v1/";
inline constexpr const char* kHeader = "Quenx-Interface";
inline constexpr const char* kVersion = "1";
/// "QX-0123": why a call was refused. On answers to CIM-XML, too, whose messages have no place for it.
inline constexpr const char* kReasonHeader = "Quenx-Reason";

/// GET: {"claim": null} or {"claim": {"adapter", "holder", "user", "job", "since"}}. `holder` is one of the
/// three below; `since` is a CIM datetime; `user` is null for those who may only read.
inline constexpr const char* kStatus = "/quenx/v1/status";
inline constexpr const char* kJobHolds = "job";
inline constexpr const char* kVerificationHolds = "verification";
inline constexpr const char* kCheckLeft = "check";

/// POST {"uri", "target", "options", "values"}, as InstallFromURI takes them: {"returnValue": NUMBER}, as
/// that method would return, 0 for an image that could be installed, and "signedBy", the key by which the
/// policy trusts it, where it asks for one. No adapter is claimed.
inline constexpr const char* kCheck = "/quenx/v1/check";

/// POST {"uris"}: {"images": [{"uri", "asked", "key", "reasonId", "why"}]}, what the policy says of each.
inline constexpr const char* kTrust = "/quenx/v1/trust";

/// POST {"adapter"}: {"released": BOOLEAN}; 409 for a claim that is still needed.
inline constexpr const char* kRelease = "/quenx/v1/release";

/// PUT of a file, at this + SHA-256 of the image + "/" + NAME: {"uri": TEXT}. What belongs to an image, such
/// as its signature, goes to the same place, with one of the ends below.
inline constexpr std::string_view kImages = "/quenx/v1/images/";
/// The ends of the names of what may belong to an image: its signature, its manifest and the signature of
/// that.
inline constexpr std::string_view kCompanions[] = {".p7s", ".manifest.toml", ".manifest.p7s"};
/// The SHA-256 of the file that is sent, in hexadecimal digits.
inline constexpr const char* kSumHeader = "Quenx-SHA256";

}  // namespace control
