// SPDX-License-Identifier: MIT
// scripts/vorn-sandbox: what the command sees, and that nothing outlives it.
#include <gtest/gtest.h>
#include <signal.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <sstream>

#include "bus_harness.h"
#include "temp_dir.h"

using namespace harness;
namespace fs = std::filesystem;

namespace {

std::map<std::string, std::string> readReport(const fs::path& path) {
  std::map<std::string, std::string> out;
  std::ifstream in(path);
  std::string line;
  while (std::getline(in, line)) {
    auto eq = line.find('=');
    if (eq != std::string::npos) out[line.substr(0, eq)] = line.substr(eq + 1);
  }
  return out;
}

bool alive(const std::string& pid) { return !pid.empty() && kill(std::stoi(pid), 0) == 0; }

}  // namespace

class Sandbox : public ::testing::Test {
 protected:
  void SetUp() override {
    if (geteuid() != 0) GTEST_SKIP() << "the sandbox's daemons must own their names, which only root may";
  }
  /// Runs the sandbox with `script` as the command; its exit status.
  std::optional<int> run(const std::vector<std::string>& options, const std::string& script) {
    std::vector<std::string> argv = {VORN_SANDBOX_PATH, "--build", VORN_BUILD_DIR};
    argv.insert(argv.end(), options.begin(), options.end());
    argv.insert(argv.end(), {"--", "/bin/sh", "-c", script});
    if (!sandbox.start(argv, {"REPORT=" + (out.path() / "report").string()})) return std::nullopt;
    return sandbox.waitExit(60s);
  }
  std::map<std::string, std::string> report() const { return readReport(out.path() / "report"); }

  TempDir out;
  Process sandbox;
};

// The command writes what it saw; the test checks it after the sandbox is gone.
constexpr const char* kReport = R"sh(
  test -n "$VORN_ROOT" || exit 90
  {
    echo "root=$VORN_ROOT"
    echo "vornd=$VORN_SANDBOX_VORND_PID"
    echo "helper=$VORN_SANDBOX_HELPER_PID"
    echo "telhub=$(pgrep -x Telhub | head -n 1)"
    echo "build=$VORN_SANDBOX_BUILD"
    echo "conf=$VORN_SANDBOX_BUS_CONF"
    echo "vendor=$(grep '^vendor=' "$VORN_ROOT/etc/vorn/device.conf")"
    echo "extra=$(grep '^extra=' "$VORN_ROOT/etc/vorn/device.conf")"
    echo "props=$(tr '\n' ' ' < "$VORN_ROOT/var/lib/vorn/trace.properties")"
    echo "journal=$(ls "$VORN_ROOT"/var/log/journal/*/*.journal | wc -l)"
    echo "server_on_path=$(command -v vornd)"
    echo "hello=$(busctl --system call org.vorn.Manager /org/vorn/Manager org.vorn.Manager1 Hello s t)"
    echo "helper_call=$(busctl --system call org.vorn.Helper /org/vorn/Helper org.vorn.Helper1 Perform 'susa{sv}' t 4 DiagsnapStatus 0)"
  } > "$REPORT"
)sh";

TEST_F(Sandbox, GivesTheCommandARunningEnvironmentAndRemovesIt) {
  auto status = run({"--device", "vendor=1", "--device", "extra=yes"}, std::string(kReport) + "exit 7\n");
  ASSERT_EQ(status, 7);  // the command's own status
  auto seen = report();
  ASSERT_FALSE(seen["root"].empty());
  EXPECT_EQ(seen["vendor"], "vendor=1");
  EXPECT_EQ(seen["extra"], "extra=yes");
  EXPECT_EQ(seen["props"], "Baseband.Enabled=1 SystemLogs.Mode=1 ");
  EXPECT_EQ(seen["journal"], "1");
  EXPECT_EQ(seen["build"], fs::canonical(VORN_BUILD_DIR).string());
  EXPECT_EQ(seen["conf"], fs::path(VORN_SANDBOX_PATH).parent_path().parent_path() / "server/dbus/private-bus.conf");
  EXPECT_EQ(seen["server_on_path"], seen["build"] + "/server/vornd");
  EXPECT_EQ(seen["hello"], "a{sv} 1 \"ServerState\" s \"Started\"");
  // No snapshot yet: the helper answers, with the collection-failed status.
  EXPECT_EQ(seen["helper_call"], "isa{sv} -534773758 \"no baseband snapshot\" 0");

  for (const char* key : {"vornd", "helper", "telhub"}) {
    ASSERT_FALSE(seen[key].empty()) << key;
    EXPECT_FALSE(alive(seen[key])) << key << " outlived the sandbox";
  }
  EXPECT_FALSE(fs::exists(seen["root"]));
}

TEST_F(Sandbox, StartsOnlyWhatIsAsked) {
  auto status = run({"--no-vornd", "--no-helper", "--no-telhub"}, kReport);
  ASSERT_EQ(status, 0);
  auto seen = report();
  EXPECT_EQ(seen["vornd"], "");
  EXPECT_EQ(seen["helper"], "");
  EXPECT_EQ(seen["telhub"], "");
  EXPECT_EQ(seen["hello"], "");  // busctl failed: no owner
}

TEST_F(Sandbox, TearsDownWhenItIsTerminated) {
  const fs::path ready = out.path() / "ready";
  std::vector<std::string> argv = {VORN_SANDBOX_PATH, "--build", VORN_BUILD_DIR, "--",
                                   "/bin/sh", "-c", std::string(kReport) + "touch \"$READY\"; exec sleep 60"};
  ASSERT_TRUE(sandbox.start(argv, {"REPORT=" + (out.path() / "report").string(), "READY=" + ready.string()}));
  auto deadline = Clock::now() + 30s;
  while (!fs::exists(ready) && Clock::now() < deadline && !sandbox.waitExit(20ms)) {
  }
  ASSERT_TRUE(fs::exists(ready));
  auto seen = report();
  ASSERT_TRUE(alive(seen["vornd"]));
  sandbox.signal(SIGTERM);
  EXPECT_EQ(sandbox.waitExit(20s), 143);
  for (const char* key : {"vornd", "helper", "telhub"}) EXPECT_FALSE(alive(seen[key])) << key;
  EXPECT_FALSE(fs::exists(seen["root"]));
}
