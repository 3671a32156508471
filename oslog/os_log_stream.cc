// SPDX-License-Identifier: MIT
#include "oslog/os_log_stream.h"

#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <memory>

#include "oslog/export_file.h"
#include "oslog/line_formatter.h"
#include "platform/logstore/system_log.h"
#include "platform/linux/errno_text.h"

namespace {

[[gnu::format(printf, 1, 2)]] void logError(const char* format, ...) {
  if (!logstore::systemLogErrorEnabled()) return;
  char text[1024];
  va_list args;
  va_start(args, format);
  std::vsnprintf(text, sizeof text, format, args);
  va_end(args);
  logstore::systemLogError(text);
}

/// What the event handler owns. Only the stream's thread touches it while
/// the stream runs; the caller closes the file once the stream has stopped.
struct ExportState {
  oslog::ExportFile file;
  oslog::LineFormatter formatter;
  oslog::ExportObserver* observer = nullptr;
  std::uint64_t lines = 0;
};

}  // namespace

bool OsLogStream::putOsLogStreamToFile(const std::string& path, const std::vector<std::string>& processes,
                                       const std::vector<std::string>& imagePaths, double history) {
  auto store = logstore::localStore();
  return putOsLogStreamToFile(*store, path, processes, imagePaths, history);
}

bool OsLogStream::putOsLogStreamToFile(const std::string& path, const std::vector<std::string>& processes,
                                       const std::vector<std::string>& imagePaths, double history,
                                       oslog::ExportObserver& observer) {
  auto store = logstore::localStore();
  return putOsLogStreamToFile(*store, path, processes, imagePaths, history, kStreamTimeout, &observer);
}

bool OsLogStream::putOsLogStreamToFile(logstore::Store& store, const std::string& path,
                                       const std::vector<std::string>& processes,
                                       const std::vector<std::string>& imagePaths, double history,
                                       std::chrono::nanoseconds timeout,
                                       oslog::ExportObserver* observer) {
  std::unique_ptr<logstore::Stream> stream;
  logstore::Prepared prepared = store.prepare();
  if (prepared.source)
    stream = prepared.source->makeStream();
  else
    logError("Could not open: %s", prepared.error.c_str());
  if (!stream) {
    logError("Failed to prepare oslog stream");
    return false;
  }

  auto state = std::make_shared<ExportState>();
  state->observer = observer;
  if (!state->file.create(path)) {
    logError("Failed to create file: %s", path.c_str());
    return false;
  }

  // Making a group cannot fail here, so "Failed to get group" has no path.
  dispatch::group group;

  stream->setFlags(logstore::kStreamOptionsStoredThenEnd);
  logstore::Predicate predicate(processes, imagePaths);
  if (!predicate.empty()) stream->setFilterPredicate(std::move(predicate));

  stream->setEventHandler([state](const logstore::Event& event) {
    if (event.type != logstore::kEventTypeLogMessage) return;
    state->formatter.append(event, state->file.buffer());
    state->file.lineAdded();
    if (++state->lines % oslog::ExportObserver::kLinesPerReport == 0 && state->observer)
      state->observer->linesWritten(state->lines);
  });
  stream->setInvalidationHandler([state, group](std::uint64_t reason) {
    state->file.flush();
    if (state->observer) state->observer->linesWritten(state->lines);
    if (reason != logstore::kReasonEnded) logError("Invalid oslog stream: reason = %lu", static_cast<unsigned long>(reason));
    group.leave();
  });

  const auto start = logstore::Clock::now() -
                     std::chrono::duration_cast<logstore::Clock::duration>(std::chrono::duration<double>(history));

  group.enter();
  logError("Getting oslog stream: history = %f", history);
  if (observer) observer->started();
  stream->activateStreamFromDate(start);

  const bool ended = group.wait(timeout);
  if (!ended) {
    stream->invalidate();
    logError("Timeout on getting oslog stream");
  }
  // invalidate() has stopped the stream's thread, so the file is ours again.
  const bool written = state->file.close();
  if (!written)
    logError("Failed to write file: %s (%s)", path.c_str(),
             vorn::errnoText(state->file.writeError()).c_str());
  stream.reset();
  if (observer) observer->finished();
  return ended && written;
}
