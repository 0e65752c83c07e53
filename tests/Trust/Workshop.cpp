// SPDX-License-Identifier: Apache-2.0
#include "Trust/Workshop.h"

#include <gtest/gtest.h>

#include "Support/Program.h"

namespace test {

namespace {

constexpr const char* kAuthority = R"([ca]
default_ca = own
[own]
database = $ENV::FOLDER/index.txt
rand_serial = yes
new_certs_dir = $ENV::FOLDER
default_md = sha256
policy = any
[any]
commonName = supplied
)";

}  // namespace

Workshop::Workshop() {
    std::filesystem::create_directory(keys);
    const std::string content = "what is written to the flash";
    bytes.assign(content.begin(), content.end());
    folder.write("port.rom", content);
}

void Workshop::openssl(const Options& arguments) {
    Options command = {"/usr/bin/openssl"};
    command.insert(command.end(), arguments.begin(), arguments.end());
    const ProgramResult result = run(command);
    EXPECT_EQ(result.status, 0) << arguments.front() << ": " << result.error;
}

void Workshop::makeKey(const std::string& name, const std::string& kind) {
    const Options size = {"-pkeyopt", kind == "rsa" ? "rsa_keygen_bits:2048" : "ec_paramgen_curve:P-256"};
    openssl({"req", "-x509", "-newkey", kind, size[0], size[1], "-nodes", "-days", "30", "-subj",
             "/CN=" + name, "-keyout", folder / (name + ".key"), "-out", folder / (name + ".pem")});
}

void Workshop::makeOldKey(const std::string& name) {
    const std::string key = folder / (name + ".key");
    const std::string request = folder / (name + ".csr");
    openssl({"req", "-newkey", "ec", "-pkeyopt", "ec_paramgen_curve:P-256", "-nodes", "-subj", "/CN=" + name,
             "-keyout", key, "-out", request});
    folder.write("index.txt", "");
    const std::string settings = folder.write("authority.conf", kAuthority);
    const ProgramResult result =
        run({"/usr/bin/openssl", "ca", "-batch", "-notext", "-config", settings, "-selfsign", "-keyfile", key,
             "-in", request, "-startdate", "20200101000000Z", "-enddate", "20210101000000Z", "-out",
             folder / (name + ".pem")},
            {"FOLDER=" + folder.path()});
    EXPECT_EQ(result.status, 0) << result.error;
}

void Workshop::pin(const std::string& name) const {
    std::filesystem::copy_file(folder / (name + ".pem"), keys + "/" + name + ".pem");
}

std::string Workshop::sign(const std::string& path, const std::string& key, const Options& more) const {
    const std::string signature = path + ".p7s";
    Options command = {"cms",
                       "-sign",
                       "-binary",
                       "-outform",
                       "DER",
                       "-in",
                       path,
                       "-signer",
                       folder / (key + ".pem"),
                       "-inkey",
                       folder / (key + ".key"),
                       "-out",
                       signature};
    command.insert(command.end(), more.begin(), more.end());
    openssl(command);
    return signature;
}

void Workshop::writeManifest(const std::string& text, const std::string& key, const std::string& name) const {
    const std::string manifest = folder.write(name + ".manifest.toml", text);
    std::filesystem::rename(sign(manifest, key), folder / name + ".manifest.p7s");
}

core::TrustVerdict Workshop::judge(std::time_t (*clock)()) const {
    trust::Verifier verifier = clock == nullptr ? trust::Verifier() : trust::Verifier(clock);
    return verifier.verify({.path = image, .bytes = bytes, .keysFolder = keys, .pciIds = ids});
}

}  // namespace test
