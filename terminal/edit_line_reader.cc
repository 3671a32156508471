// SPDX-License-Identifier: MIT
#include "terminal/edit_line_reader.h"

#include <histedit.h>
#include <stdlib.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <string_view>

#include "terminal/completion_display.h"

namespace terminal {

namespace {
constexpr std::size_t kDefaultWidth = 80;

bool isBlank(const std::string& line) {
  return line.find_first_not_of(" \t\n\v\f\r") == std::string::npos;
}
}  // namespace

void EditLineReader::EditorDeleter::operator()(editline* editor) const { el_end(editor); }
void EditLineReader::HistoryDeleter::operator()(History* list) const { history_end(list); }

EditLineReader::EditLineReader(Options options) : options_(std::move(options)) {}

EditLineReader::~EditLineReader() {
  // The editor restores the terminal's modes before the output goes away.
  editor_.reset();
  if (options_.closeOutput && options_.output) std::fclose(options_.output);
}

void EditLineReader::start() {
  started_ = true;
  editor_.reset(el_init(options_.programName.c_str(), options_.input, options_.output, stderr));
  if (!editor_) return;
  EditLine* editor = editor_.get();
  el_set(editor, EL_CLIENTDATA, this);
  el_set(editor, EL_PROMPT, &EditLineReader::promptOf);
  el_set(editor, EL_EDITOR, "emacs");
  // Restores the terminal when a signal ends the process mid-line, and
  // follows changes of the window's size.
  el_set(editor, EL_SIGNAL, 1);
  el_set(editor, EL_ADDFN, "vorn-complete", "Complete the word at the cursor",
         &EditLineReader::completeKey);
  el_set(editor, EL_BIND, "^I", "vorn-complete", nullptr);
  el_set(editor, EL_BIND, "^R", "em-inc-search-prev", nullptr);

  history_.reset(history_init());
  if (history_) {
    HistEvent event;
    ::history(history_.get(), &event, H_SETSIZE, options_.historySize);
    ::history(history_.get(), &event, H_SETUNIQUE, 1);
    if (options_.history) {
      if (options_.history->createFolder)
        makePrivateFolder(options_.history->file.parent_path());
      // A missing file is a first session, not an error.
      ::history(history_.get(), &event, H_LOAD, options_.history->file.c_str());
    }
    el_set(editor, EL_HIST, ::history, history_.get());
  }
  // The user's ~/.editrc comes last, so that its bindings win.
  el_source(editor, nullptr);
}

bool EditLineReader::readLine(const std::string& prompt, std::string& line) {
  if (!started_) start();
  if (!editor_) return fallback_.readLine(prompt, line);
  prompt_ = prompt;
  int count = 0;
  const char* text = el_gets(editor_.get(), &count);
  if (!text || count <= 0) {
    // End of input leaves the cursor after the prompt; the next output of
    // whoever started us belongs on a line of its own.
    std::fputs("\n", options_.output);
    std::fflush(options_.output);
    return false;
  }
  line.assign(text, static_cast<std::size_t>(count));
  if (!line.empty() && line.back() == '\n') line.pop_back();
  remember(line);
  return true;
}

void EditLineReader::remember(const std::string& line) {
  if (!history_ || isBlank(line)) return;
  HistEvent event;
  ::history(history_.get(), &event, H_ENTER, line.c_str());
  // Saved at every line: the session ends with exit(), never returning here.
  saveHistory();
}

void EditLineReader::saveHistory() {
  if (!options_.history) return;
  // Written beside the file and renamed over it, so that a reader never sees
  // half a history and the file is created private.
  std::string temporary = options_.history->file.string() + ".XXXXXX";
  const int fd = mkstemp(temporary.data());
  if (fd < 0) return;
  FILE* file = fdopen(fd, "w");
  if (!file) {
    close(fd);
    unlink(temporary.c_str());
    return;
  }
  HistEvent event;
  const bool written = ::history(history_.get(), &event, H_SAVE_FP, file) >= 0;
  const bool closed = std::fclose(file) == 0;
  if (!written || !closed || std::rename(temporary.c_str(), options_.history->file.c_str()) != 0)
    unlink(temporary.c_str());
}

std::size_t EditLineReader::width() const {
  winsize size{};
  if (ioctl(fileno(options_.output), TIOCGWINSZ, &size) == 0 && size.ws_col > 0) return size.ws_col;
  return kDefaultWidth;
}

unsigned char EditLineReader::complete() {
  if (!completer_) return CC_ERROR;
  const LineInfo* info = el_line(editor_.get());
  const Completions completions =
      completer_(std::string_view(info->buffer, static_cast<std::size_t>(info->cursor - info->buffer)));
  const CompletionStep step = planCompletion(completions);
  if (!step.insert.empty()) {
    if (el_insertstr(editor_.get(), step.insert.c_str()) != 0) return CC_ERROR;
    return CC_REFRESH;
  }
  if (!step.list) return CC_ERROR;
  const std::string listing = "\n" + formatColumns(listedNames(completions), width());
  std::fputs(listing.c_str(), options_.output);
  return CC_REDISPLAY;
}

char* EditLineReader::promptOf(EditLine* editor) {
  void* self = nullptr;
  el_get(editor, EL_CLIENTDATA, &self);
  return static_cast<EditLineReader*>(self)->prompt_.data();
}

unsigned char EditLineReader::completeKey(EditLine* editor, int) {
  void* self = nullptr;
  el_get(editor, EL_CLIENTDATA, &self);
  return static_cast<EditLineReader*>(self)->complete();
}

}  // namespace terminal
