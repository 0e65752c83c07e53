// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/SMASHv2Config.h"

#include <filesystem>
#include <fstream>
#include <locale>
#include <sstream>
#include <string_view>
#include <utility>

#include "Utils/Log.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

const char* const SMASHv2_BASE_REG_PATH = "SOFTWARE\\TARVEL\\Network_Services\\SMASHv2";
const char* const SMASHv2_NAMESPACE_KEY = "Namespace";
const char* const SMASHv2_DEFAUL_NAMESPACE = "root/cimv2";
const char* const SMASHv2_SEMAPHORE_TIMEOUT_KEY = "Timeout";
const char* const VANTEX_REG_PATH = "SOFTWARE\\TARVEL\\Network_Services\\RVC3";
const char* const SMASHv2_CUSTOMIZATION_KEY = "OEMCustomizeable";
const char* const SMASHv2_FWFILE_PATH_KEY = "FWFilePath";
const std::int32_t m_OEMCustomizationValues[1] = {5};

namespace utils {

template class Singleton<SMASHv2Config>;
template class AutoSingleton<SMASHv2Config>;

namespace {

constexpr const char* kConfigurationFile = "/etc/quenx-cimprovider.conf";
constexpr const char* kReleaseClaimKey = "ReleaseClaimAfterCheck";
constexpr const char* kImageReadTimeoutKey = "ImageReadTimeout";
constexpr std::uint32_t kMaxImageReadTimeout = 86400;
constexpr const char* kLargestImageKey = "LargestImage";
constexpr std::string_view kRootNamespace = "root";
// The lines of a reading pass name the operation as a whole.
constexpr const char* kReadingFunction = "initialize";

bool isSkipped(const std::string& line) {
    const std::size_t begin = line.find_first_not_of(" \t");
    return begin == std::string::npos || line[begin] == '#';
}

/// Hands each key to `take`, with the words that follow it. A file that cannot be read any further has ended;
/// what else goes wrong is thrown.
template <class Take>
void readSettings(const std::string& path, Take take) {
    // To open a pipe would wait for somebody to write into it, and a device may never end.
    std::error_code error;
    if (!std::filesystem::is_regular_file(path, error)) return;
    std::ifstream file(path);
    // A stream keeps exceptions to itself unless asked, and without memory the rest would go missing unsaid.
    file.exceptions(std::ios::badbit);
    try {
        // Editors of other systems put a byte order mark in front, which is no part of the first key.
        if (std::string mark(3, '\0'); !file.read(mark.data(), 3) || mark != "\xEF\xBB\xBF") {
            file.clear();
            file.seekg(0);
        }
        for (std::string line; std::getline(file, line);) {
            if (isSkipped(line)) continue;
            // Everywhere, values included: so "Key=value" and "Key = value" read alike.
            replaceCharacter(line, '=', ' ');
            std::istringstream words(line);
            words.exceptions(std::ios::badbit);
            // A host may have set a locale in which "1.000" is a number.
            words.imbue(std::locale::classic());
            std::string key;
            words >> key;
            take(key, words);
        }
    } catch (const std::ios::failure&) {
        // A medium that fails: as good as no file.
    }
}

/// Appends the directories of a list separated by ';' that exist.
void addDirectories(const std::string& list, StringArray& directories) {
    for (const std::string& item : split(list, ';')) {
        std::string path(trimOf(item, " "));
        if (!path.empty() && path.back() == '/') path.pop_back();
        if (!os::isThisADir(path)) continue;
        formatDebugLog(__FILE__, kReadingFunction, __LINE__, "Adding path-> %s", path.c_str());
        directories.push_back(std::move(path));
    }
}

}  // namespace

SMASHv2Config::SMASHv2Config(std::string path)
    : m_path(std::move(path)), m_namespace(SMASHv2_DEFAUL_NAMESPACE) {}

SMASHv2Config::~SMASHv2Config() = default;

std::unique_ptr<SMASHv2Config> SMASHv2Config::CreateSingleton() {
    return std::make_unique<SMASHv2Config>(kConfigurationFile);
}

std::string SMASHv2Config::getNamespace() {
    initialize();
    Mutex::AutoLocker locker(m_mutex);
    return m_namespace;
}

std::uint32_t SMASHv2Config::getLockerTimeout() {
    initialize();
    Mutex::AutoLocker locker(m_mutex);
    return m_lockerTimeout;
}

bool SMASHv2Config::isDowngradeEnabled() {
    initialize();
    Mutex::AutoLocker locker(m_mutex);
    // Never cleared: a ban that an edit of the file could lift would not be one.
    for (const std::int32_t value : m_OEMCustomizationValues) {
        if (m_oemCustomization == value) m_downgradeBlocked = true;
    }
    return !m_downgradeBlocked;
}

StringArray SMASHv2Config::getFirmwareFilesPaths() {
    initialize();
    Mutex::AutoLocker locker(m_mutex);
    return m_firmwarePaths;
}

bool SMASHv2Config::getReleaseClaimAfterCheck() {
    return readOwnSettings().releaseClaimAfterCheck;
}

ImageLimits SMASHv2Config::getImageLimits() {
    return readOwnSettings().imageLimits;
}

void SMASHv2Config::setDefaultImageReadTimeout(std::chrono::seconds silence) {
    const Mutex::AutoLocker locker(m_ownMutex);
    m_own.imageLimits.silence = silence;
}

void SMASHv2Config::setUploadDirectory(std::string path) {
    const Mutex::AutoLocker locker(m_ownMutex);
    m_uploadDirectory = std::move(path);
}

std::string SMASHv2Config::getUploadDirectory() {
    const Mutex::AutoLocker locker(m_ownMutex);
    return m_uploadDirectory;
}

void SMASHv2Config::initialize() {
    Mutex::AutoLocker locker(m_mutex);
    try {
        // Built apart and put in place at the end: a pass that fails leaves the old list whole.
        StringArray directories;
        readSettings(m_path, [&](const std::string& key, std::istream& words)
                                 QUENX_NO_THREAD_SAFETY_ANALYSIS { takeSetting(key, words, directories); });
        m_firmwarePaths = std::move(directories);
    } catch (...) {
        QUENX_ERROR(" Reading configuration values from the config file - failed");
    }
}

void SMASHv2Config::takeSetting(const std::string& key, std::istream& words, StringArray& directories) {
    std::string word;
    if (key == SMASHv2_FWFILE_PATH_KEY) {
        std::getline(words, word);
        addDirectories(word, directories);
    } else if (key == SMASHv2_CUSTOMIZATION_KEY) {
        std::uint16_t value = 0;
        if (!(words >> value)) return;
        m_oemCustomization = value;
        formatDebugLog(__FILE__, kReadingFunction, __LINE__, "Read OEMCustomizeable : %d", value);
    } else if (key == SMASHv2_NAMESPACE_KEY) {
        words >> word;
        if (!word.starts_with(kRootNamespace)) return;
        m_namespace = std::move(word);
        formatDebugLog(__FILE__, kReadingFunction, __LINE__, "Read NameSpace : %s", m_namespace.c_str());
    } else if (key == SMASHv2_SEMAPHORE_TIMEOUT_KEY) {
        words >> word;
        toUint(word, m_lockerTimeout);
        // Also after a refusal, with the value that stands.
        formatDebugLog(__FILE__, kReadingFunction, __LINE__, "Read LockerTimeout : %d",
                       static_cast<std::int32_t>(m_lockerTimeout));
    }
}

SMASHv2Config::OwnSettings SMASHv2Config::readOwnSettings() {
    Mutex::AutoLocker locker(m_ownMutex);
    try {
        readSettings(m_path,
                     [&](const std::string& key, std::istream& words) QUENX_NO_THREAD_SAFETY_ANALYSIS {
                         std::string word;
                         words >> word;
                         takeOwnSetting(key, word);
                     });
    } catch (...) {
        QUENX_ERROR("%s cannot be read for want of memory; the settings of before stay", m_path.c_str());
    }
    return m_own;
}

void SMASHv2Config::takeOwnSetting(const std::string& key, const std::string& word) {
    std::uint32_t seconds = 0;
    if (key == kReleaseClaimKey && (word == "0" || word == "1")) {
        m_own.releaseClaimAfterCheck = word == "1";
    } else if (key == kImageReadTimeoutKey && toUint(word, seconds) && seconds != 0 &&
               seconds <= kMaxImageReadTimeout) {
        m_own.imageLimits.silence = std::chrono::seconds(seconds);
    } else if (key == kLargestImageKey) {
        toUint(word, m_own.imageLimits.largest);
    }
}

}  // namespace utils
