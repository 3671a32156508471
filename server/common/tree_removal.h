// SPDX-License-Identifier: MIT
#pragma once

#include <string>

/// Removal by descriptor, never following a link: what is removed is what
/// lies in the folder, whatever its entries point to.
namespace vorn::server {

/// Removes `name` in the folder `dirFd`: a file or link by unlinking it, a
/// folder with everything in it. False when something could not be removed.
bool removeEntryAt(int dirFd, const std::string& name);

/// Removes the `.*.partial` entries that an earlier, interrupted run left
/// in the folder `dirFd`. False when some could not be removed.
bool removePartialLeftovers(int dirFd);

/// True for the hidden working names of collections (".*.partial").
bool isPartialName(const std::string& name);

}  // namespace vorn::server
