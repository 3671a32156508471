// SPDX-License-Identifier: MIT
#pragma once

#include <iostream>
#include <sstream>
#include <string>

/// Swaps std::cin, std::cout and std::cerr for string streams while alive.
class StdioCapture {
 public:
  explicit StdioCapture(std::string input = {}) : in_(std::move(input)) {
    oldIn_ = std::cin.rdbuf(in_.rdbuf());
    oldOut_ = std::cout.rdbuf(out_.rdbuf());
    oldErr_ = std::cerr.rdbuf(err_.rdbuf());
    std::cin.clear();
  }
  ~StdioCapture() {
    std::cin.rdbuf(oldIn_);
    std::cout.rdbuf(oldOut_);
    std::cerr.rdbuf(oldErr_);
    std::cin.clear();
  }
  std::string out() const { return out_.str(); }
  std::string err() const { return err_.str(); }

 private:
  std::istringstream in_;
  std::ostringstream out_, err_;
  std::streambuf* oldIn_;
  std::streambuf* oldOut_;
  std::streambuf* oldErr_;
};
