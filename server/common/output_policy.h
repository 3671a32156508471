// SPDX-License-Identifier: MIT
#pragma once

#include <sys/stat.h>
#include <sys/types.h>

#include <optional>
#include <string>

/// How open the daemon's outputs may be. Collections copy logs that only
/// root may read, so nothing they make is wider than its source: archives
/// 0640, folders 0750, files the source's mode within 0640. The group
/// `vorn` (the callers the bus policy admits) gets read access when the
/// system has it.
namespace vorn::server {

inline constexpr mode_t kArchiveMode = 0640;
inline constexpr mode_t kFolderMode = 0750;

/// Permission bits of a copy of a file with mode `sourceMode`.
constexpr mode_t copiedFileMode(mode_t sourceMode) { return sourceMode & 0640; }

/// The group of the outputs: `vorn` when it exists.
std::optional<gid_t> outputGroup();

/// Gives the object behind `fd` the mode `mode` and, when there is one,
/// the group `group`. False with `error` set when either fails.
bool applyOutputPolicy(int fd, mode_t mode, std::optional<gid_t> group, const std::string& what,
                       std::string* error);

/// Gives the finished output `partialName` in the folder `dirFd` its name
/// `finalName`, never in place of something already there: a collection
/// that lost the race for its name fails rather than replace another one.
bool publishAt(int dirFd, const std::string& partialName, const std::string& finalName, std::string* error);

}  // namespace vorn::server
