// SPDX-License-Identifier: MIT
#include "terminal/terminal_progress.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <cerrno>

#include "terminal/progress_text.h"

namespace terminal {

namespace {

constexpr std::string_view kClearLine = "\r\x1b[K";
constexpr std::size_t kDefaultWidth = 80;

void writeToStandardError(std::string_view bytes) {
  while (!bytes.empty()) {
    const ssize_t n = ::write(STDERR_FILENO, bytes.data(), bytes.size());
    if (n < 0 && errno == EINTR) continue;
    if (n <= 0) return;
    bytes.remove_prefix(static_cast<std::size_t>(n));
  }
}

std::size_t standardErrorWidth() {
  winsize size{};
  if (ioctl(STDERR_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_col > 0) return size.ws_col;
  return kDefaultWidth;
}

}  // namespace

TerminalProgress::TerminalProgress(Clock clock, Writer write, Width width, bool ticker)
    : clock_(std::move(clock)), write_(std::move(write)), width_(std::move(width)), ticker_(ticker) {}

TerminalProgress::~TerminalProgress() { end(); }

void TerminalProgress::begin(Activity activity) {
  std::lock_guard lock(mutex_);
  activity_ = activity;
  started_ = lastDrawn_ = clock_();
  count_.store(0, std::memory_order_relaxed);
  if (ticker_ && !thread_.joinable())
    thread_ = std::jthread([this](std::stop_token stop) { tickUntilStopped(std::move(stop)); });
}

void TerminalProgress::setCount(std::uint64_t count) {
  count_.store(count, std::memory_order_relaxed);
}

void TerminalProgress::end() {
  std::jthread thread;
  {
    std::lock_guard lock(mutex_);
    activity_.reset();
    if (drawn_) write_(kClearLine);
    drawn_ = false;
    thread = std::move(thread_);
  }
  // The thread is stopped and joined here, outside the lock it may be
  // waiting for; with no activity left it draws nothing more on its way out.
}

void TerminalProgress::tick() {
  std::lock_guard lock(mutex_);
  drawIfDue();
}

void TerminalProgress::drawIfDue() {
  if (!activity_) return;
  const auto now = clock_();
  if (now - lastDrawn_ < kInterval) return;
  // The last column stays free: a line that fills it would wrap on some
  // terminals, and the carriage return would no longer find its start.
  const std::size_t width = width_();
  if (width < 2) return;
  lastDrawn_ = now;
  const std::string text =
      fitColumns(progressText(*activity_, now - started_, count_.load(std::memory_order_relaxed), frame_++),
                 width - 1);
  write_(std::string(kClearLine) + text);
  drawn_ = true;
}

void TerminalProgress::tickUntilStopped(std::stop_token stop) {
  std::unique_lock lock(mutex_);
  while (!stop.stop_requested()) {
    wake_.wait_for(lock, stop, kInterval, [] { return false; });
    if (!stop.stop_requested()) drawIfDue();
  }
}

std::shared_ptr<Progress> openProgress(const Facts& facts, bool prompting) {
  if (!facts.errorIsTerminal || facts.dumb) return silentProgress();
  if (prompting && !facts.inputIsTerminal && facts.outputIsTerminal) return silentProgress();
  return std::make_shared<TerminalProgress>(std::chrono::steady_clock::now, writeToStandardError,
                                            standardErrorWidth, /* ticker= */ true);
}

}  // namespace terminal
