// SPDX-License-Identifier: Apache-2.0
// Which connection has to go when there are too many.
#include <algorithm>

#include "Host/Authentication/ClientAddress.h"
#include "Host/Server/ConnectionWatch.h"
#include "Utils/Log.h"

namespace host {

namespace {

constexpr std::size_t kMaxKnown = 1024;  // networks
constexpr unsigned int kUserShare = 4;   // a user who has more than one in so many has to make room
constexpr unsigned int kEnded = 16;      // connections whose threads still end, and a quarter of the limit
constexpr std::size_t kShownName = 64;   // of a user, in the log
constexpr std::chrono::minutes kBetweenNotes{1};
constexpr std::chrono::milliseconds kMoment{100};

/// What nobody gets from whose network nobody has logged in.
unsigned int keptForKnown(const ServerLimits& limits) {
    return limits.connections / 4;
}

using Counts = std::map<std::string, unsigned int>;

Counts::const_iterator mostFrequent(const Counts& counts) {
    return std::max_element(counts.begin(), counts.end(),
                            [](const auto& left, const auto& right) { return left.second < right.second; });
}

}  // namespace

bool ConnectionWatch::Watched::isLocal() const {
    return network == kLocalAddress;
}

unsigned int ConnectionWatch::mostOf(const ServerLimits& limits) {
    return limits.connections + limits.connections / 4 + kEnded + kLocalConnections;
}

std::size_t ConnectionWatch::count(const Condition& isMeant) const {
    return static_cast<std::size_t>(std::count_if(m_watched.begin(), m_watched.end(), [&](const auto& each) {
        return !each.second.isEnded && isMeant(each.second);
    }));
}

bool ConnectionWatch::endOldest(const Condition& isMeant) {
    auto oldest = m_watched.end();
    for (auto each = m_watched.begin(); each != m_watched.end(); ++each) {
        if (each->second.isEnded || !isMeant(each->second)) continue;
        if (oldest == m_watched.end() || each->second.number < oldest->second.number) oldest = each;
    }
    if (oldest == m_watched.end()) return false;
    end(oldest->first, oldest->second);
    return true;
}

bool ConnectionWatch::endOldestOfMost(const Condition& isMeant) {
    // Not just the oldest: whoever opens a thousand a second would drop those of others before they log in.
    Counts counts;
    for (const auto& [socket, watched] : m_watched) {
        if (!watched.isEnded && isMeant(watched)) ++counts[watched.network];
    }
    const auto most = mostFrequent(counts);
    // Of all networks that have as many, or one of the attacker's choice would always give way to his others.
    return most != counts.end() && endOldest([&](const Watched& each) {
               return isMeant(each) && counts.at(each.network) == most->second;
           });
}

std::string ConnectionWatch::busiestUser(const Condition& isMeant, unsigned int limit) const {
    Counts counts;
    for (const auto& [socket, watched] : m_watched) {
        if (!watched.isEnded && watched.isLoggedIn() && isMeant(watched)) ++counts[watched.user];
    }
    const auto most = mostFrequent(counts);
    return most == counts.end() || most->second <= std::max(1U, limit / kUserShare) ? "" : most->first;
}

bool ConnectionWatch::endOneOfBusiestUser(const Condition& isMeant, unsigned int limit, Room& room) {
    const std::string user = busiestUser(isMeant, limit);
    if (user.empty()) return false;
    room.closed = "one of user " + utils::escapeForLog(user, kShownName) + ", who has the most,";
    const auto isTheirs = [&](const Watched& each) { return each.user == user && isMeant(each); };
    return endOldest([&](const Watched& each) { return isTheirs(each) && each.isIdle; }) ||
           endOldest(isTheirs);
}

bool ConnectionWatch::makeRoom(const std::string& network, Room& room) {
    const auto isHere = [&](const Watched& each) { return each.network == network; };
    const auto isNew = [](const Watched& each) { return !each.isLocal() && !each.isLoggedIn(); };
    const auto isStranger = [&](const Watched& each) { return isNew(each) && !isKnown(each.network); };
    if (network == kLocalAddress) {
        if (count(isHere) < kLocalConnections) return true;
        room.reached = "the " + std::to_string(kLocalConnections) + " connections of listen.socket";
        return endOldest([&](const Watched& each) { return isHere(each) && each.isIdle; });
    }
    if (count(isHere) >= m_limits.connectionsPerAddress) {
        room.reached =
            "limits.connections_per_address (" + std::to_string(m_limits.connectionsPerAddress) + ")";
        return endOldest([&](const Watched& each) { return isHere(each) && isNew(each); }) ||
               endOneOfBusiestUser(isHere, m_limits.connectionsPerAddress, room);
    }
    const auto isRemote = [](const Watched& each) { return !each.isLocal(); };
    const bool isFull =
        count(isRemote) >= m_limits.connections ||
        (!isKnown(network) && count(isStranger) >= m_limits.connections - keptForKnown(m_limits));
    if (!isFull) return true;
    room.reached = "limits.connections (" + std::to_string(m_limits.connections) + ")";
    // A user with more than his share gives way to newcomers of known networks, who need their time to log
    // in: were one of them the first to go, those who come all the time would end each other.
    return endOldestOfMost(isStranger) || endOneOfBusiestUser(isRemote, m_limits.connections, room) ||
           endOldestOfMost(isNew);
}

std::optional<std::uint64_t> ConnectionWatch::admit(int socket, const std::string& network,
                                                    const std::stop_token& stop) {
    Room room;
    std::optional<std::uint64_t> number;
    {
        std::unique_lock lock(m_mutex);
        const auto hasThreads = [&] {
            const auto others = std::count_if(m_watched.begin(), m_watched.end(),
                                              [](const auto& each) { return !each.second.isLocal(); });
            return others < static_cast<std::ptrdiff_t>(mostOf(m_limits) - kLocalConnections);
        };
        if (network != kLocalAddress && !m_closed.wait(lock, stop, hasThreads)) return std::nullopt;
        if (makeRoom(network, room)) {
            Watched& watched = m_watched[socket] = {};
            watched.network = network;
            watched.deadline = Clock::now() + m_limits.headerTime;
            number = watched.number = ++m_lastNumber;
        }
    }
    if (!room.reached.empty()) {
        noteLimit(room.reached,
                  number ? "closed " + room.closed + " for a new one from " + network
                         : "refused a connection from " + network + ", since all others are in use");
    }
    return number;
}

void ConnectionWatch::giveUpOne(const std::stop_token& stop) {
    std::unique_lock lock(m_mutex);
    endOldestOfMost([](const Watched& each) { return !each.isLocal() && !each.isLoggedIn(); });
    m_closed.wait_for(lock, stop, kMoment, [&, before = m_closures] { return m_closures != before; });
}

void ConnectionWatch::loggedIn(int socket, const std::string& user) {
    const std::lock_guard lock(m_mutex);
    const auto found = m_watched.find(socket);
    if (found == m_watched.end()) return;
    found->second.user = user;
    m_known[found->second.network] = {user, ++m_lastNumber};
    if (m_known.size() <= kMaxKnown) return;
    // One of the user with the most: others' networks must not be forgotten because one has so many.
    Counts counts;
    for (const auto& [network, known] : m_known)
        ++counts[known.user];
    const std::string most = mostFrequent(counts)->first;
    m_known.erase(std::min_element(m_known.begin(), m_known.end(), [&](const auto& left, const auto& right) {
        return std::pair(left.second.user != most, left.second.last) <
               std::pair(right.second.user != most, right.second.last);
    }));
}

void ConnectionWatch::loggedOut(int socket) {
    const std::lock_guard lock(m_mutex);
    const auto found = m_watched.find(socket);
    if (found != m_watched.end()) found->second.user.clear();
}

void ConnectionWatch::doubtLogins() {
    const std::lock_guard lock(m_mutex);
    for (auto& [socket, watched] : m_watched) {
        if (watched.isIdle && !watched.isLocal()) watched.user.clear();
    }
}

void ConnectionWatch::noteLimit(const std::string& limit, const std::string& what) {
    unsigned int silent = 0;
    {
        const std::lock_guard lock(m_noteMutex);
        Note& note = m_notes[limit];
        const auto now = Clock::now();
        if (now < note.next) {
            ++note.silent;
            return;
        }
        silent = std::exchange(note.silent, 0);
        note.next = now + kBetweenNotes;
    }
    const std::string more = silent == 0 ? "" : "; this was so " + std::to_string(silent) + " times before";
    QUENX_ERROR_TEXT(limit + " reached: " + what + more);
}

}  // namespace host
