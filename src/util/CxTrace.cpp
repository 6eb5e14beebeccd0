// An indented trace on the standard error stream, for debugging the library itself. Nothing calls
// it in normal operation.
#include <qlx/system.h>

#include <atomic>
#include <cstdio>

static constexpr int32_t kIndentStep = 3;  // blanks

// Blanks before a line. Threads share it, so that lines of several indent each other.
static std::atomic<int32_t> indentation;

static void changeIndentation(int32_t blanks) {
  indentation.fetch_add(blanks, std::memory_order_relaxed);
}

static void printLine(const char *word, const char *format, va_list args) {
  for (int32_t i = indentation.load(std::memory_order_relaxed); i > 0; --i) fputc(' ', stderr);
  fputs(word, stderr);
  vfprintf(stderr, format, args);
  fflush(stderr);
}

void cxIntlTraceEnter(const char *format, ...) {
  if (!format) return;
  va_list args;
  va_start(args, format);
  printLine("ENTER ", format, args);
  va_end(args);
  changeIndentation(kIndentStep);
}

void cxIntlTraceLeave(const char *format, ...) {
  if (!format) return;
  changeIndentation(-kIndentStep);
  va_list args;
  va_start(args, format);
  printLine("LEAVE ", format, args);
  va_end(args);
}

void cxIntlTracePoint(const char *format, ...) {
  if (!format) return;
  va_list args;
  va_start(args, format);
  printLine("... ", format, args);
  va_end(args);
}
