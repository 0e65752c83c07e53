// SPDX-License-Identifier: Apache-2.0
#include "Indications/Subscriptions/StateFile.h"

#include <sys/stat.h>

#include <filesystem>
#include <nlohmann/json.hpp>

#include "Framework/Model/CimError.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/OwnFiles.h"
#include "Utils/Os/Linux/linux.h"

namespace indications {

namespace {

namespace fs = std::filesystem;
using Json = nlohmann::ordered_json;

constexpr int kVersion = 1;
/// What os::readTextFile() takes.
constexpr std::size_t kLargest = 1 << 20;

// A field that is empty is left out, one that is missing is empty.

void put(Json& json, const char* name, const std::string& text) {
    if (!text.empty()) json[name] = text;
}

std::string textOf(const Json& json, const char* name) {
    return json.value(name, "");
}

Json written(Json json, const Labels& labels) {
    put(json, "caption", labels.caption);
    put(json, "description", labels.description);
    put(json, "elementName", labels.elementName);
    return json;
}

Labels labelsOf(const Json& json) {
    return {textOf(json, "caption"), textOf(json, "description"), textOf(json, "elementName")};
}

Json written(const Filter& filter) {
    return written(Json{{"name", filter.name},
                        {"namespaces", filter.namespaces},
                        {"language", filter.language},
                        {"query", filter.query},
                        {"creator", filter.creator}},
                   filter.labels);
}

Filter filterIn(const Json& json) {
    Filter filter;
    filter.name = json.at("name");
    filter.namespaces = json.at("namespaces").get<std::vector<std::string>>();
    if (filter.namespaces.empty()) throw std::runtime_error("a filter looks in no namespace");
    filter.language = json.at("language");
    filter.query = json.at("query");
    filter.creator = textOf(json, "creator");
    filter.labels = labelsOf(json);
    return filter;
}

Json written(const Destination& destination) {
    return written(Json{{"class", destination.key.className},
                        {"name", destination.key.name},
                        {"url", destination.url},
                        {"persistence", destination.persistence},
                        {"creator", destination.creator},
                        {"address", destination.address}},
                   destination.labels);
}

Destination destinationIn(const Json& json) {
    Destination destination;
    destination.key = {json.at("class"), json.at("name")};
    destination.url = json.at("url");
    destination.persistence = json.at("persistence");
    destination.creator = textOf(json, "creator");
    destination.address = textOf(json, "address");
    destination.labels = labelsOf(json);
    return destination;
}

Json written(const Subscription& subscription) {
    Json json{{"filter", subscription.filter},
              {"class", subscription.destination.className},
              {"destination", subscription.destination.name},
              {"state", subscription.state},
              {"start", subscription.start},
              {"changed", subscription.changed},
              {"creator", subscription.creator}};
    if (subscription.duration) json["duration"] = *subscription.duration;
    put(json, "info", subscription.info);
    return json;
}

Subscription subscriptionIn(const Json& json) {
    Subscription subscription;
    subscription.filter = json.at("filter");
    subscription.destination = {json.at("class"), json.at("destination")};
    subscription.state = json.at("state");
    subscription.start = json.at("start");
    subscription.changed = json.at("changed");
    subscription.creator = textOf(json, "creator");
    subscription.info = textOf(json, "info");
    if (json.contains("duration")) subscription.duration = json["duration"].get<std::uint64_t>();
    return subscription;
}

template <class Record, class Read>
void readAll(const Json& list, std::vector<Record>& records, const Read& read) {
    for (const Json& each : list)
        records.push_back(read(each));
}

Records parsed(const std::string& text) {
    const Json json = Json::parse(text);
    const int version = json.at("version");
    if (version != kVersion) throw std::runtime_error("it is of version " + std::to_string(version));
    Records records;
    readAll(json.at("filters"), records.filters, filterIn);
    readAll(json.at("destinations"), records.destinations, destinationIn);
    readAll(json.at("subscriptions"), records.subscriptions, subscriptionIn);
    return records;
}

std::string folderOf(const std::string& path) {
    const std::size_t slash = path.rfind('/');
    return slash == std::string::npos ? "." : path.substr(0, slash + 1);
}

/// One that is free, or that the file has already.
std::string nameForCopy(const std::string& path) {
    constexpr int kMost = 9;
    for (int i = 1; i <= kMost; ++i) {
        std::string name = path + ".broken" + (i == 1 ? "" : "." + std::to_string(i));
        if (!fs::exists(name) || fs::equivalent(name, path)) return name;
    }
    throw std::runtime_error(path + ".broken and eight more are there already; remove them");
}

}  // namespace

Records StateFile::read() {
    if (m_path.empty()) return {};
    try {
        const auto text = os::readTextFile(m_path);
        if (!text) return {};
        try {
            return parsed(*text);
        } catch (const std::bad_alloc&) {
            throw;
        } catch (const std::exception& error) {
            const std::string aside = nameForCopy(m_path);
            fs::rename(m_path, aside);
            QUENX_ERROR("The subscriptions in %s cannot be read: %s. They are in %s now, and there are none",
                        m_path.c_str(), error.what(), aside.c_str());
        }
    } catch (const std::exception& error) {
        m_obstacle = m_path + " cannot be read, and so is not written over: " + error.what();
        QUENX_ERROR("%s. There are no subscriptions", m_obstacle.c_str());
    }
    return {};
}

void StateFile::keepCopy() {
    try {
        const std::string copy = nameForCopy(m_path);
        // Writing puts another file in its place, so this name keeps what it has now.
        if (!fs::exists(copy)) fs::create_hard_link(m_path, copy);
        QUENX_ERROR("What is passed over stays in %s", copy.c_str());
    } catch (const std::exception& error) {
        m_obstacle = m_path + " holds what is passed over, and no copy can be made: " + error.what();
        QUENX_ERROR("%s. Subscriptions cannot be changed", m_obstacle.c_str());
    }
}

void StateFile::write(const Records& records) {
    if (m_path.empty()) return;
    try {
        if (!m_obstacle.empty()) throw std::runtime_error(m_obstacle);
        Json json{{"version", kVersion},
                  {"filters", Json::array()},
                  {"destinations", Json::array()},
                  {"subscriptions", Json::array()}};
        for (const Filter& each : records.filters)
            if (!each.isStatic) json["filters"].push_back(written(each));
        for (const Destination& each : records.destinations)
            json["destinations"].push_back(written(each));
        for (const Subscription& each : records.subscriptions)
            json["subscriptions"].push_back(written(each));
        const std::string text = json.dump(1) + '\n';
        if (text.size() > kLargest) {
            throw core::CimError(core::CimStatus::ServerLimitsExceeded,
                                 "the subscriptions take more than 1 MiB together");
        }
        const std::string folder = folderOf(m_path);
        ::mkdir(folder.c_str(), S_IRWXU);  // where it is missing; what follows tells of a failure
        os::replaceFile(m_path, text, S_IRUSR | S_IWUSR);
        os::syncFolder(folder);
    } catch (const core::CimError&) {
        throw;
    } catch (const std::exception& error) {
        QUENX_ERROR("A change of the subscriptions could not be kept: %s", error.what());
        throw core::CimError(core::CimStatus::Failed,
                             std::string("the change could not be kept: ") + error.what());
    }
}

}  // namespace indications
