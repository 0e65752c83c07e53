// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

#include "Utils/Export.h"

/// Who holds a lock, for those who do not get it. Any thread may call; what cannot be read is left out, and
/// nothing is an error.
namespace os {

/// This process, for a person who reads it in another one: "process 812 (quenxctl)".
QUENX_EXPORT std::string describeThisProcess();

/// What the holder of a lock leaves in its file for those who do not get it, "812 5173 pid:[4026531836]
/// quenxctl\n":
///   - its process id;
///   - the time of its start in ticks since the machine's, which tells it from another one of the same id;
///   - the pid namespace in which that id counts, as /proc names it;
///   - the name of its program, at most 15 visible characters, which may be missing.
/// Where /proc is not there, the id alone.
std::string lockNote();

/// Who holds the lock (flock) of an open file, for a person: "process 812 (quenxctl)", "process 812
/// (quenxctl) in another container", "a child that process 812 (quenxctl) left behind" or, where nothing
/// tells, "another process". The kernel's list is believed first, then the file's note as far as it still
/// fits: the time of a process's start, where it can be read, tells it from an earlier one of the same
/// number. A text for people, by which nothing is decided. Takes no rights but those to the file.
std::string describeLockHolder(int file);

}  // namespace os
