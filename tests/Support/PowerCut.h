#pragma once

#include <map>
#include <memory>
#include <string>
#include <vector>

#include "MidAPI/Simulator/FlashFiles.h"

namespace test {

/// What CutFiles throws where the power fails.
struct Cut {};

/// What may be on the medium after a cut: of the folder entries and of the contents that were not synced,
/// either all or none.
struct Medium {
    bool keepsEntries;
    bool keepsContents;
};
inline constexpr Medium MEDIA[] = {{true, true}, {false, false}, {true, false}, {false, true}};

/// Cuts the power at the k-th call, in the middle of it where it writes, and knows what had been synced until
/// then. Used by one thread at a time.
class CutFiles : public ma::FlashFiles {
  public:
    explicit CutFiles(int cutAt) : m_cutAt(cutAt) {}

    bool wasCut() const { return m_calls >= m_cutAt; }

    void makeFolder(const std::string& path) override;
    int create(const std::string& path) override;
    void write(int descriptor, std::span<const uint8_t> bytes) override;
    void sync(int descriptor) override;
    void rename(const std::string& from, const std::string& to) override;
    void syncFolder(const std::string& path) override;

    /// Makes the real files what the medium holds.
    void lose(const Medium& medium, const std::string& root) const;
    /// What is there already when the device is switched on is on the medium.
    void adopt(const std::string& root);

  private:
    struct Content {
        std::vector<uint8_t> now;
        std::vector<uint8_t> synced;
    };
    using Entries = std::map<std::string, std::shared_ptr<Content>>;

    void count() {
        if (++m_calls >= m_cutAt) throw Cut{};
    }

    const int m_cutAt;
    int m_calls = 0;
    Entries m_entries;
    Entries m_syncedEntries;
    std::map<int, std::shared_ptr<Content>> m_open;
};

}  // namespace test
