// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "MidAPI/Image/Bytes.h"

namespace test {

/// Makes firmware packages of DSP0267, with images of 16 bytes behind the header.
struct TestPackage {
    using Bytes = std::vector<std::uint8_t>;
    /// Of a device: types and values.
    using Descriptors = std::vector<std::pair<unsigned, unsigned>>;
    struct Image {
        unsigned identifier;
        std::string version;
    };

    unsigned revision = 1;
    std::vector<Descriptors> cards = {{{0x0000, 0x1af4}, {0x0100, 0x1041}}};
    std::string version = "2.0";               ///< the same for all cards
    std::vector<Image> images = {{1, "2.0"}};  ///< at most 8
    unsigned applicable = 1;                   ///< the bitmap of them, the same for all cards
    unsigned imageSize = 16;                   ///< as the header tells it

    static constexpr std::size_t kSizeField = 17;

    Bytes bytes() const {
        std::string header = identifier() + number(revision, 1) + number(0, 2) + std::string(13, '\0') +
                             number(8, 2) + text("package");
        header += number(cards.size(), 1);
        for (const Descriptors& card : cards)
            header += record(card);
        if (revision >= 2) header += number(1, 1) + number(4, 2) + number(0, 2);  // a downstream device
        header += number(images.size(), 2);
        std::string list = entries(0);
        list = entries(header.size() + list.size() + 4);
        header += list;
        Bytes file(header.begin(), header.end());
        file.resize(file.size() + 4 + images.size() * 16);
        ma::writeLe16(file, kSizeField, static_cast<std::uint16_t>(header.size() + 4));
        seal(file);
        return file;
    }

    /// Corrects the checksum after a change of the header.
    static void seal(Bytes& file) {
        const std::size_t checked = ma::readLe16(file, kSizeField) - 4U;
        ma::writeLe32(file, checked, ma::crc32(std::span(file).first(checked)));
    }

  private:
    static std::string number(std::size_t value, int length) {
        std::string bytes;
        for (int index = 0; index < length; ++index)
            bytes += static_cast<char>(value >> 8 * index & 0xFF);
        return bytes;
    }
    /// ASCII, with its type and length in front.
    static std::string text(const std::string& value) {
        return number(1, 1) + number(value.size(), 1) + value;
    }
    std::string identifier() const {
        static constexpr const char* kIdentifiers[] = {
            "\xF0\x18\x87\x8C\xCB\x7D\x49\x43\x98\x00\xA0\x2F\x05\x9A\xCA\x02",
            "\x12\x44\xD2\x64\x8D\x7D\x47\x18\xA0\x30\xFC\x8A\x56\x58\x7D\x5A",
            "\x31\x19\xCE\x2F\xE8\x0A\x4A\x99\xAF\x6D\x46\xF8\xB1\x21\xF6\xBF",
            "\x7B\x29\x1C\x99\x6D\xB6\x42\x08\x80\x1B\x02\x02\x6E\x46\x3C\x78"};
        return {kIdentifiers[revision - 1], 16};
    }
    std::string record(const Descriptors& card) const {
        std::string body = number(card.size(), 1) + number(0, 4) + number(1, 1) + number(version.size(), 1) +
                           number(0, 2) + number(applicable, 1) + version;
        for (const auto& [type, value] : card)
            body += number(type, 2) + number(2, 2) + number(value, 2);
        return number(body.size() + 2, 2) + body;
    }
    std::string entries(std::size_t firstImage) const {
        std::string list;
        for (const Image& image : images) {
            list += number(10, 2) + number(image.identifier, 2) + number(7, 4) + number(2, 2) + number(0, 2) +
                    number(firstImage, 4) + number(imageSize, 4) + text(image.version);
            if (revision >= 3) list += number(3, 4) + "abc";  // opaque data
            firstImage += 16;
        }
        return list;
    }
};

}  // namespace test
