// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <set>
#include <string>

namespace test {

/// A file of tests/CimXml/samples: requests as clients sent them ("w-": one that sends no types, "p-": one
/// that does).
std::string readSample(const std::string& name);
std::set<std::string> sampleNames();

/// What is wrong with a message, by the document type in cimxml.dtd and by what common clients cannot read;
/// empty when nothing is.
std::string faultsOf(const std::string& message);

}  // namespace test
