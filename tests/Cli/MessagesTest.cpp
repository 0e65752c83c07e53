// SPDX-License-Identifier: Apache-2.0
#include <gtest/gtest.h>

#include <cerrno>
#include <sstream>

#include "Cli/Display/Messages.h"
#include "Cli/Display/Records.h"

namespace {

using cli::didYouMean;

TEST(MessagesTest, GuessesTheWordThatWasMeantWhereThereIsOne) {
    const std::vector<std::string> known = {"adapters", "activate", "identities", "jobs", "Install"};
    const std::pair<std::string, std::string> table[] = {
        {"adapter", "adapters"},    // a letter is missing
        {"adaptersx", "adapters"},  // one too many
        {"adopters", "adapters"},   // another one
        {"adatpers", "adapters"},   // two swapped
        {"ADAPTERS", "adapters"},
        {"install", "Install"},
        {"jbos", "jobs"},
        {"ojbs", "jobs"},
        {"jo", ""},                  // half of it
        {"dentitie", "identities"},  // 2 of 8
        {"entitie", ""},             // 3 of 7
        {"entities", "identities"},
        {"", ""},
    };
    for (const auto& [word, meant] : table)
        EXPECT_EQ(didYouMean(word, known), meant.empty() ? "" : "Did you mean " + meant + "? ") << word;
    EXPECT_EQ(didYouMean("eth", {"eth0", "eth1"}), "") << "one as near as the other";
    EXPECT_EQ(didYouMean("eth", {"eth0", "eth1", "Eth"}), "Did you mean Eth? ");
    EXPECT_EQ(didYouMean("x", {"y"}), "Did you mean y? ");
    EXPECT_EQ(didYouMean("x", {}), "");
    EXPECT_EQ(didYouMean("abcd", {"badc"}), "") << "two swaps";
    EXPECT_EQ(didYouMean(std::string(64, 'x'), {std::string(63, 'x')}),
              "Did you mean " + std::string(63, 'x') + "? ");
    EXPECT_EQ(didYouMean(std::string(65, 'x'), {std::string(64, 'x')}), "");
}

TEST(MessagesTest, MakesSentencesOfWhatServicesSay) {
    const std::pair<const char*, const char*> table[] = {
        {"", "The service gave no reason."},
        {"the file is gone", "The file is gone."},
        {"gone", "Gone."},
        {"zero bytes", "Zero bytes."},
        {"Gone!", "Gone!"},
        {"why?", "Why?"},
        {"a.b is missing.", "a.b is missing."},
        {"key=value is wrong", "key=value is wrong."},
        {"file:///x is missing", "file:///x is missing."},
        {"{x", "{x."},
        {"`x", "`x."},
    };
    for (const auto& [text, expected] : table)
        EXPECT_EQ(cli::sentence(text), expected);
}

TEST(MessagesTest, SaysWhyAFileIsNotRead) {
    const std::tuple<int, const char*, cli::ExitStatus> table[] = {
        {ENOENT, "No such file or directory. Check the path.", cli::ExitStatus::NotFound},
        {ENOTDIR, "Not a directory. Check the path.", cli::ExitStatus::NotFound},
        {ENAMETOOLONG, "File name too long. Check the path.", cli::ExitStatus::NotFound},
        {EACCES, "Permission denied. Check its permissions.", cli::ExitStatus::Failed},
        {EPERM, "Operation not permitted. Check its permissions.", cli::ExitStatus::Failed},
        {EIO, "Input/output error. Check the file and the disk that it is on.", cli::ExitStatus::Failed},
    };
    for (const auto& [error, said, status] : table) {
        const cli::Explanation explanation = cli::cannotRead("a.rom", error);
        EXPECT_EQ(explanation.message + " " + explanation.advice, std::string("Cannot read a.rom: ") + said);
        EXPECT_EQ(explanation.status, status);
    }
}

TEST(MessagesTest, ColoursWhatAnErrorBeginsWithAndItsAdvice) {
    std::ostringstream plain;
    cli::printFailure(plain, "It\x1B failed.", "");
    EXPECT_EQ(plain.str(), "quenxctl: It\\x1b failed.\n");
    std::ostringstream out;
    cli::allowColours(out, {.canRewrite = true});
    cli::printFailure(out, "It failed.", "Try again.");
    for (const cli::Look look : {cli::Look::Success, cli::Look::Heading, cli::Look::Plain})
        out << cli::coloured(out, look, "x") << cli::coloured(out, look, "");
    EXPECT_EQ(
        out.str(),
        "\x1B[31mquenxctl:\x1B[0m It failed.\n\x1B[2mTry again.\x1B[0m\n\x1B[32mx\x1B[0m\x1B[1mx\x1B[0mx");
    cli::allowColours(out, {});
    EXPECT_EQ(cli::coloured(out, cli::Look::Failure, "x"), "x");
}

TEST(RecordsTest, WritesEveryFieldIntoJson) {
    history::Record record{.id = 1,
                           .begun = 1'700'000'000'123'456,
                           .ended = 1,
                           .active = 2'000'000,
                           .duration = 3,
                           .outcome = "written",
                           .returnValue = 4,
                           .errorCode = 5,
                           .reason = "r",
                           .reasonId = "QX",
                           .percent = 6,
                           .user = "u",
                           .address = "a",
                           .front = "f",
                           .process = 7,
                           .owner = "o",
                           .boot = "b",
                           .host = "h",
                           .target = "t",
                           .adapter = "ad",
                           .backend = "ba",
                           .pciAddress = "p",
                           .serial = "s",
                           .uri = "uri",
                           .sha256 = "sha",
                           .signedBy = "key",
                           .bytes = 8,
                           .imageVersions = "iv",
                           .types = "ty",
                           .options = "op",
                           .optionValues = "ov",
                           .versionsBefore = "vb",
                           .versionsAfter = "va",
                           .job = "j"};
    EXPECT_EQ(
        cli::Json(record).dump(),
        R"({"id":1,"begun":"2023-11-14T22:13:20.123456Z","ended":"1970-01-01T00:00:00.000001Z",)"
        R"("durationMicroseconds":3,"outcome":"written","active":"1970-01-01T00:00:02.000000Z",)"
        R"("percentComplete":6,"returnValue":4,"errorCode":5,"reason":"r","reasonId":"QX","user":"u",)"
        R"("address":"a","front":"f","process":7,"boot":"b","host":"h","target":"t","adapter":"ad",)"
        R"("backend":"ba","pciAddress":"p","serialNumber":"s","uri":"uri","sha256":"sha","signedBy":"key",)"
        R"("bytes":8,"imageVersions":"iv","types":"ty","options":"op","optionValues":"ov",)"
        R"("versionsBefore":"vb","versionsAfter":"va","job":"j"})");
    EXPECT_EQ(cli::outcomeText(record), "active");
    record = {};
    record.outcome = "failed";
    EXPECT_EQ(cli::outcomeText(record), "failed");
    const cli::Json json = record;
    EXPECT_TRUE(json.dump().starts_with(
        R"({"id":0,"begun":"1970-01-01T00:00:00.000000Z","ended":null,"durationMicroseconds":null,"outcome":"failed","active":null,)"));
    for (const auto& [name, value] : json.items())
        EXPECT_TRUE(value.is_null() || name == "id" || name == "begun" || name == "outcome") << name;
}

}  // namespace
