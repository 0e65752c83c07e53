#pragma once

#include <string>

#include "Utils/Exception.h"

// The refusals of an update. Each message is the class's name, a colon and the text, with no blank between;
// the base puts its own prefix in front and logs the rest.

namespace utils {

class EInvalidParameter : public Exception {
  public:
    explicit EInvalidParameter(std::string message) : Exception("EInvalidParameter:" + message) {}
};

}  // namespace utils

/// The target adapter is already being updated.
class ETargetInUse : public utils::Exception {
  public:
    explicit ETargetInUse(std::string message) : Exception("ETargetInUse:" + message) {}
};

/// Another adapter is being updated.
class EJobIsRunning : public utils::Exception {
  public:
    explicit EJobIsRunning(std::string message) : Exception("EJobIsRunning:" + message) {}
};

class EInvalidUri : public utils::Exception {
  public:
    explicit EInvalidUri(std::string message) : Exception("EInvalidUri:" + message) {}
};

/// The file that the URI names cannot be opened.
class EUriDoesNotExist : public utils::Exception {
  public:
    explicit EUriDoesNotExist(std::string message) : Exception("EUriDoesNotExist:" + message) {}
};

class EImageReadError : public utils::Exception {
  public:
    explicit EImageReadError(std::string message) : Exception("EImageReadError:" + message) {}
};

/// The image is for another adapter.
class EAdapterNotSupported : public utils::Exception {
  public:
    explicit EAdapterNotSupported(std::string message) : Exception("EAdapterNotSupported:" + message) {}
};

/// The image is a downgrade that neither the options nor the configuration permit.
class EDowngradeDetected : public utils::Exception {
  public:
    explicit EDowngradeDetected(std::string message) : Exception("EDowngradeDetected:" + message) {}
};

class ENotApplicableForTarget : public utils::Exception {
  public:
    explicit ENotApplicableForTarget(std::string message) : Exception("ENotApplicableForTarget:" + message) {}
};
