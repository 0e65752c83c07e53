// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <algorithm>
#include <compare>
#include <cstdint>
#include <span>
#include <vector>

#include "Framework/Classes/InstanceList.h"
#include "Framework/Model/CimInstance.h"
#include "Framework/Model/CimValue.h"

namespace core {

/// Where in a snapshot the instances with certain keys are: sixteen bytes for each. Never changes.
class KeyIndex {
  public:
    struct Place {
        std::size_t hash;
        std::size_t position;
        auto operator<=>(const Place&) const = default;
    };

    /// Takes the lock of one instance after the other.
    /// @param keyChanges  how often keys of the list had changed before
    KeyIndex(const InstanceList::Snapshot& snapshot, std::uint32_t keyChanges) : m_keyChanges(keyChanges) {
        m_places.reserve(snapshot.size());
        for (std::size_t i = 0; i < snapshot.size(); ++i)
            m_places.push_back({snapshot[i]->hashOfKeys(), i});
        std::sort(m_places.begin(), m_places.end());
    }

    /// Where the path's instance may be, in the order of the list; a few others may be among them.
    std::span<const Place> placesOf(const CimPath& path) const {
        const std::size_t hash = path.hashOfKeys();
        const auto first = std::lower_bound(m_places.begin(), m_places.end(), Place{hash, 0});
        const auto last =
            std::find_if(first, m_places.end(), [hash](const Place& each) { return each.hash != hash; });
        return {first, last};
    }

    std::uint32_t keyChanges() const { return m_keyChanges; }

  private:
    std::vector<Place> m_places;
    const std::uint32_t m_keyChanges;
};

}  // namespace core
