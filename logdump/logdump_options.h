// SPDX-License-Identifier: MIT
#pragma once

#include <cstdint>
#include <list>
#include <string>

/// How the server packs a collection; sent as a 64-bit integer.
enum CompressionMode : std::int32_t {
  None = 0,
  TarGz = 1,
  Tar = 2,
};

/// Reads option words from the back of `args` until the first word that is
/// not an option, which becomes the reason; what follows it stays in `args`.
void parseLogdumpOptions(std::list<std::string>& args, CompressionMode& compression,
                         std::string& reason, bool& noUserConfirmation);

/// A trace mode as a number: named modes, or a whole 32-bit integer in
/// decimal, octal ("0…") or hexadecimal ("0x…"). `valid` is false otherwise.
int parseTraceMode(const std::string& text, bool& valid);

/// Snapshot folder + "log-bb-" + timestamp + archive extension, or
/// `directorySuffix` when the collection is not an archive.
std::string getLogArchivePath(const std::string& timestamp, CompressionMode compression,
                              const std::string& directorySuffix);
