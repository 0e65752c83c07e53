// SPDX-License-Identifier: Apache-2.0
#include "Host/Server/AnswerBody.h"

#include <memory>

#include "CimXml/Response.h"

namespace host {

namespace {

/// What the HTTP library owns, since it may send the body after our last function has returned.
struct AnswerBody {
    std::optional<AnswerCharge> charge;  // first: given back when the pieces have gone
    cimxml::Pieces pieces;
    std::size_t piece = 0;   ///< the one that is sent
    std::size_t offset = 0;  ///< how much of it was
};

void freeBody(void* body) {
    delete static_cast<AnswerBody*>(body);
}

/// The library asks for the bytes in order, and never beyond the end.
ssize_t giveBytes(void* from, std::uint64_t, char* to, std::size_t most) {
    AnswerBody& body = *static_cast<AnswerBody*>(from);
    while (body.offset == body.pieces[body.piece].size()) {
        ++body.piece;
        body.offset = 0;
    }
    const std::size_t given = body.pieces[body.piece].copy(to, most, body.offset);
    body.offset += given;
    return static_cast<ssize_t>(given);
}

}  // namespace

// Several pieces are copied block by block. A list of their places would spare that, but the library puts the
// list beside the request's headers, and aborts where a client has left no room for it there.
MHD_Response* makeResponse(HttpAnswer& answer) {
    constexpr std::size_t kBlock = std::size_t{32} << 10;
    std::unique_ptr<AnswerBody> body(new AnswerBody{std::move(answer.charge), std::move(answer.body)});
    cimxml::Pieces& pieces = body->pieces;
    const bool isWhole = pieces.size() <= 1;
    if (pieces.empty()) pieces.emplace_back();
    MHD_Response* response = isWhole ? ::MHD_create_response_from_buffer_with_free_callback_cls(
                                           pieces.front().size(), pieces.front().data(), freeBody, body.get())
                                     : ::MHD_create_response_from_callback(cimxml::sizeOf(pieces), kBlock,
                                                                           giveBytes, body.get(), freeBody);
    if (response != nullptr) static_cast<void>(body.release());
    return response;
}

}  // namespace host
