// SPDX-License-Identifier: Apache-2.0
// The parts of what the daemon serves beside CIM-XML: heads of requests, answers, the folder with images.
#include <gmock/gmock.h>

#include <filesystem>
#include <nlohmann/json.hpp>

#include "Control/Sha256.h"
#include "Framework/Model/CimError.h"
#include "Host/Control/Control.h"
#include "Host/Control/ControlAnswer.h"
#include "Support/TempFolder.h"
#include "Utils/Os/Linux/OwnFiles.h"
#include "Utils/Utils.h"

namespace {

namespace fs = std::filesystem;
using ::testing::HasSubstr;
using ::testing::ThrowsMessage;

TEST(ControlHeadTest, IsRefusedByItsFault) {
    // Of a right request for a check, with a body as large as may be, in which something is changed.
    const auto answer = [](auto change) {
        host::HttpHead head;
        head.method = "POST";
        head.path = control::kCheck;
        head.contentType = "application/json";
        head.contentLengths = {"65536"};
        change(head);
        return host::Control::checkHead(head).value_or(host::HttpAnswer::plain(0));
    };
    const auto status = [&](auto change) { return answer(change).status; };
    EXPECT_EQ(status([](auto&) {}), 0U);
    EXPECT_EQ(status([](auto& head) { head.path += "s"; }), 404U);
    EXPECT_EQ(status([](auto& head) { head.method = "PUT"; }), 405U);
    EXPECT_EQ(status([](auto& head) { head.isAmbiguous = true; }), 400U);
    EXPECT_EQ(status([](auto& head) { head.isChunked = true; }), 411U);
    EXPECT_EQ(status([](auto& head) { head.contentLengths.clear(); }), 411U);
    EXPECT_EQ(status([](auto& head) { head.contentLengths = {"x"}; }), 400U);
    EXPECT_EQ(status([](auto& head) { head.contentLengths = {"65537"}; }), 413U);
    EXPECT_EQ(status([](auto& head) { head.contentType = "text/plain"; }), 415U);
    EXPECT_THAT(answer([](auto& head) { head.method = "PUT"; }).headers,
                ::testing::ElementsAre(std::pair("Quenx-Interface", "1"), std::pair("Allow", "POST")));
}

TEST(ControlAnswerTest, SaysWhatIsWrong) {
    const auto status = [](const std::exception& error) { return host::controlAnswer(error).status; };
    EXPECT_EQ(status(host::ControlRefusal(409, "x")), 409U);
    EXPECT_EQ(status(nlohmann::json::other_error::create(501, "x", nullptr)), 400U);
    EXPECT_EQ(status(core::CimError(core::CimStatus::AccessDenied, "x")), 403U);
    EXPECT_EQ(status(core::CimError(core::CimStatus::Failed, "x")), 500U);
    const host::HttpAnswer answer = host::controlAnswer(std::runtime_error("\xC3\xBC\xFF"));
    EXPECT_EQ(answer.status, 500U);
    EXPECT_EQ(utils::joined(answer.body, ""), "{\"error\":\"\\u00fc\\ufffd\"}\n");
    EXPECT_EQ(answer.headers.front(),
              std::pair(std::string("Content-Type"), std::string("application/json")));
}

class SpoolTest : public ::testing::Test {
  protected:
    static std::string sumOf(const std::string& bytes) {
        control::Sha256 hash;
        hash.add(bytes.data(), bytes.size());
        return hash.take();
    }
    /// The refusal of a file, or of its bytes: "STATUS TEXT".
    std::string refusal(const std::string& place, const std::string& sum, std::uint64_t size) {
        try {
            m_spool.begin(place, size, sum)->finish();
        } catch (const host::ControlRefusal& error) {
            return std::to_string(error.status()) + " " + error.what();
        }
        return "";
    }
    void store(const std::string& bytes, const std::string& name = "/new.rom") {
        const auto upload = m_spool.begin(sumOf(bytes) + name, bytes.size(), sumOf(bytes));
        upload->add(bytes.data(), bytes.size());
        EXPECT_EQ(fs::file_size(upload->finish()), bytes.size());
    }
    bool has(const std::string& bytes) const { return fs::exists(m_images + "/" + sumOf(bytes)); }

    const test::TempFolder m_folder;
    const std::string m_images = m_folder / "images";
    host::Spool m_spool{{.directory = m_images, .imageBytes = 8, .totalBytes = 10}};
    const std::string m_sum = sumOf("x");
};

TEST_F(SpoolTest, RemovesWhatAKilledDaemonHasLeftOfAnUpload) {
    const test::TempFolder& folder = m_folder;
    EXPECT_FALSE(fs::exists(m_images)) << "nothing is made before the first upload";
    for (const char* name : {"images", "images/a"})
        fs::create_directory(folder / name);
    folder.write("images/.part-x", "half");
    folder.write("images/a/new.rom", "whole");
    const host::UploadSettings settings{.directory = folder / "images"};
    EXPECT_THAT([&] { const host::Spool spool(settings); },
                ThrowsMessage<std::runtime_error>(HasSubstr("run: chmod 700 " + settings.directory)))
        << "others may need it as it is";
    fs::permissions(settings.directory, fs::perms(0700));
    os::makeOwnFolder(folder / "named/with/");
    EXPECT_EQ(fs::status(folder / "named/with").permissions(), fs::perms(0700));
    const host::Spool spool(settings);
    EXPECT_FALSE(fs::exists(folder / "images/.part-x"));
    EXPECT_TRUE(fs::exists(folder / "images/a/new.rom"));
}

TEST_F(SpoolTest, TakesWhatHasANameASumAndRoom) {
    const std::string badName =
        "\" cannot be the name of an image; take at most 100 letters, digits, spaces and "
        "._+-@,~ that do not begin with a dot or a dash, and no slash";
    const std::string cutOff = "400 the file was cut off after 0 of 8 bytes; send it again";
    const std::string longest(100, 'a');
    for (const std::string& name : {longest, std::string("0 Z._+-@,~")})
        EXPECT_EQ(refusal(m_sum + "/" + name, m_sum, 8), cutOff) << name;
    for (const std::string& name : {longest + "a", std::string(), std::string(".a"), std::string("-a"),
                                    std::string("\xC3\xBC"), std::string("a/b")})
        EXPECT_EQ(refusal(m_sum + "/" + name, m_sum, 8), "400 \"" + name + badName);
    for (const std::string& place : {m_sum, m_sum.substr(1) + "/a", "a" + m_sum + "/a"})
        EXPECT_EQ(refusal(place, m_sum, 8),
                  "400 an image is sent to the SHA-256 of its bytes, a slash and its name");
    EXPECT_EQ(refusal(m_sum + "/a", "x", 8),
              "400 the header Quenx-SHA256 has to hold the SHA-256 of the file, 64 lower-case digits");
    EXPECT_EQ(refusal(m_sum + "/a.p7s", sumOf("y"), 8), cutOff) << "what belongs to an image has its own";
    EXPECT_EQ(refusal(m_sum + "/a", sumOf("y"), 8),
              "400 an image is sent to the SHA-256 of its bytes, which is not the one in the path");
    EXPECT_EQ(refusal(m_sum + "/a", m_sum, 0), "400 the file is empty; send a complete image");
    EXPECT_EQ(refusal(m_sum + "/a", m_sum, 9),
              "413 the file has 9 bytes, more than the 8 that uploads.image_bytes allows");
    const auto other = m_spool.begin(m_sum + "/a", 2, m_sum);
    EXPECT_EQ(std::distance(fs::directory_iterator(m_images), {}), 1) << "nowhere else";
    EXPECT_EQ(refusal(m_sum + "/b", m_sum, 8), cutOff);
    other->add("xy", 2);
    EXPECT_THAT([&] { other->finish(); },
                ThrowsMessage<host::ControlRefusal>(HasSubstr("its SHA-256 is " + sumOf("xy"))));
    const auto more = m_spool.begin(m_sum + "/c", 1, m_sum);
    EXPECT_EQ(refusal(m_sum + "/b", m_sum, 8),
              "507 other uploads that are under way need the room: "
              "uploads.total_bytes is 10; try again when they are done");
    EXPECT_THAT([] { host::Spool({.directory = ""}).begin("", 1, ""); },
                ThrowsMessage<host::ControlRefusal>(HasSubstr("this server takes no images; set ")));
    fs::remove_all(m_images);
    m_folder.write("images", "a file");
    EXPECT_EQ(refusal(m_sum + "/a", m_sum, 1),
              "500 the file cannot be stored below " + m_images + ": Not a directory");
}

TEST_F(SpoolTest, MakesRoomByNoMoreThanTheOldest) {
    for (const char* bytes : {"aaaa", "bbb", "ccc", "ccc"})
        store(bytes);
    EXPECT_TRUE(has("aaaa") && has("bbb") && has("ccc"))
        << "they fill it, and the same once more takes no room";
    int age = 3;
    for (const char* bytes : {"aaaa", "bbb", "ccc"})
        fs::last_write_time(m_images + "/" + sumOf(bytes),
                            fs::file_time_type::clock::now() - std::chrono::hours(age--));
    // A companion of the oldest leaves that where it is.
    const auto signature = m_spool.begin(sumOf("aaaa") + "/new.rom.p7s", 1, m_sum);
    signature->add("x", 1);
    signature->finish();
    EXPECT_TRUE(has("aaaa") && has("ccc"));
    EXPECT_FALSE(has("bbb")) << "the oldest of the others";
    for (int i = 2; i < 256; ++i)
        fs::create_directory(m_images + "/" + sumOf(std::to_string(i)));
    store("d");
    EXPECT_FALSE(has("ccc")) << "one too many";
    EXPECT_TRUE(has("aaaa") && has("d") && has("2") && has("255"));
}

}  // namespace
