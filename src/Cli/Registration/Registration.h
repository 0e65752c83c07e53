// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "Framework/Requests/CimOperations.h"

/// What other object managers have to be told to serve the providers through libQuenx_Cmpi.so. All of it is
/// made from the declarations of the classes, so it cannot fall behind them.
namespace cli {

/// What the user asked for.
struct RegistrationOptions {
    std::string manager;                   ///< one of managerNames()
    std::vector<std::string> namespaces;   ///< to be served in; empty for the providers' own
    std::optional<std::string> directory;  ///< where the files go; nothing: they are only shown
    bool isRemoval = false;                ///< what undoes the registration
    bool withQualifiers = false;           ///< the MOF declares its qualifiers, too
};

struct RegistrationFile {
    std::string name;
    std::string text;
    /// Whether a text is an older one of this file, so may be replaced.
    bool (*isOlder)(const std::string& text);
};

struct Registration {
    std::vector<RegistrationFile> files;
    std::vector<std::string> nextSteps;  ///< what the administrator does with them, a line each
};

/// What an object manager can ask a provider for.
enum class ProviderType { Instance, Association, Method, Indication };

/// A class that is to be registered, and what it needs to be served with.
struct RegisteredClass {
    std::string name;
    std::vector<ProviderType> types;
};

/// What there is to register, whatever the object manager.
struct Registered {
    std::vector<RegisteredClass> classes;      ///< in the order of the MOF
    std::vector<RegisteredClass> indications;  ///< the standard's, which tell of instances of the others
    std::vector<std::string> namespaces;       ///< at least one
    RegistrationFile mof;                      ///< the declarations of those classes
};

/// As the entry points of the library have it in front of _Create_.
inline constexpr const char* kProviderName = "Quenx";
/// The library, without "lib" and ".so".
inline constexpr const char* kProviderLibrary = "Quenx_Cmpi";

Registration sfcbRegistration(const Registered& registered);
Registration sfcbRemoval(const Registered& registered);
Registration pegasusRegistration(const Registered& registered);
Registration pegasusRemoval(const Registered& registered);

/// The first line of a file with such comments, by which isWrittenHere() knows it again.
/// @param comment  what begins a comment there
std::string headLine(const std::string& comment, const std::string& what);
bool isWrittenHere(const std::string& text);

/// What the options ask for, of the classes that are not the standard's. Throws CommandError for an unknown
/// object manager, and for a namespace that none could be.
Registration registrationFor(const RegistrationOptions& options, core::CimOperations& operations);

/// Writes the files into the folder, each in one step, and only where that changes something. If one of them
/// would replace what is not an older one of it, none is written.
/// @return the names of those that were written
/// @throws CommandError where there is no such folder, or where it or a file in it cannot be used
std::vector<std::string> writeFiles(const std::string& directory, const std::vector<RegistrationFile>& files);

}  // namespace cli
