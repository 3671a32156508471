// SPDX-License-Identifier: MIT
#include <iostream>

#include "framework/line_reader.h"

bool PlainLineReader::readLine(const std::string& prompt, std::string& line) {
  std::cout << prompt << std::flush;
  return static_cast<bool>(std::getline(std::cin, line));
}
