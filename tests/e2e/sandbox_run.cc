// SPDX-License-Identifier: MIT
#include "sandbox_run.h"

#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>

namespace {

std::string slurp(const std::filesystem::path& path) {
  std::ifstream in(path, std::ios::binary);
  std::ostringstream text;
  text << in.rdbuf();
  return text.str();
}

}  // namespace

std::string quoted(const std::string& word) {
  std::string q = "'";
  for (char c : word) q += c == '\'' ? std::string("'\\''") : std::string(1, c);
  return q + "'";
}

SandboxResult runInSandbox(const std::vector<std::string>& sandboxOptions, const std::string& script) {
  namespace fs = std::filesystem;
  char pattern[] = "/tmp/vorn-e2e.XXXXXX";
  const fs::path dir = mkdtemp(pattern);
  std::ofstream(dir / "script.sh") << script;

  std::string command = quoted(VORN_SOURCE_DIR "/scripts/vorn-sandbox") + " --build " +
                        quoted(VORN_BUILD_DIR);
  for (const auto& option : sandboxOptions) command += " " + quoted(option);
  command += " -- bash " + quoted(dir / "script.sh");
  // A hung tool must fail the test, not the whole run.
  command = "timeout -k 5 120 " + command + " </dev/null >" + quoted(dir / "out") + " 2>" + quoted(dir / "err");

  SandboxResult result;
  const int raw = std::system(command.c_str());
  if (raw != -1 && WIFEXITED(raw)) result.status = WEXITSTATUS(raw);
  result.out = slurp(dir / "out");
  result.err = slurp(dir / "err");
  fs::remove_all(dir);
  return result;
}
