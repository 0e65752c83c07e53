// SPDX-License-Identifier: Apache-2.0
#include "Cli/Connection/ServerControl.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <cerrno>
#include <filesystem>
#include <nlohmann/json.hpp>
#include <system_error>

#include "Cli/Display/Messages.h"
#include "Control/Interface.h"
#include "Control/Sha256.h"
#include "Framework/Model/CimError.h"
#include "Framework/Requests/NotedCall.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

using nlohmann::json;

[[noreturn]] void refuseAnswer() {
    throw NoAnswer(ExitStatus::Failed, "The server's answer cannot be read.",
                   "Check that --server names quenx-cimd of this version.");
}

/// What the answer has under the name; refuses one that does not have it.
template <class Value>
Value valueOf(const json& answer, const char* name) try {
    return answer.at(name).get<Value>();
} catch (const json::exception&) {
    refuseAnswer();
}

std::string textOrNone(const json& answer, const char* name) {
    return answer.contains(name) && answer.at(name).is_string() ? answer.at(name).get<std::string>() : "";
}

/// A file that is to be sent: only a regular one is opened, so nothing waits for a pipe.
struct FileToSend {
    explicit FileToSend(const std::string& path)
        : file(os::isSpecialFile(path) ? -1 : ::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK)) {
        const int error = errno;
        struct stat status {};
        const bool isThere = file.isOpen() && ::fstat(file.number(), &status) == 0;
        if (isThere && !S_ISREG(status.st_mode)) refuse(path, "is not a regular file");
        if (!isThere && os::isSpecialFile(path)) refuse(path, "is not a regular file");
        if (!isThere) {
            const Explanation why = cannotRead(path, error);
            throw CommandError(why.status, why.message, why.advice);
        }
        bytes = static_cast<std::uint64_t>(status.st_size);
        if (bytes == 0) refuse(path, "is empty");
        sum = control::sha256OfFile(file.number());
        ::lseek(file.number(), 0, SEEK_SET);
    }
    [[noreturn]] static void refuse(const std::string& path, const std::string& why) {
        throw CommandError(ExitStatus::Failed, path + " " + why + ".", "Name a complete firmware image.");
    }

    const os::Descriptor file;
    std::uint64_t bytes = 0;
    std::string sum;
};

/// As a part of a path in a URL (RFC 3986).
std::string encoded(const std::string& name) {
    std::string text;
    for (const char c : name) {
        const bool isPlain = utils::isLetter(c) || utils::isDigit(c) ||
                             std::string_view("._-~").find(c) != std::string_view::npos;
        text += isPlain ? std::string(1, c) : utils::formatStr("%%%02X", static_cast<unsigned char>(c));
    }
    return text;
}

}  // namespace

std::string HeldAdapter::text() const {
    const std::string what = holder == control::kJobHolds            ? job
                             : holder == control::kVerificationHolds ? "a verification"
                                                                     : "a check";
    return what + (user.empty() ? "" : " of " + user);
}

void to_json(nlohmann::ordered_json& json, const HeldAdapter& held) {
    const auto orNull = [](const std::string& text) {
        return text.empty() ? nlohmann::ordered_json() : nlohmann::ordered_json(text);
    };
    json = {{"holder", held.holder},
            {"user", orNull(held.user)},
            {"job", orNull(held.job)},
            {"since", orNull(held.since ? core::datetimeText(*held.since) : "")},
            {"needed", held.isNeeded}};
}

std::optional<json> ServerControl::call(const ControlRequest& request) {
    const HttpReply reply = m_client.send(request);
    const json answer = json::parse(reply.body, nullptr, false);
    if (!reply.isControl) {
        // Whoever is not let in is told so by any server; else it is one without these paths.
        if (reply.status == 401 || reply.status == 403 || reply.status == 503) requireOk(reply);
        return std::nullopt;
    }
    if (reply.status == 200 && answer.is_object()) return answer;
    const std::string why = answer.is_object() ? textOrNone(answer, "error") : "";
    if (reply.status == 403 && !why.empty()) throw core::CimError(core::CimStatus::AccessDenied, why);
    if (!why.empty()) throw CommandError(ExitStatus::Failed, sentence("the server refuses: " + why), "");
    requireOk(reply);
    refuseAnswer();
}

std::optional<json> ServerControl::post(const char* path, const json& body) {
    return call({.method = "POST",
                 .path = path,
                 .headers = {"Content-Type: application/json", "Expect:"},
                 .body = body.dump(-1, ' ', true, json::error_handler_t::replace)});
}

std::optional<HeldAdapter> ServerControl::held() {
    const std::optional<json> answer = call({.method = "GET", .path = control::kStatus});
    if (!answer) return std::nullopt;
    const json claim = valueOf<json>(*answer, "claim");
    if (claim.is_null()) return HeldAdapter{};
    return HeldAdapter{valueOf<std::string>(claim, "adapter"),
                       valueOf<std::string>(claim, "holder"),
                       textOrNone(claim, "user"),
                       textOrNone(claim, "job"),
                       core::parseDatetime(textOrNone(claim, "since")),
                       valueOf<bool>(claim, "isNeeded")};
}

std::optional<bool> ServerControl::release(const std::string& adapter) {
    const auto answer = post(control::kRelease, {{"adapter", adapter}});
    return answer ? std::optional(valueOf<bool>(*answer, "released")) : std::nullopt;
}

std::optional<std::uint32_t> ServerControl::checkImage(const std::string& uri, const std::string& target,
                                                       const std::vector<std::uint16_t>& options,
                                                       const std::vector<std::string>& values) {
    const auto answer =
        post(control::kCheck, {{"uri", uri}, {"target", target}, {"options", options}, {"values", values}});
    if (!answer) return std::nullopt;
    core::NotedCall::noteKey(textOrNone(*answer, "signedBy"));
    return valueOf<std::uint32_t>(*answer, "returnValue");
}

std::optional<std::vector<update::ImageTrust>> ServerControl::trustOf(const std::vector<std::string>& uris) {
    const std::optional<json> answer = post(control::kTrust, {{"uris", uris}});
    if (!answer) return std::nullopt;
    std::vector<update::ImageTrust> images;
    for (const json& image : valueOf<json>(*answer, "images"))
        images.push_back({valueOf<bool>(image, "asked"), textOrNone(image, "key"),
                          core::parseReasonCode(textOrNone(image, "reasonId")), textOrNone(image, "why")});
    if (images.size() != uris.size()) refuseAnswer();
    return images;
}

std::optional<std::string> ServerControl::sendFile(const std::string& file, const std::string& image) {
    // For several adapters the same file is sent once.
    if (const auto sent = m_sent.find({file, image}); sent != m_sent.end()) return sent->second;
    const FileToSend content(file);
    const std::string name = std::filesystem::path(file).filename().string();
    const std::string place = (image.empty() ? content.sum : image) + "/" + encoded(name);
    const auto answer = call({.method = "PUT",
                              .path = std::string(control::kImages) + place,
                              .headers = {std::string(control::kSumHeader) + ": " + content.sum},
                              .file = content.file.number(),
                              .fileBytes = content.bytes});
    if (!answer) return std::nullopt;
    return m_sent[{file, image}] = valueOf<std::string>(*answer, "uri");
}

std::optional<std::string> ServerControl::upload(const std::string& file) {
    const std::optional<std::string> uri = sendFile(file, "");
    if (!uri) return std::nullopt;
    // Its folder there is named after the image, and so are those of what belongs to it.
    const std::string image = std::filesystem::path(*uri).parent_path().filename().string();
    for (const std::string_view ending : control::kCompanions) {
        const std::string companion = file + std::string(ending);
        if (std::filesystem::exists(companion)) sendFile(companion, image);
    }
    return uri;
}

}  // namespace cli
