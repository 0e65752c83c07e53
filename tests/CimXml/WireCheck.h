// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <set>
#include <string>

namespace test {

/// A file of tests/CimXml/samples: requests as clients sent them ("w-": one that sends no types, "p-": one
/// that does).
std::string readSample(const std::string& name);
/// Those of a folder below, with the folder in front.
std::set<std::string> sampleNames(const std::string& folder = "");

/// The message with a line for each element, as samples of it are kept.
std::string linesOf(const std::string& message);

/// What is wrong with a message, by the document type in cimxml.dtd and by what common clients cannot read;
/// empty when nothing is.
std::string faultsOf(const std::string& message);

}  // namespace test
