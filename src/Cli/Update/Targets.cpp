// SPDX-License-Identifier: Apache-2.0
#include "Cli/Update/Targets.h"

#include <fnmatch.h>

#include <algorithm>
#include <functional>
#include <map>

namespace cli {

namespace {

bool matches(const Adapter& adapter, const std::string& pattern) {
    const auto isLike = [&](const std::string& text) {
        return !text.empty() && ::fnmatch(pattern.c_str(), text.c_str(), 0) == 0;
    };
    // The domain 0 is not shown, and may be named all the same.
    const std::string& address = adapter.pciAddress;
    const bool isWithoutDomain = address.size() == std::string_view("03:00.0").size();
    return pattern.empty() || isLike(adapter.name) || isLike(address) ||
           (isWithoutDomain && isLike("0000:" + address));
}

/// The options for each image, one after the other.
std::vector<UpdateOptions> optionsOf(const ManyOptions& many, const UpdateOptions& update) {
    if (many.images.empty()) return {update};
    std::vector<UpdateOptions> options;
    for (const std::string& image : many.images) {
        options.push_back(update);
        options.back().image = image;
    }
    return options;
}

/// At once and for all adapters: to write to some of them and then say so would leave a mess.
void requireImage(const Candidate& candidate) {
    if (candidate.image && candidate.image->problem) {
        const Explanation& problem = *candidate.image->problem;
        throw CommandError(problem.status, problem.message, problem.advice);
    }
    if (candidate.verdict && candidate.verdict->status == ma::PrepareStatus::InvalidParameter)
        throw CommandError(ExitStatus::Failed, sentence(candidate.uri + ": " + candidate.verdict->reason),
                           "Name a complete firmware image.");
}

/// Notes which images were of use, whether or not the adapter gets them.
class Chooser {
  public:
    Chooser(const Connection& connection, const ManyOptions& many, const UpdateOptions& update)
        : m_connection(connection),
          m_isFit(many.isFit),
          m_options(optionsOf(many, update)),
          m_isUsed(m_options.size()) {}

    /// The image that the adapter gets; nothing when none fits.
    std::optional<Candidate> choose(const Adapter& adapter) {
        std::vector<Candidate> fitting;
        for (std::size_t i = 0; i < m_options.size(); ++i) {
            Candidate candidate = makeCandidate(m_connection, adapter, m_options[i]);
            requireImage(candidate);
            if (m_isFit && candidate.fits() == Candidate::Answer::No) continue;
            m_isUsed[i] = true;
            fitting.push_back(std::move(candidate));
        }
        if (fitting.empty()) return std::nullopt;
        // What names its cards goes before what may be for any.
        const auto namesCard = [](const Candidate& each) { return each.fits() == Candidate::Answer::Yes; };
        if (std::ranges::any_of(fitting, namesCard)) std::erase_if(fitting, std::not_fn(namesCard));
        if (fitting.size() > 1)
            throw CommandError(
                ExitStatus::WrongUse,
                fitting[0].uri + " and " + fitting[1].uri + " may both be for " + adapter.name + ".",
                "Give one of them, or choose adapters with --match.");
        return std::move(fitting.front());
    }

    std::vector<std::string> unused() const {
        std::vector<std::string> images;
        for (std::size_t i = 0; i < m_options.size(); ++i)
            if (!m_isUsed[i]) images.push_back(imageUri(m_options[i].image));
        return images;
    }

  private:
    const Connection& m_connection;
    const bool m_isFit;
    const std::vector<UpdateOptions> m_options;
    std::vector<bool> m_isUsed;
};

}  // namespace

std::string cardOf(const Adapter& adapter) {
    if (!adapter.boardSerialNumber.empty()) return "board " + adapter.boardSerialNumber;
    if (!adapter.serialNumber.empty()) return "serial " + adapter.serialNumber;
    const std::string place = adapter.pciAddress.substr(0, adapter.pciAddress.rfind('.'));
    return place.empty() ? "adapter " + adapter.name : "slot " + place;
}

std::vector<Adapter> matchingAdapters(const Connection& connection, const std::string& pattern) {
    std::vector<Adapter> adapters = readAdapters(*connection.operations);
    if (adapters.empty())
        throw CommandError(ExitStatus::NotFound, "There are no adapters.", adviceForNoAdapters(connection));
    std::vector<std::string> names;
    for (const Adapter& adapter : adapters)
        names.push_back(adapter.name);
    std::erase_if(adapters, [&](const Adapter& adapter) { return !matches(adapter, pattern); });
    if (adapters.empty())
        throw CommandError(ExitStatus::NotFound, "No adapter matches \"" + pattern + "\".",
                           "The adapters are " + joined(names) + ".");
    return adapters;
}

Targets chooseTargets(const Connection& connection, const ManyOptions& many, const UpdateOptions& update) {
    Targets targets;
    Chooser chooser(connection, many, update);
    std::map<std::string, std::string> cards;
    for (const Adapter& adapter : matchingAdapters(connection, many.match)) {
        std::optional<Candidate> candidate = chooser.choose(adapter);
        if (!candidate) continue;
        const auto [card, isFirst] = cards.emplace(cardOf(adapter), adapter.name);
        if (isFirst)
            targets.candidates.push_back(*std::move(candidate));
        else
            targets.sameCard.push_back({adapter, card->second});
    }
    targets.unused = chooser.unused();
    return targets;
}

}  // namespace cli
