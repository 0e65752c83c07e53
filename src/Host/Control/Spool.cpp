// SPDX-License-Identifier: Apache-2.0
#include "Host/Control/Spool.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <span>
#include <system_error>
#include <vector>

#include "Control/Interface.h"
#include "Host/Control/ControlAnswer.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/OwnFiles.h"
#include "Utils/Utils.h"

namespace host {

namespace {

namespace fs = std::filesystem;

constexpr const char* kPart = ".part-";

[[noreturn]] void refuseStoring(int error, const std::string& folder) {
    constexpr std::array kNoRoom{ENOSPC, EDQUOT, EFBIG};
    if (std::ranges::find(kNoRoom, error) != kNoRoom.end())
        throw ControlRefusal(507, "there is no room for the file below " + folder + " (" +
                                      std::generic_category().message(error) +
                                      "); nothing was changed; free some space there and try again");
    throw ControlRefusal(
        500, "the file cannot be stored below " + folder + ": " + std::generic_category().message(error));
}

/// What it may be called: something that every program shows as it is, and none takes for an option, a hidden
/// file or another folder.
bool isFileName(std::string_view name) {
    constexpr std::size_t kLongest = 100;
    constexpr std::string_view kMarks = "._+-@,~ ";
    return !name.empty() && name.size() <= kLongest && name.front() != '.' && name.front() != '-' &&
           std::ranges::all_of(name, [&](char c) {
               return utils::isLetter(c) || utils::isDigit(c) || kMarks.find(c) != std::string_view::npos;
           });
}

void requirePlace(const std::string& place) {
    const std::size_t slash = place.find('/');
    if (slash == std::string::npos || !control::isSha256(place.substr(0, slash)))
        throw ControlRefusal(400, "an image is sent to the SHA-256 of its bytes, a slash and its name");
    if (!isFileName(place.substr(slash + 1)))
        throw ControlRefusal(
            400, "\"" + place.substr(slash + 1) +
                     "\" cannot be the name of an image; take at most 100 letters, digits, spaces "
                     "and ._+-@,~ that do not begin with a dot or a dash, and no slash");
}

std::string imageOf(const std::string& place) {
    return place.substr(0, control::Sha256::kDigits);
}

bool isCompanion(const std::string& place) {
    return std::ranges::any_of(control::kCompanions,
                               [&](std::string_view ending) { return place.ends_with(ending); });
}

void makeFolder(const std::string& folder) {
    try {
        os::makeOwnFolder(folder);
    } catch (const std::system_error& error) {
        refuseStoring(error.code().value(), folder);
    } catch (const std::runtime_error& error) {
        throw ControlRefusal(500, std::string("the file cannot be stored: ") + error.what());
    }
}

/// An image with what belongs to it.
struct Stored {
    fs::path folder;
    fs::file_time_type time;
    std::uint64_t bytes = 0;
};

/// The oldest first.
std::vector<Stored> storedIn(const std::string& directory) {
    std::vector<Stored> found;
    std::error_code error;  // what has gone meanwhile counts nothing
    for (const auto& folder : fs::directory_iterator(directory, error)) {
        if (!control::isSha256(folder.path().filename().string())) continue;
        Stored stored{folder.path(), folder.last_write_time(error)};
        for (const auto& file : fs::directory_iterator(folder.path(), error)) {
            const std::uintmax_t size = file.file_size(error);
            if (!error) stored.bytes += size;
        }
        found.push_back(std::move(stored));
    }
    std::ranges::sort(found, {}, &Stored::time);
    return found;
}

}  // namespace

namespace {

/// With a whole path, since it goes into URIs.
UploadSettings placed(UploadSettings settings) {
    if (!settings.directory.empty()) settings.directory = fs::absolute(settings.directory).string();
    return settings;
}

}  // namespace

Spool::Spool(const UploadSettings& settings) : m_settings(placed(settings)) {
    if (folder().empty() || !fs::exists(fs::symlink_status(folder()))) return;
    os::makeOwnFolder(folder());
    for (const auto& entry : fs::directory_iterator(folder())) {
        if (!entry.path().filename().string().starts_with(kPart)) continue;
        std::error_code error;
        fs::remove(entry.path(), error);
    }
}

void Spool::reserve(std::uint64_t size, const std::string& place) {
    std::uint64_t needed = m_reserved + size;
    for (const Stored& each : storedIn(m_settings.directory))
        if (each.folder.filename() == imageOf(place)) needed += each.bytes;
    if (needed > m_settings.totalBytes + replacedBy(size, place))
        throw ControlRefusal(507, "other uploads that are under way need the room: uploads.total_bytes is " +
                                      std::to_string(m_settings.totalBytes) +
                                      "; try again when they are done");
    m_reserved += size;
}

std::uint64_t Spool::replacedBy(std::uint64_t size, const std::string& place) const {
    // The same file once more takes the place of the one that is there.
    std::error_code isNew;
    const std::uintmax_t replaced = fs::file_size(m_settings.directory + "/" + place, isNew);
    return isNew ? 0 : std::min<std::uintmax_t>(replaced, size);
}

void Spool::makeRoom(std::uint64_t size, const std::string& place) {
    const std::vector<Stored> stored = storedIn(m_settings.directory);
    std::uint64_t used = m_reserved;
    for (const Stored& each : stored)
        used += each.bytes;
    used -= replacedBy(size, place);
    std::size_t count = stored.size();
    for (const Stored& oldest : stored) {
        if (used <= m_settings.totalBytes && count < kMostImages) break;
        if (oldest.folder.filename() == imageOf(place)) continue;
        std::error_code error;
        fs::remove_all(oldest.folder, error);
        if (error) continue;
        QUENX_DEBUG("removed the uploaded image %s to make room",
                    utils::escapeForFormat(oldest.folder.string()).c_str());
        used -= oldest.bytes;
        --count;
    }
}

void Spool::giveBack(std::uint64_t size) {
    const utils::Mutex::AutoLocker lock(m_mutex);
    m_reserved -= size;
}

std::unique_ptr<Upload> Spool::begin(const std::string& place, std::uint64_t size, const std::string& sum) {
    if (m_settings.directory.empty())
        throw ControlRefusal(501,
                             "this server takes no images; set uploads.directory, or copy the image there");
    requirePlace(place);
    if (!control::isSha256(sum))
        throw ControlRefusal(400, std::string("the header ") + control::kSumHeader +
                                      " has to hold the SHA-256 of the file, 64 lower-case digits");
    // Else somebody could have another image installed than the one that its URI names.
    if (sum != imageOf(place) && !isCompanion(place))
        throw ControlRefusal(
            400, "an image is sent to the SHA-256 of its bytes, which is not the one in the path");
    if (size == 0) throw ControlRefusal(400, "the file is empty; send a complete image");
    if (size > m_settings.imageBytes)
        throw ControlRefusal(413, "the file has " + std::to_string(size) + " bytes, more than the " +
                                      std::to_string(m_settings.imageBytes) +
                                      " that uploads.image_bytes allows");
    makeFolder(m_settings.directory);
    {
        const utils::Mutex::AutoLocker lock(m_mutex);
        reserve(size, place);
    }
    std::unique_ptr<Upload> upload;
    try {
        upload = std::make_unique<Upload>(*this, place, size, sum);
    } catch (...) {
        giveBack(size);
        throw;
    }
    // Not before the disk has taken this one: nothing goes for a file that is refused.
    const utils::Mutex::AutoLocker lock(m_mutex);
    makeRoom(size, place);
    return upload;
}

namespace {

int makePart(std::string& path, const std::string& folder, std::uint64_t size) {
    const int file = ::mkostemp(path.data(), O_CLOEXEC);
    if (file < 0) refuseStoring(errno, folder);
    // At once, so that a client learns of a full disk before it sends a quarter of a gigabyte.
    const int error = ::posix_fallocate(file, 0, static_cast<off_t>(size));
    if (error == 0) return file;
    ::close(file);
    ::unlink(path.c_str());
    refuseStoring(error, folder);
}

}  // namespace

Upload::Upload(Spool& spool, std::string place, std::uint64_t size, std::string sum)
    : m_spool(spool),
      m_place(std::move(place)),
      m_size(size),
      m_sum(std::move(sum)),
      m_part(spool.folder() + "/" + kPart + "XXXXXX"),
      m_file(makePart(m_part, spool.folder(), size)) {}

Upload::~Upload() {
    if (!m_part.empty()) ::unlink(m_part.c_str());
    m_spool.giveBack(m_size);
}

void Upload::add(const char* bytes, std::size_t size) {
    try {
        os::writeAll(m_file.number(), {reinterpret_cast<const std::uint8_t*>(bytes), size}, "cannot write");
    } catch (const std::system_error& error) {
        refuseStoring(error.code().value(), m_spool.folder());
    }
    m_hash.add(bytes, size);
    m_got += size;
}

std::string Upload::finish() {
    if (m_got != m_size)
        throw ControlRefusal(400, "the file was cut off after " + std::to_string(m_got) + " of " +
                                      std::to_string(m_size) + " bytes; send it again");
    const std::string sum = m_hash.take();
    if (sum != m_sum)
        throw ControlRefusal(422, "the file did not arrive as it was sent: its SHA-256 is " + sum + ", not " +
                                      m_sum + "; send it again");
    const std::string path = m_spool.folder() + "/" + m_place;
    const std::string folder = path.substr(0, path.rfind('/'));
    if (::fsync(m_file.number()) != 0) refuseStoring(errno, m_spool.folder());
    {
        // Not while another upload looks for the oldest, which an empty folder would be.
        const utils::Mutex::AutoLocker lock(m_spool.m_mutex);
        if (::mkdir(folder.c_str(), S_IRWXU) != 0 && errno != EEXIST) refuseStoring(errno, m_spool.folder());
        if (::rename(m_part.c_str(), path.c_str()) != 0) refuseStoring(errno, m_spool.folder());
    }
    m_part.clear();
    os::syncFolder(folder);
    os::syncFolder(m_spool.folder());
    return path;
}

}  // namespace host
