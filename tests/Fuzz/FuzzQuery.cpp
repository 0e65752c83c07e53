// SPDX-License-Identifier: Apache-2.0
#include <optional>

#include "Framework/Model/CimError.h"
#include "Fuzz/Fuzz.h"
#include "Indications/QueryObjects.h"

namespace {

std::optional<indications::Query> read(const std::string& text) {
    try {
        return indications::Query(text);
    } catch (const core::CimError& error) {
        require(error.status() == core::CimStatus::InvalidQuery ||
                error.status() == core::CimStatus::QueryFeatureNotSupported);
        return std::nullopt;
    }
}

}  // namespace

void fuzz(const std::string& text) {
    static const auto before = test::job(4, 50, {2UL});
    static const auto event = test::indication(test::job(7, 100, {2UL, 17UL}), before);
    const std::optional<indications::Query> query = read(text);
    if (!query) return;
    const bool isTrue = query->matches(*event);
    require(query->matches(*event) == isTrue);
    query->wants("SourceInstance", "JobState");
    try {
        query->check(test::vocabulary());
    } catch (const core::CimError&) {
        // It names what is not there, and could be asked all the same.
    }
    // What is true is not also false.
    const std::size_t where = text.find("WHERE");
    if (where == std::string::npos) return;
    const auto other = read(text.substr(0, where) + "WHERE NOT (" + text.substr(where + 5) + ")");
    require(!other || !isTrue || !other->matches(*event));
}
